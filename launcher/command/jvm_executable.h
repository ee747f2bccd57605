// Which executable of the JVM is started, and its words.
#ifndef LAUNCHER_COMMAND_JVM_EXECUTABLE_H
#define LAUNCHER_COMMAND_JVM_EXECUTABLE_H

#include "launcher/properties/property_list.h"

#include <string>

/// Emits the VM: as the program itself in the direct kind of command, as "-vm" and its path
/// otherwise; nothing when none is given. "-console" and "-consoleLog" take its console variant;
/// "java.exe.name.linux" and "javaw.exe.name.linux" rename it. "-velmoraWait" sets the wait mode.
/// True when the VM is a library (".ee", ".dll"), which is passed on as given.
/// Fatal: "QVMRL0002E: vm must be specified with -vm argument!", QVMRL0003E.
bool addVmToCommandLine(const PropertyList& props, const PropertyList& launcherProps, int argc,
                        wchar_t** argv);

/// When the path ends with `windowedName`, puts `consoleName` in its place and returns true.
/// Fatal, when that does not exist (a directory does):
/// "QVMRL0003E: Specified vm (%ls) does not exist!".
bool isJavaw(std::wstring& vmPath, const std::wstring& windowedName,
             const std::wstring& consoleName);

/// When the path ends with `oldName`, and with `newName` instead exists (as a directory may), takes
/// that and returns true.
bool replaceJavaExecutableName(std::wstring& vmPath, const std::wstring& oldName,
                               const std::wstring& newName);

#endif
