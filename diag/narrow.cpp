#include "diag/narrow.h"

#include <cstdio>
#include <cstdlib>

std::string narrow(const wchar_t* text)
{
    const size_t length = wcstombs(nullptr, text, 0);
    if (length == static_cast<size_t>(-1))
        return std::string();
    std::string out(length, '\0');
    wcstombs(&out[0], text, length);
    return out;
}

std::wstring withSlashes(std::wstring path)
{
    for (wchar_t& c : path) {
        if (c == L'\\')
            c = L'/';
    }
    return path;
}

std::string narrowPath(const std::wstring& path)
{
    return narrow(withSlashes(path).c_str());
}

bool fileExists(const char* path)
{
    FILE* file = fopen(path, "rbe");
    if (file == nullptr)
        return false;
    fclose(file);
    return true;
}
