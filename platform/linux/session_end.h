// The end of the desktop session in the lockdown configuration, where the platform is the desktop.
//
// The site's library "./lockdown.so" (of the working directory) ends the session: it exports
// "logoff", a function without arguments that returns a bool, true when the end has begun.
#ifndef PLATFORM_LINUX_SESSION_END_H
#define PLATFORM_LINUX_SESSION_END_H

/// Where a shutdown, instead of a plain logoff, is asked for.
extern const char* const CMD_FILE;

/// Calls the library's "logoff" and returns its result. Without the library or the function the
/// GNOME session is killed and the process ends with status 1.
bool logoff();

/// Clears the umask, for good, writes the request record (512 bytes, mode 0666) to CMD_FILE and
/// returns logoff(). False when the file cannot be created.
bool shutdown();

#endif
