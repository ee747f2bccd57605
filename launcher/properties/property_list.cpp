#include "launcher/properties/property_list.h"

#include "diag/SvcDebug_linux.h"
#include "launcher/properties/property_index.h"
#include "launcher/properties/property_text.h"
#include "platform/linux/wide_strings.h"

#include <cwchar>

static wchar_t* newCopy(const wchar_t* text)
{
    const size_t length = wcslen(text);
    return wmemcpy(newString(length), text, length + 1);
}

void appendProperty(PropertyList& list, const std::wstring& key, const std::wstring& value)
{
    list.push_back(newCopy(key.c_str()));
    list.push_back(newCopy(value.c_str()));
}

void pushBackProperty(PropertyList& list, std::wstring& key, std::wstring& value)
{
    FilterProp(key);
    SvcDebugOutW(L"QVMRL0126I:   key = \"%s\"", key.c_str());
    FilterValue(value);
    SvcDebugOutW(L"QVMRL0127I:   value  = \"%s\"", value.c_str());
    appendProperty(list, key, value);
}

wchar_t* findProperty(const wchar_t* key, const PropertyList& list)
{
    if (isIndexed(list)) {
        const PropertyList::size_type at = findByIndex(key, list);
        return at == list.size() ? nullptr : list[at + 1];
    }
    for (PropertyList::size_type i = 0; i + 1 < list.size(); i += 2) {
        // Most keys differ at once, and are not worth a call.
        if (list[i][0] == key[0] && wcscmp(list[i], key) == 0)
            return list[i + 1];
    }
    return nullptr;
}

// Room for `count` pointers and the terminator.
// Decision: a failure to grow ends the process with the same line as a failure to begin.
static wchar_t** resizeFound(wchar_t** found, size_t count)
{
    auto** room =
        static_cast<wchar_t**>(realloc(static_cast<void*>(found), (count + 1) * sizeof(wchar_t*)));
    if (room == nullptr)
        fatalErrorA("QVMRL0046E: findProperties malloc for property strings failed!", EXIT_PROCESS,
                    WITH_ERRNO);
    return room;
}

wchar_t** findProperties(const wchar_t* prefix, const PropertyList& list)
{
    static wchar_t endOfPairs[1] = L"";
    const size_t length = wcslen(prefix);
    size_t room = 10;
    size_t used = 0;
    wchar_t** found = resizeFound(nullptr, room);
    for (PropertyList::size_type i = 0; i + 1 < list.size(); i += 2) {
        // Deliberate: a pair without a key hides everything behind it.
        if (list[i][0] == L'\0')
            break;
        if (wcsncmp(list[i], prefix, length) != 0)
            continue;
        if (used == room) {
            room *= 2;
            found = resizeFound(found, room);
        }
        found[used++] = list[i];
        found[used++] = list[i + 1];
    }
    found[used] = endOfPairs;
    return found;
}

void replaceValue(const wchar_t* key, const wchar_t* newValue, PropertyList& list)
{
    // Deliberate: keys and values alike; a value that equals the key is found, too.
    for (PropertyList::size_type i = 0; i + 1 < list.size(); ++i) {
        if (wcscmp(list[i], key) != 0)
            continue;
        // What stands behind a value is a key.
        if (i % 2 == 1)
            forgetIndex();
        wchar_t* replaced = list[i + 1];
        list[i + 1] = newCopy(newValue);
        freeString(replaced);
        return;
    }
}

void setArgProperty(std::wstring& out, const wchar_t* key, const wchar_t* value)
{
    out = key;
    out += L'=';
    out += value;
    // Deliberate: the NUL counts in the length; callers use the characters before it.
    out += L'\0';
}

void freeProperties(PropertyList& list)
{
    forgetIndex();
    for (wchar_t* text : list)
        freeString(text);
    list.clear();
}
