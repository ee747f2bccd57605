#include "tests/fuzz/literal.h"

#include <cstdio>
#include <cstdlib>

typedef std::wstring::size_type Position;

static void trim(std::wstring& text)
{
    if (text.find_first_not_of(L' ') == std::wstring::npos)
        return;
    while (text.back() == L' ')
        text.pop_back();
    while (text.front() == L' ')
        text.erase(0, 1);
}

// The code of the hexadecimal digits at the beginning of `text`.
static wchar_t codeOf(const std::wstring& text)
{
    const Position end = text.find_first_not_of(L"0123456789abcdefABCDEF");
    const std::wstring digits = text.substr(0, end);
    return digits.empty() ? L'\0' : static_cast<wchar_t>(std::stoul(digits, nullptr, 16));
}

std::wstring literalValue(std::wstring value)
{
    for (Position at = value.find(L'\\'); at != std::wstring::npos; at = value.find(L'\\', at)) {
        if (at + 1 < value.size() && value[at + 1] == L'u')
            value.replace(at, 6, 1, codeOf(value.substr(at + 2, 4)));
        else
            value.erase(at, 1);
        ++at;
    }
    trim(value);
    return value;
}

struct Building {
    std::wstring key;
    std::wstring value;
    bool inValue = false;
    bool xLine = false;
    bool continued = false;
};

static void walk(const std::wstring& line, Building& building)
{
    bool separatorAllowed = true;
    for (Position i = 0; i < line.size(); ++i) {
        if (line[i] == L'\\' && i + 1 == line.size()) {
            building.continued = true;
            continue;
        }
        if (line[i] == L'\\' && std::wstring(L":# =").find(line[i + 1]) != std::wstring::npos)
            ++i;
        if (std::wstring(L"=: \t").find(line[i]) != std::wstring::npos && separatorAllowed) {
            building.inValue = true;
            if (building.xLine)
                building.value += line[i];
            continue;
        }
        if (!building.inValue) {
            building.key += line[i];
            continue;
        }
        if (line[i] == L'\\' && i + 1 < line.size() && line[i + 1] == L'\\') {
            building.value += line[i];
            ++i;
        }
        building.continued = false;
        separatorAllowed = false;
        building.value += line[i];
    }
}

static void take(const std::wstring& line, Building& building, std::vector<std::wstring>& found)
{
    if (line.empty() || line[0] == L'#')
        return;
    if (!building.continued) {
        building.key.clear();
        building.value.clear();
        building.inValue = false;
        if (line.size() > 1)
            building.xLine = line.substr(0, 2) == L"-X";
    }
    walk(line, building);
    if (building.continued)
        return;
    building.key += L'\0';
    trim(building.key);
    found.emplace_back(building.key.c_str());
    found.emplace_back(literalValue(building.value).c_str());
}

std::vector<std::wstring> literalProperties(const std::string& path)
{
    std::vector<std::wstring> found;
    Building building;
    FILE* file = fopen(path.c_str(), "re");
    if (file == nullptr)
        return found;
    char bytes[2025] = "";
    while (feof(file) == 0 && fscanf(file, " %2024[^\n]\n", bytes) != EOF) {
        wchar_t line[2025] = L"";
        if (mbstowcs(line, bytes, 2025) == static_cast<size_t>(-1))
            line[0] = L'\0';
        take(line, building, found);
    }
    fclose(file);
    return found;
}
