// The provisioning run: a start of the platform that installs or updates its contents for this
// user, before the platform itself is started.
#ifndef LAUNCHER_PROVISIONING_LAUNCH_H
#define LAUNCHER_PROVISIONING_LAUNCH_H

#include "launcher/properties/vmarg_map.h"

#include <string>
#include <vector>

/// When a provisioning run is due, makes it and ends the process with status 0; the platform is
/// not started by this launcher any more. Returns when none is due. It is due on a first launch,
/// on a new level, and for an installer; only with "provisioning" = "true" and in the user,
/// multiuser and lockdown configurations. Both lists are borrowed copies. Traces QVMRL0076I.
void checkForProvisioning(const std::wstring& workspace, int argc, wchar_t** argv,
                          const std::wstring& installDir, PropertyList userProps,
                          PropertyList launcherProps, std::vector<std::wstring>& launchArgs,
                          VmargMap& vmargs);

/// Runs the command as a child, records it in the lock file, and waits for it. Logs the command
/// whatever the user asked for. In a child that could not execute it, returns after a line
/// "Unable to execute <path> : <reason>".
void doProvisioning(const PropertyList& launcherProps, const PropertyList& userProps,
                    wchar_t* argv0, const std::vector<std::wstring>& launchArgs);

#endif
