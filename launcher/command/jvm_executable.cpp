#include "launcher/command/jvm_executable.h"

#include "diag/SvcDebug_linux.h"
#include "launcher/command/launch_command.h"
#include "launcher/user_area/installation.h"
#include "platform/linux/argument_vector.h"
#include "platform/linux/files.h"
#include "platform/linux/lock_file.h"
#include "platform/linux/paths.h"

static const struct {
    const wchar_t* console;
    const wchar_t* windowed;
} VARIANTS[] = {{L"java", L"javaw"}, {L"qv", L"qvw"}, {L"quillon", L"quillonw"}};

static bool hasEnding(const std::wstring& path, const std::wstring& ending)
{
    return path.size() >= ending.size() &&
           path.compare(path.size() - ending.size(), ending.size(), ending) == 0;
}

static std::wstring withEnding(const std::wstring& path, const std::wstring& oldEnding,
                               const std::wstring& newEnding)
{
    return path.substr(0, path.size() - oldEnding.size()) + newEnding;
}

static bool isFile(std::wstring path)
{
    convertToOsSeparator(path);
    return exists(path.c_str());
}

bool isJavaw(std::wstring& vmPath, const std::wstring& windowedName,
             const std::wstring& consoleName)
{
    if (!hasEnding(vmPath, windowedName))
        return false;
    const std::wstring candidate = withEnding(vmPath, windowedName, consoleName);
    if (!isFile(candidate)) {
        fatalErrorA("QVMRL0003E: Specified vm (%ls) does not exist!", candidate.c_str(),
                    EXIT_PROCESS, WITH_ERRNO);
        return false;
    }
    vmPath = candidate;
    return true;
}

bool replaceJavaExecutableName(std::wstring& vmPath, const std::wstring& oldName,
                               const std::wstring& newName)
{
    if (!hasEnding(vmPath, oldName))
        return false;
    const std::wstring candidate = withEnding(vmPath, oldName, newName);
    if (!isFile(candidate))
        return false;
    vmPath = candidate;
    return true;
}

static void takeConsoleVariant(std::wstring& vmPath)
{
    for (const auto& variant : VARIANTS) {
        if (isJavaw(vmPath, variant.windowed, variant.console))
            return;
    }
}

static void renameExecutable(std::wstring& vmPath, const PropertyList& launcherProps)
{
    const wchar_t* newConsole = findProperty(L"java.exe.name.linux", launcherProps);
    const wchar_t* newWindowed = findProperty(L"javaw.exe.name.linux", launcherProps);
    if (newConsole != nullptr) {
        for (const auto& variant : VARIANTS) {
            if (replaceJavaExecutableName(vmPath, variant.console, newConsole))
                break;
        }
    }
    if (newWindowed != nullptr) {
        for (const auto& variant : VARIANTS) {
            if (replaceJavaExecutableName(vmPath, variant.windowed, newWindowed))
                break;
        }
    }
}

// The VM path as given, null when there is none.
static const wchar_t* givenVm(const PropertyList& props, int argc, wchar_t** argv)
{
    const int option = findOption(L"-vm", argc, argv);
    if (option < 0)
        return findProperty(L"vm", props);
    if (option + 1 < argc && argv[option + 1][0] != L'\0')
        return argv[option + 1];
    fatalErrorA("QVMRL0002E: vm must be specified with -vm argument!", EXIT_PROCESS, WITH_ERRNO);
    return nullptr;
}

bool addVmToCommandLine(const PropertyList& props, const PropertyList& launcherProps, int argc,
                        wchar_t** argv)
{
    const bool console =
        findOption(L"-console", argc, argv) >= 0 || findOption(L"-consoleLog", argc, argv) >= 0;
    if (findOption(L"-velmoraWait", argc, argv) >= 0)
        setWaitMode();
    const wchar_t* given = givenVm(props, argc, argv);
    if (given == nullptr)
        return false;
    std::wstring vmPath = given;
    // Decision: the plain ending. With endsIn, whose arithmetic takes a text that is one character
    // shorter than the ending for it, a VM called "jvm" would be a library.
    const bool isLibrary = hasEnding(vmPath, L".ee") || hasEnding(vmPath, L".dll");
    if (!isLibrary) {
        if (console)
            takeConsoleVariant(vmPath);
        renameExecutable(vmPath, launcherProps);
    }
    if (startsJvmDirectly()) {
        addPathToCommandLine(vmPath);
    } else {
        addArgToCommandLine(L"-vm", true);
        addArgToCommandLine(vmPath, true);
    }
    return isLibrary;
}
