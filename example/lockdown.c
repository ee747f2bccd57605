/*
 * The demo kiosk's session library, lockdown.so. A site's own would end the desktop session here;
 * this one only says that it was asked to.
 */
#include <stdbool.h>
#include <stdio.h>

/* True: the end of the session has been started, and velmora has nothing left to supervise. */
bool logoff(void);

bool logoff(void)
{
    puts("lockdown.so: the desktop session would end here.");
    return fflush(stdout) == 0;
}
