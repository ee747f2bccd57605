// The command that is being put together, and the form in which it is executed.
#ifndef LAUNCHER_COMMAND_LAUNCH_COMMAND_H
#define LAUNCHER_COMMAND_LAUNCH_COMMAND_H

#include <string>
#include <vector>

/// The command: the executable, then its words. Written by addPathToCommandLine and
/// addArgToCommandLine alone; read by startup, doProvisioning and launchEclipse.
extern std::vector<std::wstring> launchArgs;

/// This start is a restart by the platform. Written by main, before startup.
extern bool bRestart;

/// The command is that of a daemon process. Written by addArgToCommandLine.
extern bool bDaemon;

/// Begins a fresh command with the executable `path`; what was there before is dropped.
void addPathToCommandLine(const std::wstring& path);

/// Appends a word. On a restart "-debug" and "-console" are left out; "-useDaemon" sets bDaemon.
/// The second parameter is not used.
void addArgToCommandLine(const std::wstring& arg, bool ignored);

/// Exists and does nothing.
void setSemVersion(wchar_t* ignored);

/// A copy of `args` as execv takes it: bytes, with a null at the end. Logs each word, whatever the
/// user asked for, between the lines `begin` and `end`. Released with freeExecArguments.
char** newExecArguments(const std::vector<std::wstring>& args, const char* begin, const char* end);
void freeExecArguments(char** args);

#endif
