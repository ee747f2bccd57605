#include "launcher/command/initial_run.h"

#include <cwchar>

static bool beginsLike(const wchar_t* word, const wchar_t* start)
{
    return wcsncmp(word, start, wcslen(start)) == 0;
}

ArgumentVector initialRunWords(int argc, wchar_t** argv)
{
    static wchar_t config[] = L"-config";
    static wchar_t initial[] = L"initial";
    static wchar_t noProgram[] = L"";
    ArgumentVector words = {argc > 0 ? argv[0] : noProgram, config, initial};
    bool data = false;
    bool debug = false;
    bool console = false;
    bool noExit = false;
    for (int i = 1; i < argc; ++i) {
        wchar_t* word = argv[i];
        if (!data && beginsLike(word, L"-data")) {
            data = true;
            words.push_back(word);
            if (i + 1 < argc)
                words.push_back(argv[++i]);
        } else if (!debug && beginsLike(word, L"-debug")) {
            debug = true;
            words.push_back(word);
        } else if (!console && beginsLike(word, L"-console")) {
            console = true;
            words.push_back(word);
        } else if (!noExit && beginsLike(word, L"-noExit")) {
            noExit = true;
            words.push_back(word);
        }
    }
    return words;
}
