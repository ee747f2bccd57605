#include "launcher/command/platform_arguments.h"

#include "diag/SvcDebug_linux.h"
#include "launcher/command/launch_command.h"
#include "launcher/command/options.h"
#include "launcher/user_area/installation.h"
#include "launcher/user_area/locations.h"
#include "platform/linux/argument_vector.h"
#include "platform/linux/paths.h"

#include <algorithm>
#include <array>
#include <cwchar>

// Where the options stand that are not passed on like any other word, -1 for the absent ones.
// Only the first occurrence of each counts.
struct OptionPositions {
    OptionPositions(int argc, wchar_t** argv)
        : droppedPairs{findOption(L"-data", argc, argv), findOption(L"-configuration", argc, argv),
                       findOption(L"-vm", argc, argv), findOption(L"-rcp_old_pid", argc, argv)},
          droppedSingles{findOption(L"-restart", argc, argv),
                         findOption(L"-resetconfig", argc, argv)},
          passedPairs{findOption(L"-plugincustomization", argc, argv),
                      findOption(L"-application", argc, argv), findOption(L"-product", argc, argv),
                      findOption(L"-personality", argc, argv)}
    {}

    const std::array<int, 4> droppedPairs;
    const std::array<int, 2> droppedSingles;
    const std::array<int, 4> passedPairs;
};

static bool isOneOf(const int* first, size_t count, int i)
{
    return std::find(first, first + count, i) != first + count;
}

static void addUserWords(int argc, wchar_t** argv)
{
    const OptionPositions at(argc, argv);
    const int vmargs = findOption(L"-vmargs", argc, argv);
    const int end = vmargs < 0 ? argc : vmargs;
    int i = 1;
    while (i < end) {
        if (isOneOf(at.droppedPairs.data(), at.droppedPairs.size(), i)) {
            i += 2;
        } else if (isOneOf(at.droppedSingles.data(), at.droppedSingles.size(), i)) {
            ++i;
        } else if (isOneOf(at.passedPairs.data(), at.passedPairs.size(), i)) {
            // Decision: the second word goes along whatever it is; the walk goes on behind the
            // pair, and ends there when that second word was "-vmargs".
            addArgToCommandLine(argv[i], true);
            if (i + 1 < argc)
                addArgToCommandLine(argv[i + 1], true);
            i += 2;
        } else {
            addArgToCommandLine(argv[i], true);
            ++i;
        }
    }
}

static void addDefault(const wchar_t* option, const wchar_t* value, int argc, wchar_t** argv)
{
    if (value == nullptr || findOption(option, argc, argv) >= 0)
        return;
    addArgToCommandLine(option, true);
    addArgToCommandLine(value, true);
}

void addMainOptionsToCommandLine(const PropertyList& props, const PropertyList& launcherProps,
                                 int argc, wchar_t** argv, const std::wstring& rcpHome)
{
    if (startsJvmDirectly())
        addArgToCommandLine(L"-nosplash", true);
    if (!isDebug(argc, argv))
        addArgToCommandLine(L"--launcher.suppressErrors", true);
    addUserWords(argc, argv);
    if (findProperty(L"rcp.install.id", props) == nullptr)
        fatalErrorA("QVMRL0005E: Couldn't find the rcp.install.id property!", EXIT_PROCESS,
                    WITH_ERRNO);
    // Decision: the locations come from the launcher's own properties, as for every other caller.
    std::wstring location;
    getWorkspaceLocation(location, launcherProps, argc, argv, rcpHome);
    addArgToCommandLine(L"-data", true);
    addArgToCommandLine(location, true);
    getConfigurationLocation(location, launcherProps, argc, argv, rcpHome);
    addArgToCommandLine(L"-configuration", true);
    addArgToCommandLine(location, true);
    addDefault(L"-application", findProperty(L"application", props), argc, argv);
    addDefault(L"-plugincustomization", findProperty(L"plugincustomization", props), argc, argv);
    const wchar_t* product = findProperty(L"product", launcherProps);
    if (product == nullptr)
        product = findProperty(L"product", props);
    addDefault(L"-product", product, argc, argv);
    addDefault(L"-personality", findProperty(L"personality", props), argc, argv);
}

static const wchar_t* installConfigurationName()
{
    switch (eConfig) {
    case CONFIG_SERVICE:
        return L"service";
    case CONFIG_LOCKDOWN:
        return L"lockdown";
    case CONFIG_USER:
        return L"user";
    case CONFIG_SERIAL_MULTIUSER:
        return L"serial.multiuser";
    case CONFIG_MULTIUSER:
    case CONFIG_MU_SERVICE:
        return L"multiuser";
    case CONFIG_USERPB:
        return L"userpb";
    default:
        // Deliberate: the line speaks of the install id; the cause is the configuration.
        fatalErrorA("QVMRL0025E: The platform rcp.install.id must be provided for this "
                    "configuration!",
                    EXIT_PROCESS, WITH_ERRNO);
        return L"";
    }
}

// "<key>=<value>" as one word; returns its text.
static std::wstring systemProperty(const wchar_t* key, const wchar_t* value)
{
    std::wstring word;
    setArgProperty(word, key, value);
    word.resize(wcslen(word.c_str()));
    return word;
}

void addDashDToCommandLine(const PropertyList& props, const PropertyList& launcherProps, int argc,
                           wchar_t** argv, const std::wstring& rcpHome)
{
    addArgToCommandLine(systemProperty(L"-Drcp.home", rcpHome.c_str()), true);
    std::wstring workspace;
    getWorkspaceLocation(workspace, launcherProps, argc, argv, rcpHome);
    addArgToCommandLine(systemProperty(L"-Drcp.data", workspace.c_str()), true);
    const wchar_t* splash = findProperty(L"osgi.splashPath", launcherProps);
    if (splash != nullptr)
        addArgToCommandLine(systemProperty(L"-Dosgi.splashPath", splash), true);
    const wchar_t* id = findProperty(L"rcp.install.id", props);
    if (id == nullptr) {
        fatalErrorA("QVMRL0036E: Couldn't find the rcp.install.id property!", EXIT_PROCESS,
                    WITH_ERRNO);
        return;
    }
    addArgToCommandLine(systemProperty(L"-Dcom.vantor.rcp.install.id", id), true);
    addArgToCommandLine(systemProperty(L"-Drcp.install.config", installConfigurationName()), true);
    const FoundProperties found(L"-D", props);
    for (wchar_t** pair = found.pairs; pair[0][0] != L'\0'; pair += 2) {
        const std::wstring word = systemProperty(pair[0], pair[1]);
        SvcDebugOutW(L"QVMRL0075I: commandArg  = \"%s\"", word.c_str());
        addArgToCommandLine(word, true);
    }
    std::wstring installArea = rcpHome + L"/rcp/eclipse";
    convertToOsSeparator(installArea);
    addArgToCommandLine(systemProperty(L"-Drcp.osgi.install.area", installArea.c_str()), true);
}
