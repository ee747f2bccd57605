#include "platform/linux/platform_process.h"

#include "platform/linux/process.h"
#include "platform/linux/wide_strings.h"

#include <cerrno>
#include <climits>
#include <csignal>
#include <cstdlib>
#include <cwchar>
#include <cwctype>
#include <sys/wait.h>

static bool isPlainNameCharacter(wchar_t c)
{
    return (c < 128 && iswalnum(static_cast<wint_t>(c)) != 0) || wcschr(L"._-+/", c) != nullptr;
}

// `name` as one word of the shell, which grep takes for a pattern and not for an option.
static std::string shellWord(const std::wstring& name)
{
    bool plain = name[0] != L'-';
    std::wstring quoted = L"'";
    for (const wchar_t c : name) {
        plain = plain && isPlainNameCharacter(c);
        if (c == L'\'')
            quoted += L"'\\''";
        else if (c == L'-' && quoted.size() == 1)
            quoted += L"[-]";
        else
            quoted += c;
    }
    std::string word;
    wcstochar(word, plain ? name.c_str() : (quoted + L"'").c_str());
    return word;
}

// Decision: the command has room for 99 bytes; a name that is too long is cut, and still found by
// what is left of it. A name with characters that mean something to the shell is quoted: it is a
// pattern for grep, never a command.
static std::string platformTest(long pid, const std::wstring& exeName)
{
    static const size_t LONGEST_COMMAND = 99;
    const std::string start = "ps h " + std::to_string(pid) + " | grep ";
    const std::string end = " 2>&1 1>/dev/null";
    std::wstring cut = exeName.substr(0, LONGEST_COMMAND);
    std::string name = shellWord(cut);
    while (start.size() + name.size() + end.size() > LONGEST_COMMAND && !cut.empty()) {
        cut.pop_back();
        name = shellWord(cut);
    }
    return start + name + end;
}

// False when no shell could be had: of that the C library tells in errno alone, its result is that
// of a shell that has found no command. A shell that ran leaves errno as it was, for the reason
// behind a later line.
static bool runShell(const std::string& command, int& status)
{
    const int before = errno;
    errno = 0;
    // The shell is required here: packages depend on ps.
    status = system(command.c_str());
    const bool had = errno != EAGAIN && errno != ENOMEM;
    if (errno == 0)
        errno = before;
    return had;
}

bool isPlatformAlive(long pid, const std::wstring& exeName)
{
    // A number that no process can have is a dead one, also where pid_t is narrower than long. A
    // negative number is looked up like any other: ps takes it for a session.
    // Decision: 0 and an empty name are a no without a shell, which could only print an error, on
    // this process's own standard output or standard error.
    std::string name;
    if (pid == 0 || pid > INT_MAX || pid < -INT_MAX || wstrtocs(name, exeName) <= 0)
        return false;
    if (kill(static_cast<pid_t>(pid), 0) != 0 && errno == ESRCH)
        return false;
    const std::string test = platformTest(pid, exeName);
    int status = 0;
    if (!runShell(test, status)) {
        // Decision: where there is no shell for want of memory or processes, there may be one a
        // second later. Without processes no platform could be started either.
        sysSleep(1);
        runShell(test, status);
    }
    return WIFEXITED(status) && WEXITSTATUS(status) == 0;
}
