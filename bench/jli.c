/*
 * Stands in for the library through which a Java launcher starts the JVM: where the JVM would
 * begin, it tells when that was, and ends.
 */
#include "stamp.h"

int JLI_Launch(void);

int JLI_Launch(void)
{
    system_call(SYS_EXIT, put_stamp() < 0, 0, 0);
    return 1;
}
