// Small questions about the running process and the system.
#ifndef PLATFORM_LINUX_PROCESS_H
#define PLATFORM_LINUX_PROCESS_H

#include <string>

/// How often findRCP looks through the processes.
extern const int MAX_RETRIES;

/// Opens /dev/null for each of the three standard descriptors that is closed, so that neither the
/// lock file nor the log can become the platform's standard output.
void openStandardDescriptors();

/// True when the real user is the administrator (user id 0). The argument is not used.
bool userIsAdmin(const wchar_t* ignored);

/// Sets `out` to the target of the symbolic link `link`. Fatal when it cannot be read or has 4096
/// bytes or more: "QVMRL0184E: Getting command path failed! errno = %d", with the reason.
void readsymln(std::string& out, const char* link);

/// Sets `out` to the absolute path of the running executable. Fatal: as readsymln.
void getLauncherPath(std::wstring& out, const wchar_t* ignored);

/// Stores in `dir` the directory of the running executable, without a "/" at its end, as a new
/// string that the caller owns. Fatal: as readsymln.
void findCommand(wchar_t*& dir, const wchar_t* ignored);

/// Whole seconds since the epoch.
int getTick();

/// Sleeps for so many seconds.
void sysSleep(int seconds);

/// The name of this system in keys of properties: "linux".
const wchar_t* getOS();

/// Copies `in` to `out` unchanged: on this system there is nothing to resolve.
void convert_from_relative_location(const wchar_t* in, std::wstring& out);

/// Makes "<dir>/rcp" the working directory. Fatal: "QVMRL0124E: Could not set working directory
/// to <path>: <reason>".
void setCurrentWorkingDir(const std::wstring& dir);

/// The number of the first process whose executable path ends in "/eclipse" and is longer than
/// that; 0 when MAX_RETRIES passes, a second apart, found none.
int findRCP();

#endif
