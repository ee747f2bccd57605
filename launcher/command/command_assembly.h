// The order in which the groups of words become the command. The builders decide their own words
// and nothing else.
#ifndef LAUNCHER_COMMAND_COMMAND_ASSEMBLY_H
#define LAUNCHER_COMMAND_COMMAND_ASSEMBLY_H

#include "launcher/properties/vmarg_map.h"

#include <string>

/// Fills launchArgs and the environment of the child. Before that, resolves the placeholders of
/// `userProps`, of the words and of the map; in the main process does the cache maintenance and
/// records the start; on a new provisioning level empties "jvm.shareclasses.fullpath" (what could
/// not be removed is logged, QVMRL0086I and QVMRL0087I, and the start goes on).
/// `provisioning` asks for the command of a provisioning run, `userProvisioning` adds
/// "-userProvLaunch" to that. argv itself is left as it is. Fatal: the builders' ends, QVMRL0088E.
void getUserCmdString(const std::wstring& workspace, int argc, wchar_t** argv,
                      const std::wstring& installDir, PropertyList& userProps,
                      PropertyList& launcherProps, VmargMap& vmargs, bool provisioning,
                      bool userProvisioning);

#endif
