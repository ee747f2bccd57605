#include "launcher/command/config_extensions.h"

#include "diag/marker_file.h"
#include "launcher/user_area/locations.h"
#include "platform/linux/paths.h"
#include "platform/linux/process.h"

#include <cwchar>

// Words that the merge adds itself; they live as long as the process.
static wchar_t CONSOLE[] = L"-console";
static wchar_t DEBUG[] = L"-debug";
static wchar_t PB4L[] = L"-pb4l";
static wchar_t DEBUG_FILE[] = L"-debugFile";

// The index of the word behind "-config", -1 when it is absent or last.
// Decision: it is looked for among the words as received, so a named argument that stands there is
// the extension's name, too.
static int extensionNameIndex(int argc, wchar_t** argv)
{
    const int option = findOption(L"-config", argc, argv);
    return option >= 0 && option + 1 < argc ? option + 1 : -1;
}

void removeDuplicatePairs(ArgumentVector& args, const wchar_t* option)
{
    bool seen = false;
    for (ArgumentVector::size_type i = 0; i < args.size(); ++i) {
        if (wcscmp(args[i], option) != 0)
            continue;
        if (seen) {
            // Deliberate: the value of the dropped option stays in the vector as a stray word.
            args.erase(args.begin() + static_cast<ArgumentVector::difference_type>(i));
            return;
        }
        seen = true;
    }
}

void removeDuplicateSingles(ArgumentVector& args, const wchar_t* option)
{
    removeDuplicatePairs(args, option);
}

static void insertAt(ArgumentVector& args, ArgumentVector::size_type position, wchar_t* word)
{
    if (position > args.size())
        position = args.size();
    args.insert(args.begin() + static_cast<ArgumentVector::difference_type>(position), word);
}

static void insertDiagnosticWords(ArgumentVector& args)
{
    insertAt(args, 1, CONSOLE);
    insertAt(args, 1, DEBUG);
    insertAt(args, 1, PB4L);
    insertAt(args, 1, DEBUG_FILE);
}

static void removeDuplicateDiagnosticWords(ArgumentVector& args)
{
    removeDuplicateSingles(args, L"-console");
    removeDuplicateSingles(args, L"-debug");
    removeDuplicateSingles(args, L"-pb4l");
}

// The arguments without "-config" and its name, and where an extension's platform words go.
struct MergePoint {
    bool haveVmargs = false;
    ArgumentVector::size_type position = 0;
};

static MergePoint rebuildArguments(int argc, wchar_t** argv, int nameIndex, ArgumentVector& args)
{
    MergePoint point;
    args.clear();
    for (int i = 0; i < argc; ++i) {
        if (i == nameIndex - 1 || i == nameIndex)
            continue;
        if (wcscmp(argv[i], L"-vmargs") == 0) {
            point.haveVmargs = true;
            // Deliberate: minus 2 for "-config" and its name, whether or not they stand before it.
            // Decision: "-vmargs" as the first word gives 0.
            point.position = i < 2 ? 0 : static_cast<ArgumentVector::size_type>(i - 2);
        }
        args.push_back(argv[i]);
    }
    return point;
}

static void mergeExtension(const std::wstring& name, const PropertyList& launcherProps,
                           MergePoint point, ArgumentVector& args)
{
    bool inJvmPart = false;
    for (int n = 1;; ++n) {
        const std::wstring key = L"config." + name + L"." + std::to_wstring(n);
        wchar_t* word = findProperty(key.c_str(), launcherProps);
        if (word == nullptr)
            return;
        if (word[0] == L'\0')
            continue;
        if (point.haveVmargs && wcscmp(word, L"-vmargs") == 0)
            inJvmPart = true;
        else if (!point.haveVmargs || inJvmPart)
            args.push_back(word);
        else
            insertAt(args, point.position++, word);
    }
}

static void removeDuplicateOptions(ArgumentVector& args)
{
    // Deliberate: "-product" twice, so of three the first stays.
    for (const wchar_t* option : {L"-vm", L"-data", L"-plugincustomization", L"-application",
                                  L"-product", L"-personality", L"-product", L"-nl", L"-dir"})
        removeDuplicatePairs(args, option);
    removeDuplicateDiagnosticWords(args);
}

void addConfigExtentionsToArg(int& newArgc, wchar_t**& newArgv, int argc, wchar_t** argv,
                              PropertyList& launcherProps, ArgumentVector& args, VmargMap& vmargs,
                              const std::wstring& rcpHome)
{
    insertArgsToVmargMap(vmargs, argc, argv, args);
    const int nameIndex = extensionNameIndex(argc, argv);
    if (nameIndex < 0) {
        if (debugFileExists(rcpHome)) {
            insertDiagnosticWords(args);
            removeDuplicateDiagnosticWords(args);
        }
    } else {
        const MergePoint point = rebuildArguments(argc, argv, nameIndex, args);
        mergeExtension(argv[nameIndex], launcherProps, point, args);
        // Decision: the marker file is not looked for here; a merge before this one may have.
        if (debugFileWasFound())
            insertDiagnosticWords(args);
        removeDuplicateOptions(args);
        patchWorkspace(args, launcherProps);
        insertCargsToVmargMap(vmargs, args);
    }
    newArgc = static_cast<int>(args.size());
    // With a null at its end: an array of no words at all has a first element, too.
    newArgv = new wchar_t*[args.size() + 1]();
    for (ArgumentVector::size_type i = 0; i < args.size(); ++i)
        newArgv[i] = args[i];
}

void getRestartExe(std::wstring& restartExe, int argc, wchar_t** argv,
                   const PropertyList& launcherProps, const std::wstring& rcpHome)
{
    const int nameIndex = extensionNameIndex(argc, argv);
    if (nameIndex < 0)
        return;
    const std::wstring key = std::wstring(L"config.") + argv[nameIndex] + L".restartExe." + getOS();
    const wchar_t* value = findProperty(key.c_str(), launcherProps);
    if (value == nullptr)
        return;
    restartExe = value;
    replaceFirstRcpHome(restartExe, rcpHome);
    convertToOsSeparator(restartExe);
}
