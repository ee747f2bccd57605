// When the contents of the platform must be provisioned or configured before it starts.
#ifndef LAUNCHER_USER_AREA_PROVISIONING_RULES_H
#define LAUNCHER_USER_AREA_PROVISIONING_RULES_H

#include "launcher/properties/property_list.h"
#include "launcher/properties/vmarg_map.h"

/// True when the user has no level, or one that is not exactly the launcher's; both may be null.
bool isNewProvisioningLevel(const wchar_t* userLevel, const wchar_t* launcherLevel);

/// True when the "config.initial." entries of the launcher's properties ask for a configuration
/// run that the user's properties do not yet show as complete. Both lists are borrowed copies.
/// Fatal: QVMRL0114E (a number is missing), QVMRL0115E (no "-initialCompleteFlag" with a word
/// behind it).
bool isInitialRequired(PropertyList launcherProps, PropertyList userProps);

/// Turns off the shared classes of the map for a provisioning run. Traces QVMRL0120I or QVMRL0121I.
void defeateSharedClassesInProvisioning(VmargMap& vmargs);

/// Ends an installer's start ("-provManifest") in a daemon process: "QVMRL0122E: Attempting to
/// install while process %ls is running.".
void validateInstallerState(int argc, wchar_t** argv);

#endif
