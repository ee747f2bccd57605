#include "launcher/properties/property_file.h"

#include "diag/SvcDebug_linux.h"
#include "launcher/properties/property_text.h"
#include "platform/linux/files.h"

#include <algorithm>
#include <cstdio>
#include <cwchar>

// The property that is being built, over as many lines as it continues.
struct PropertyParts {
    std::wstring key;
    std::wstring value;
    bool inValue = false;
    bool isXLine = false;
    bool continued = false;
};

static bool isSeparator(wchar_t c)
{
    return c == L'=' || c == L':' || c == L' ' || c == L'\t';
}

// Adds the characters of one physical line, which has no line end.
static void walkLine(const std::wstring& line, PropertyParts& parts)
{
    bool separatorAllowed = true;
    for (std::wstring::size_type i = 0; i < line.size(); ++i) {
        if (line[i] == L'\\') {
            if (i + 1 == line.size()) {
                parts.continued = true;
                continue;
            }
            // Deliberate: the character behind the backslash is not shielded by it.
            if (wcschr(L":# =", line[i + 1]) != nullptr)
                ++i;
        }
        const wchar_t c = line[i];
        if (separatorAllowed && isSeparator(c)) {
            parts.inValue = true;
            if (parts.isXLine)
                parts.value += c;
            continue;
        }
        if (!parts.inValue) {
            parts.key += c;
            continue;
        }
        if (c == L'\\' && i + 1 < line.size() && line[i + 1] == L'\\') {
            // Both are kept for FilterValue.
            parts.value += c;
            ++i;
        }
        // Decision: what a trailing backslash has set is cleared here and nowhere else, so a
        // property whose line ends in one goes on until a character of its value has come.
        parts.continued = false;
        separatorAllowed = false;
        // What follows means nothing else before the next backslash.
        const std::wstring::size_type end = std::min(line.find(L'\\', i + 1), line.size());
        parts.value.append(line, i, end - i);
        i = end - 1;
    }
}

static void finishProperty(PropertyParts& parts, PropertyList& list)
{
    // Deliberate: the key is trimmed with a NUL at its end, so it loses leading spaces only.
    parts.key += L'\0';
    FilterProp(parts.key);
    SvcDebugOutW(L"QVMRL0023I:   attrib = \"%s\"", parts.key.c_str());
    FilterValue(parts.value);
    SvcDebugOutW(L"QVMRL0024I:   value  = \"%s\"", parts.value.c_str());
    appendProperty(list, parts.key, parts.value);
}

static void takeLine(const std::wstring& line, PropertyParts& parts, PropertyList& list)
{
    SvcDebugOutW(L"QVMRL0032I: Prop Line = \"%s\"", line.c_str());
    // Decision: an empty line, and one that the locale cannot convert, yields no pair.
    if (line.empty() || line[0] == L'#')
        return;
    if (!parts.continued) {
        parts.key.clear();
        parts.value.clear();
        parts.inValue = false;
        // Deliberate: a line of one character leaves the mark of the line before it.
        if (line.size() >= 2)
            parts.isXLine = line[0] == L'-' && line[1] == L'X';
    }
    walkLine(line, parts);
    if (!parts.continued)
        finishProperty(parts, list);
}

bool getPropertiesIfPresent(const std::wstring& path, PropertyList& list)
{
    FILE* file = nullptr;
    open_file(file, path.c_str(), L"r");
    if (file == nullptr)
        return false;
    PropertyParts parts;
    wchar_t text[LINE_ROOM];
    std::wstring line;
    while (feof(file) == 0 && readFile(file, L" %2024[^\n]\n", text) != EOF) {
        line = text;
        takeLine(line, parts, list);
    }
    // A property that still continues at the end of the file is never finished.
    fclose(file);
    return true;
}

void getProperties(const std::wstring& path, PropertyList& list)
{
    if (!getPropertiesIfPresent(path, list))
        fatalErrorA("QVMRL0096E: Unable to load %ls file!", path.c_str(), EXIT_PROCESS, WITH_ERRNO);
}
