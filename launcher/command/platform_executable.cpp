#include "launcher/command/platform_executable.h"

#include "diag/SvcDebug_linux.h"
#include "launcher/command/launch_command.h"
#include "platform/linux/argument_vector.h"
#include "platform/linux/files.h"
#include "platform/linux/lock_file.h"
#include "platform/linux/paths.h"

void getEclipseExeName(std::wstring& name, const PropertyList& props)
{
    const wchar_t* value = findProperty(L"eclipse.name", props);
    name = value == nullptr ? L"eclipse" : value;
}

void addBaseEclipseToCommandLine(const PropertyList& props, const PropertyList& launcherProps)
{
    const wchar_t* base = findProperty(L"rcp.base.location", props);
    if (base == nullptr) {
        fatalErrorA("QVMRL0011E: Unable to determine RCP Base Plugin location. If the problem "
                    "persists, reinstall.",
                    EXIT_PROCESS, WITH_ERRNO);
        return;
    }
    std::wstring name;
    getEclipseExeName(name, launcherProps);
    std::wstring path = std::wstring(base) + L"/linux/x86/" + name;
    convertToOsSeparator(path);
    if (!isExecutable(path.c_str()))
        fatalErrorA("QVMRL0007E: %ls is not executable or does not exist.", path.c_str(),
                    EXIT_PROCESS, WITH_ERRNO);
    addPathToCommandLine(path);
}

void addStartupToCommandLine(PropertyList props, int argc, wchar_t** argv)
{
    addArgToCommandLine(L"-startup", true);
    // Decision: "-perfJar" as the last word names no archive and counts as absent.
    const int option = findOption(L"-perfJar", argc, argv);
    if (option >= 0 && option + 1 < argc) {
        addArgToCommandLine(argv[option + 1], true);
        return;
    }
    const wchar_t* base = findProperty(L"rcp.base.location", props);
    addArgToCommandLine(std::wstring(base == nullptr ? L"" : base) + L"/launcher.jar", true);
}

void addUseDaemonToCommandLine()
{
    if (isMainProcess())
        return;
    addArgToCommandLine(L"-useDaemon", true);
    addArgToCommandLine(std::to_wstring(getPlatformPid()), true);
}
