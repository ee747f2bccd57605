// The process environment in wide text. What is set here is what the child inherits.
#ifndef PLATFORM_LINUX_ENVIRONMENT_H
#define PLATFORM_LINUX_ENVIRONMENT_H

#include <string>

/// Sets `out` to the variable's value. True when the variable is set, even to nothing. Otherwise
/// `out` is empty and a trace line QVMRL0081I, with an empty line after it, names the variable.
bool getEnv(const wchar_t* name, std::wstring& out);

/// The value of HOME, empty when it is unset; returns the characters of `out`.
const wchar_t* getUserHome(std::wstring& out);

/// Front ends of setenv and unsetenv. True when the call FAILED. The log's times follow TZ at once.
bool setEnv(const wchar_t* name, const wchar_t* value, bool overwrite);
bool unsetEnv(const wchar_t* name);

#endif
