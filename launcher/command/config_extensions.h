// Configuration extensions: "-config <name>" adds the words that the launcher's properties keep
// under "config.<name>.1", "config.<name>.2", ... The command line's own words win.
#ifndef LAUNCHER_COMMAND_CONFIG_EXTENSIONS_H
#define LAUNCHER_COMMAND_CONFIG_EXTENSIONS_H

#include "launcher/properties/vmarg_map.h"
#include "platform/linux/argument_vector.h"

#include <string>

/// Merges the chosen extension into the arguments: sets `newArgv` to a new array of `newArgc`
/// words (released with delete[]; the words stay with argv and the list), and `args` to the same
/// words. "vmarg." words go into the map. With an extension, the second occurrence of each option
/// that must not stand twice is removed, and "-data" replaces "rcp.data" in `launcherProps`; the
/// words of the diagnostic marker file are added when an earlier call of this run found it. Without
/// an extension that file is looked for below `rcpHome`.
/// Fatal: QVMRL0033E, QVMRL0128E ("vmarg." without "=").
void addConfigExtentionsToArg(int& newArgc, wchar_t**& newArgv, int argc, wchar_t** argv,
                              PropertyList& launcherProps, ArgumentVector& args, VmargMap& vmargs,
                              const std::wstring& rcpHome);

/// Sets `restartExe` to "config.<name>.restartExe.linux" of the chosen extension, with its first
/// "${rcp.home}" replaced; leaves it as it is when there is none.
void getRestartExe(std::wstring& restartExe, int argc, wchar_t** argv,
                   const PropertyList& launcherProps, const std::wstring& rcpHome);

/// Removes the second occurrence of `option` from `args`; a third one survives. Only the option
/// word goes: its value stays behind. The two differ in their names alone.
void removeDuplicatePairs(ArgumentVector& args, const wchar_t* option);
void removeDuplicateSingles(ArgumentVector& args, const wchar_t* option);

#endif
