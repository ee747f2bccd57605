// Whether a process is the platform: it lives, and ps shows its name.
#ifndef PLATFORM_LINUX_PLATFORM_PROCESS_H
#define PLATFORM_LINUX_PLATFORM_PROCESS_H

#include <string>

/// True when the process `pid` lives and the shell finds `exeName`, a pattern for grep, in the
/// line that ps prints for it. False also when the shell or ps cannot be run, for a number that no
/// process has, without a name, and with one that the locale cannot convert. Where there is no
/// shell for want of memory or processes, it is asked for once more, a second later.
bool isPlatformAlive(long pid, const std::wstring& exeName);

#endif
