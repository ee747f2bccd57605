#include "launcher/provisioning_launch.h"

#include "diag/SvcDebug_linux.h"
#include "launcher/command/command_assembly.h"
#include "launcher/command/launch_command.h"
#include "launcher/command/options.h"
#include "launcher/user_area/first_launch.h"
#include "launcher/user_area/installation.h"
#include "launcher/user_area/provisioning_rules.h"
#include "platform/linux/child_process.h"
#include "platform/linux/lock_file.h"

#include <cstdlib>
#include <cwchar>

static bool provisionsHere(const PropertyList& launcherProps)
{
    const wchar_t* provisioning = findProperty(L"provisioning", launcherProps);
    if (provisioning == nullptr || wcscmp(provisioning, L"true") != 0)
        return false;
    return eConfig == CONFIG_USER || eConfig == CONFIG_MULTIUSER || eConfig == CONFIG_LOCKDOWN;
}

void checkForProvisioning(const std::wstring& workspace, int argc, wchar_t** argv,
                          const std::wstring& installDir, PropertyList userProps,
                          PropertyList launcherProps, std::vector<std::wstring>& command,
                          VmargMap& vmargs)
{
    if (!provisionsHere(launcherProps))
        return;
    const wchar_t* level = L"provisioning.manifest.version";
    if (isNewProvisioningLevel(findProperty(level, userProps), findProperty(level, launcherProps)))
        userFirstLaunch = true;
    const bool forInstaller = isISMPProvisioning(argc, argv);
    if (!userFirstLaunch && !forInstaller)
        return;
    defeateSharedClassesInProvisioning(vmargs);
    SvcDebugOutA("QVMRL0076I: Detected platform initial launch or user initial launch. "
                 "Executing platform provisioning.");
    getUserCmdString(workspace, argc, argv, installDir, userProps, launcherProps, vmargs, true,
                     !forInstaller);
    doProvisioning(launcherProps, userProps, argv[0], command);
    unlockLockFile();
    // Deliberate: this launcher does not go on to the platform; the next start does.
    exit(0);
}

void doProvisioning(const PropertyList& /*launcherProps*/, const PropertyList& /*userProps*/,
                    wchar_t* /*argv0*/, const std::vector<std::wstring>& command)
{
    char** args = newExecArguments(command, "QVMRL0129I: ===== Begin Provisioning Parameters =====",
                                   "QVMRL0130I: ===== End Provisioning Parameters =====");
    const ChildStart start = startChild(args);
    if (start.outcome == CHILD_STARTED) {
        populateLockFile(start.pid);
        waitForChild(start.pid);
    }
    freeExecArguments(args);
}
