#include "launcher/command/jvm_arguments.h"

#include "launcher/command/launch_command.h"
#include "launcher/command/options.h"
#include "launcher/user_area/installation.h"
#include "platform/linux/argument_vector.h"
#include "platform/linux/paths.h"

static void addNoConsoleFix(const std::wstring& workspaceLocation, const PropertyList& props)
{
    const FoundProperties found(L"vmfix.noconsole", props);
    if (found.pairs[0][0] == L'\0')
        return;
    const std::wstring placeholder = L"${workspace.location}";
    std::wstring word = found.pairs[1];
    const std::wstring::size_type at = word.find(placeholder);
    if (at != std::wstring::npos)
        word.replace(at, placeholder.size(), workspaceLocation);
    convertToOsSeparator(word);
    addArgToCommandLine(word, true);
}

void addVmargsToCommandLine(const std::wstring& workspaceLocation, const PropertyList& props,
                            int argc, wchar_t** argv, bool vmIsLibrary, const VmargMap& vmargs)
{
    if (!startsJvmDirectly())
        addArgToCommandLine(L"-vmargs", true);
    const int given = findOption(L"-vmargs", argc, argv);
    for (int i = given + 1; given >= 0 && i < argc; ++i)
        addArgToCommandLine(argv[i], true);
    // A restart asks for no console, whatever its words say.
    const bool console = findOption(L"-console", argc, argv) >= 0 && !isRestart(argc, argv);
    if (!console && !vmIsLibrary)
        addNoConsoleFix(workspaceLocation, props);
    for (const VmargMap::value_type& entry : vmargs) {
        if (!entry.second.empty())
            addArgToCommandLine(entry.second, true);
    }
}

void addXargsToCommandLine(const PropertyList& props)
{
    const FoundProperties found(L"-X", props);
    for (wchar_t** pair = found.pairs; pair[0][0] != L'\0'; pair += 2)
        addArgToCommandLine(std::wstring(pair[0]) + pair[1], true);
    const wchar_t* prepend = findProperty(L"Xbootclasspath.prepend", props);
    if (prepend != nullptr)
        addArgToCommandLine(std::wstring(L"-Xbootclasspath/p:") + prepend, true);
    const wchar_t* append = findProperty(L"Xbootclasspath.append", props);
    if (append != nullptr)
        addArgToCommandLine(std::wstring(L"-Xbootclasspath/a:") + append, true);
}

void addClasspathToCommandLine(const PropertyList& props)
{
    if (eConfig == CONFIG_MU_SERVICE) {
        const wchar_t* base = findProperty(L"rcp.base.location", props);
        addArgToCommandLine(L"-cp", true);
        addArgToCommandLine(std::wstring(base == nullptr ? L"" : base) + L"/startup.jar", true);
        return;
    }
    const wchar_t* classPath = findProperty(L"cp", props);
    if (classPath == nullptr)
        return;
    addArgToCommandLine(L"-cp", true);
    addArgToCommandLine(classPath, true);
}

void addMainClassToCommandLine()
{
    addArgToCommandLine(L"org.eclipse.core.launcher.Main", true);
}
