#include "launcher/startup.h"

#include "diag/SvcDebug_linux.h"
#include "diag/marker_file.h"
#include "launcher/command/command_assembly.h"
#include "launcher/command/config_extensions.h"
#include "launcher/command/initial_run.h"
#include "launcher/command/jvm_location.h"
#include "launcher/command/options.h"
#include "launcher/command/platform_executable.h"
#include "launcher/properties/placeholders.h"
#include "launcher/properties/property_file.h"
#include "launcher/provisioning_launch.h"
#include "launcher/user_area/first_launch.h"
#include "launcher/user_area/installation.h"
#include "launcher/user_area/locations.h"
#include "launcher/user_area/platform_xml.h"
#include "launcher/user_area/provisioning_rules.h"
#include "launcher/user_area/startup_arguments.h"
#include "launcher/user_area/user_properties.h"
#include "launcher/user_area/workspace_reset.h"
#include "platform/linux/files.h"
#include "platform/linux/lock_file.h"
#include "platform/linux/paths.h"

#include <cstdlib>

// The state of the sequence. The raw words are the process's own; the effective ones have the
// configuration extension merged in, and every later step takes these unless it says "raw".
struct StartupRun {
    StartupRun(int count, wchar_t** words, std::vector<std::wstring>& launchArgs)
        : rawArgc(count), rawArgv(words), command(launchArgs)
    {}

    // The words are borrowed from the lists, so the lists go last.
    ~StartupRun()
    {
        delete[] argv;
        freeProperties(userProps);
        freeProperties(launcherProps);
    }

    StartupRun(const StartupRun&) = delete;
    StartupRun& operator=(const StartupRun&) = delete;

    int rawArgc;
    wchar_t** rawArgv;
    std::vector<std::wstring>& command;

    std::wstring installDir;
    std::wstring launcherPropsPath;
    PropertyList launcherProps;
    PropertyList userProps; // the user's install properties, the recorded words, jvm.properties
    int argc = 0;
    wchar_t** argv = nullptr;
    ArgumentVector extension;
    VmargMap vmargs;

    std::wstring installId;
    std::wstring baseLocation;
    std::wstring workspace;
    std::wstring logLocation;
    std::wstring configuration;
    bool notPluginJvm = true;
};

static void mergeExtensions(StartupRun& run, int argc, wchar_t** argv)
{
    addConfigExtentionsToArg(run.argc, run.argv, argc, argv, run.launcherProps, run.extension,
                             run.vmargs, run.installDir);
}

static void readLauncherProperties(StartupRun& run)
{
    getInstallDir(run.installDir, run.rawArgc, run.rawArgv);
    run.launcherPropsPath = run.installDir + L"/rcp/velmora.properties";
    // Decision: as every path; an installation below a folder with a backslash is not found.
    convertToOsSeparator(run.launcherPropsPath);
    getProperties(run.launcherPropsPath, run.launcherProps);
    mergeExtensions(run, run.rawArgc, run.rawArgv);
    setDebug(isDebug(run.argc, run.argv));
}

static void chooseInstallation(StartupRun& run)
{
    SetInstallConfiguration(run.launcherProps, false);
    run.installId = getInstallID(run.launcherPropsPath, run.launcherProps);
    const wchar_t* base = findProperty(L"rcp.base.location", run.launcherProps);
    if (base == nullptr) {
        fatalErrorA("QVMRL0050E: rcp.base.location property is missing from %ls",
                    run.launcherPropsPath.c_str(), EXIT_PROCESS, WITH_ERRNO);
        return;
    }
    run.baseLocation = base;
    replaceFirstRcpHome(run.baseLocation, run.installDir);
}

static void createWorkspace(StartupRun& run)
{
    getWorkspaceLocation(run.workspace, run.launcherProps, run.argc, run.argv, run.installDir);
    makeUserDirectory(run.workspace, "QVMRL0083E: Unable to create %ls directory.");
}

// Decision: here, after the workspace directory was made, and on the raw words.
static void refuseBadArguments(const StartupRun& run)
{
    validateIfUrlHandlerLaunch(run.rawArgc, run.rawArgv);
    validateThatDoubleQuotesNotUsed(run.rawArgc, run.rawArgv);
    validateNoJavaLibraryPath(run.rawArgc, run.rawArgv);
}

static void decideRole(const StartupRun& run)
{
    std::wstring exeName;
    getEclipseExeName(exeName, run.launcherProps);
    locateLockFile(run.argc, run.argv, run.workspace, exeName);
}

static void openLog(StartupRun& run)
{
    getLogLocation(run.logLocation, run.workspace);
    makeUserDirectory(run.logLocation, "QVMRL0084E: Unable to create %ls directory.");
    if (!enableLogging(run.logLocation)) {
        dumpLogToTempLocation();
        exit(-1);
    }
    deleteTempLog();
    waitForDeletionOfDebugFile();
}

static void createConfiguration(StartupRun& run)
{
    getConfigurationLocation(run.configuration, run.launcherProps, run.argc, run.argv,
                             run.installDir);
    makeUserDirectory(run.configuration, "QVMRL0093E: Unable to create %ls directory.");
}

static void renewOldUserArea(StartupRun& run)
{
    if (userFirstLaunch)
        return;
    const bool old = isOldRcpInstallId(run.installId, run.configuration, run.userProps);
    const bool reset = !old && isResetConfig(run.rawArgc, run.rawArgv);
    if (old)
        createReusableWorkspace(run.workspace, run.configuration);
    if (reset)
        resetWorkspace(run.workspace, run.configuration, run.baseLocation);
    // Decision: what was read is what is used, as long as the area stays; a trace shows it where it
    // is used, too.
    if (old || reset || isTracing())
        freeProperties(run.userProps);
}

static void createExtensionDirectories(const StartupRun& run)
{
    std::wstring root = run.workspace + L"/applications/eclipse";
    convertToOsSeparator(root);
    makeUserDirectory(root + L"/features", "QVMRL0094E: Unable to create %ls directory.");
    makeUserDirectory(root + L"/plugins", "QVMRL0095E: Unable to create %ls directory.");
    std::wstring shared = run.installDir + L"/shared/eclipse/.eclipseextension";
    convertToOsSeparator(shared);
    if (exists(shared.c_str()))
        copyFile(shared.c_str(), (root + L"/.eclipseextension").c_str());
}

// A daemon process, or a restart, leaves the record of the main process's start as it is.
static void recordStartupArguments(const StartupRun& run)
{
    if (!isMainProcess() || findOption(L"-restart", run.rawArgc, run.rawArgv) != -1)
        return;
    // Decision: the raw words, in which "-config" and its name still stand.
    std::wstring restartExe;
    getRestartExe(restartExe, run.rawArgc, run.rawArgv, run.launcherProps, run.installDir);
    writeStartupArgs(run.rawArgc, run.rawArgv, run.configuration, restartExe.c_str(),
                     run.launcherProps, run.installDir);
}

static void createUserCopies(StartupRun& run)
{
    createConfigIni(run.configuration, run.baseLocation);
    if (!run.userProps.empty())
        return;
    const std::wstring path = createRCPInstallProps(
        run.workspace, run.configuration, run.baseLocation, run.installDir, run.launcherProps);
    getProperties(path, run.userProps);
}

static void readUserProperties(StartupRun& run)
{
    insertPropToVmargMap(run.vmargs, run.userProps);
    std::wstring recorded = run.configuration + L"/args.properties";
    convertToOsSeparator(recorded);
    // Decision: a restart writes no record, and one after a reset finds none; it must still start.
    getPropertiesIfPresent(recorded, run.userProps);
}

static void setJavaHome(StartupRun& run, const std::wstring& jvmPropertiesPath, std::wstring vmPath)
{
    std::wstring javaHome;
    if (run.notPluginJvm) {
        if (findProperty(L"java.home", run.userProps) != nullptr)
            return;
        std::wstring fallback = run.installDir;
        convertBS2S(vmPath);
        convertBS2S(fallback);
        getJvmHome(vmPath, javaHome, fallback);
    } else {
        javaHome = jvmPropertiesPath.substr(0, jvmPropertiesPath.rfind(L'/'));
    }
    std::wstring key = L"java.home";
    pushBackProperty(run.userProps, key, javaHome);
}

static void setJvmLibraryPath(StartupRun& run)
{
    const wchar_t* libraryPath = findProperty(L"jvm.library.path", run.userProps);
    if (libraryPath == nullptr || libraryPath[0] == L'\0')
        return;
    std::wstring fixed = libraryPath;
    fixUpJvmLibPath(fixed);
    replaceValue(L"jvm.library.path", fixed.c_str(), run.userProps);
}

static void readJvmProperties(StartupRun& run)
{
    std::wstring path;
    std::wstring vmPath;
    const bool located = getJvmPropertyLocation(run.userProps, run.argc, run.argv, run.installDir,
                                                path, run.notPluginJvm, vmPath);
    std::wstring filePath = path;
    convertToOsSeparator(filePath);
    // Decision: a location is always given; whether it counts as found is whether a file is there.
    // That of a JVM in a plug-in has been seen there.
    if (!located || (run.notPluginJvm && !exists(filePath.c_str()))) {
        const ForcedTrace forced;
        SvcDebugOutW(L"QVMRL0125I: No jvm.properties file was loaded. "
                     L"A default file should be at \"%s\"",
                     L"${rcp.home}/rcp/deploy");
        return;
    }
    {
        const ForcedTrace forced;
        SvcDebugOutW(L"QVMRL0077I: loading jvm.properties at \"%s\"", path.c_str());
    }
    getProperties(filePath, run.userProps);
    insertPropToVmargMap(run.vmargs, run.userProps);
    setJavaHome(run, path, vmPath);
    setJvmLibraryPath(run);
}

static void takeInitialRunWords(StartupRun& run)
{
    if (!isInitialRequired(run.launcherProps, run.userProps))
        return;
    delete[] run.argv;
    run.argv = nullptr;
    run.extension.clear();
    ArgumentVector words = initialRunWords(run.rawArgc, run.rawArgv);
    mergeExtensions(run, static_cast<int>(words.size()), words.data());
}

void startup(int argc, wchar_t** argv, std::vector<std::wstring>& launchArgs)
{
    StartupRun run(argc, argv, launchArgs);
    readLauncherProperties(run);
    chooseInstallation(run);
    createWorkspace(run);
    refuseBadArguments(run);
    decideRole(run); // from here on we hold the workspace's lock
    openLog(run);    // from here on lines reach a file
    validateInstallerState(run.argc, run.argv);
    createConfiguration(run);
    renewOldUserArea(run);
    createExtensionDirectories(run);
    recordStartupArguments(run);
    createUserCopies(run);
    readUserProperties(run);
    readJvmProperties(run);
    createPlatformXML(run.configuration, run.baseLocation, run.launcherProps, run.notPluginJvm);
    if (isMainProcess())
        checkForProvisioning(run.workspace, run.argc, run.argv, run.installDir, run.userProps,
                             run.launcherProps, run.command, run.vmargs);
    takeInitialRunWords(run);
    getUserCmdString(run.workspace, run.argc, run.argv, run.installDir, run.userProps,
                     run.launcherProps, run.vmargs, false, false);
}
