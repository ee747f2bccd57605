#include "launcher/properties/vmarg_map.h"

#include "diag/SvcDebug_linux.h"
#include "launcher/properties/property_index.h"
#include "platform/linux/wide_strings.h"

#include <cwchar>

static bool isVmargWord(const wchar_t* word)
{
    return wcsncmp(word, L"vmarg.", 6) == 0;
}

void insertPropToVmargMap(VmargMap& map, PropertyList& list)
{
    if (list.empty())
        return;
    forgetIndex();
    PropertyList others;
    for (PropertyList::size_type i = 0; i + 1 < list.size(); i += 2) {
        if (!isVmargWord(list[i])) {
            others.push_back(list[i]);
            others.push_back(list[i + 1]);
            continue;
        }
        map.insert(VmargMap::value_type(list[i], list[i + 1]));
        freeString(list[i]);
        freeString(list[i + 1]);
    }
    list = others;
}

// Splits the word at its first "=" into the map; ends the process when there is none.
static void insertWord(VmargMap& map, const wchar_t* word, const char* message)
{
    const wchar_t* equals = wcschr(word, L'=');
    if (equals == nullptr) {
        fatalErrorA(message, EXIT_PROCESS, WITH_ERRNO);
        return;
    }
    map.insert(VmargMap::value_type(std::wstring(word, equals), equals + 1));
}

void insertArgsToVmargMap(VmargMap& map, int argc, wchar_t** argv, ArgumentVector& outArgs)
{
    ArgumentVector others;
    for (int i = 0; i < argc; ++i) {
        if (isVmargWord(argv[i]))
            insertWord(map, argv[i], "QVMRL0033E: velmora invoked with an invalid vmarg.");
        else
            others.push_back(argv[i]);
    }
    outArgs = others;
}

void insertCargsToVmargMap(VmargMap& map, ArgumentVector& args)
{
    ArgumentVector others;
    for (wchar_t* word : args) {
        if (isVmargWord(word))
            insertWord(map, word, "QVMRL0128E: velmora invoked with an invalid vmarg.");
        else
            others.push_back(word);
    }
    args = others;
}
