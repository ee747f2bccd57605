#include "launcher/command/command_assembly.h"

#include "diag/SvcDebug_linux.h"
#include "launcher/command/child_environment.h"
#include "launcher/command/jvm_arguments.h"
#include "launcher/command/jvm_executable.h"
#include "launcher/command/launch_command.h"
#include "launcher/command/platform_arguments.h"
#include "launcher/command/platform_executable.h"
#include "launcher/properties/placeholders.h"
#include "launcher/user_area/cache_maintenance.h"
#include "launcher/user_area/installation.h"
#include "launcher/user_area/provisioning_rules.h"
#include "platform/linux/directories.h"
#include "platform/linux/files.h"
#include "platform/linux/lock_file.h"
#include "platform/linux/paths.h"
#include "platform/linux/wide_strings.h"

#include <vector>

// What all three orders take their words from.
struct Sources {
    const std::wstring& workspace;
    int argc;
    wchar_t** argv;
    const std::wstring& installDir;
    const PropertyList& userProps;
    const PropertyList& launcherProps;
    const VmargMap& vmargs;
};

static void addMainOptions(const Sources& from)
{
    addMainOptionsToCommandLine(from.userProps, from.launcherProps, from.argc, from.argv,
                                from.installDir);
}

static bool addVm(const Sources& from)
{
    return addVmToCommandLine(from.userProps, from.launcherProps, from.argc, from.argv);
}

// The library path, the JVM's options and the class path, which every order has in this sequence.
static void addJvmWords(const Sources& from, bool vmIsLibrary)
{
    addLibpathToCommandLine(from.userProps);
    addVmargsToCommandLine(from.workspace, from.userProps, from.argc, from.argv, vmIsLibrary,
                           from.vmargs);
    addDashDToCommandLine(from.userProps, from.launcherProps, from.argc, from.argv,
                          from.installDir);
    addXargsToCommandLine(from.userProps);
    addClasspathToCommandLine(from.userProps);
}

static void setChildEnvironment(const Sources& from)
{
    addEnvSetToCommandLine(from.userProps);
    addLdPreloadToCommandLine(from.userProps);
    addEnvJavaHighZipfds(from.userProps);
}

static void buildProvisioningCommand(const Sources& from, bool userProvisioning)
{
    addBaseEclipseToCommandLine(from.userProps, from.launcherProps);
    addMainOptions(from);
    const wchar_t* application = findProperty(L"provisioning.application", from.launcherProps);
    addArgToCommandLine(L"-application", true);
    // Decision: an absent one is an empty word, so that the platform takes no other word for it.
    addArgToCommandLine(application == nullptr ? L"" : application, true);
    if (userProvisioning)
        addArgToCommandLine(L"-userProvLaunch", true);
    const bool vmIsLibrary = addVm(from);
    addStartupToCommandLine(from.userProps, from.argc, from.argv);
    addJvmWords(from, vmIsLibrary);
    setChildEnvironment(from);
}

static void buildDirectCommand(const Sources& from)
{
    const bool vmIsLibrary = addVm(from);
    addJvmWords(from, vmIsLibrary);
    addMainClassToCommandLine();
    addMainOptions(from);
    setChildEnvironment(from);
}

// Deliberate: the native executable and its options stand before the VM, which comes as an
// argument of its own.
static void buildNativeCommand(const Sources& from)
{
    addBaseEclipseToCommandLine(from.userProps, from.launcherProps);
    addMainOptions(from);
    const bool vmIsLibrary = addVm(from);
    addUseDaemonToCommandLine();
    addStartupToCommandLine(from.userProps, from.argc, from.argv);
    addJvmWords(from, vmIsLibrary);
    setChildEnvironment(from);
}

static void removeSharedClasses(const PropertyList& userProps, const PropertyList& launcherProps)
{
    const wchar_t* level = L"provisioning.manifest.version";
    if (!isNewProvisioningLevel(findProperty(level, userProps), findProperty(level, launcherProps)))
        return;
    const wchar_t* value = findProperty(L"jvm.shareclasses.fullpath", userProps);
    if (value == nullptr)
        return;
    std::wstring directory = value;
    convertToOsSeparator(directory);
    std::wstring information;
    if (!exists(directory.c_str()) || removeDirectoryContents(directory, information))
        return;
    // Decision: error output, which is always written, although the identifiers end in I.
    fatalErrorA("\nQVMRL0086I begin: Information collected while removing shared classes "
                "directory\n%ls\n"
                "QVMRL0087I end: Unable to remove all files in the shared classes directory.",
                information.c_str(), GO_ON, WITHOUT_ERRNO);
}

void getUserCmdString(const std::wstring& workspace, int argc, wchar_t** argv,
                      const std::wstring& installDir, PropertyList& userProps,
                      PropertyList& launcherProps, VmargMap& vmargs, bool provisioning,
                      bool userProvisioning)
{
    // Decision: the builders see every word, the changed ones replaced. They get a copy of the
    // array, since the new words are released below while argv lives on.
    std::vector<wchar_t*> words(argv, argv + argc);
    std::vector<wchar_t*> changed(words.size(), nullptr);
    wchar_t** resolved = words.data();
    wchar_t** copies = changed.data();
    replacePlaceholdersInRcpInstallProp(workspace, installDir, userProps);
    replacePlaceholdersInArgv(workspace, installDir, &resolved, &copies, argc);
    replacePlaceholdersInVmargMap(workspace, installDir, userProps, vmargs);
    if (isMainProcess()) {
        bool removed = false;
        doCacheMaintenance(workspace, vmargs, isDirtyShutdown(), removed);
    }
    removeSharedClasses(userProps, launcherProps);

    const Sources from = {workspace, argc, resolved, installDir, userProps, launcherProps, vmargs};
    if (provisioning)
        buildProvisioningCommand(from, userProvisioning);
    else if (startsJvmDirectly())
        buildDirectCommand(from);
    else
        buildNativeCommand(from);

    for (wchar_t* copy : changed) {
        if (copy[0] != L'\0')
            freeString(copy);
    }
}
