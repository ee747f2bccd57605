#include "launcher/command/launch_command.h"

#include "diag/SvcDebug_linux.h"
#include "platform/linux/wide_strings.h"

#include <cstring>

std::vector<std::wstring> launchArgs;
bool bRestart = false;
bool bDaemon = false;

void addPathToCommandLine(const std::wstring& path)
{
    // Deliberate: the words before it go; the choice of the VM may begin again.
    launchArgs.clear();
    launchArgs.push_back(path);
}

void addArgToCommandLine(const std::wstring& arg, bool /*ignored*/)
{
    if (bRestart && arg == L"-debug")
        return;
    if (bRestart && arg == L"-console")
        return;
    if (arg == L"-useDaemon")
        bDaemon = true;
    launchArgs.push_back(arg);
}

void setSemVersion(wchar_t* /*ignored*/) {}

char** newExecArguments(const std::vector<std::wstring>& args, const char* begin, const char* end)
{
    char** words = new char*[args.size() + 1];
    size_t count = 0;
    const ForcedTrace forced;
    const LineBlock together;
    SvcDebugOutA(begin);
    for (const std::wstring& arg : args) {
        std::string bytes;
        wstrtocs(bytes, arg);
        words[count] = new char[bytes.size() + 1];
        memcpy(words[count], bytes.c_str(), bytes.size() + 1);
        SvcDebugOutA("%s", words[count]);
        ++count;
    }
    SvcDebugOutA(end);
    words[count] = nullptr;
    return words;
}

void freeExecArguments(char** args)
{
    for (char** word = args; *word != nullptr; ++word)
        delete[] * word;
    delete[] args;
}
