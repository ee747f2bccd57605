#include "platform/linux/argument_vector.h"

#include "platform/linux/wide_strings.h"

#include <cstring>
#include <cwchar>

ArgumentVector wideArguments(int argc, char** argv)
{
    ArgumentVector words;
    words.reserve(static_cast<size_t>(argc));
    for (int i = 0; i < argc; ++i)
        words.push_back(chartowcs(argv[i]));
    return words;
}

int findOption(const wchar_t* option, int argc, wchar_t** argv)
{
    for (int i = 1; i < argc; ++i) {
        if (wcscmp(argv[i], option) == 0)
            return i;
    }
    return -1;
}

bool haveLaunchOption(const char* option, char** args, int count)
{
    for (int i = 0; i < count; ++i) {
        if (strcmp(args[i], option) == 0)
            return true;
    }
    return false;
}
