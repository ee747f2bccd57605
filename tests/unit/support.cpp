#include "tests/unit/support.h"

#include "diag/SvcDebug_linux.h"
#include "launcher/properties/property_file.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <sys/wait.h>
#include <unistd.h>

namespace fs = std::filesystem;

static std::string readWhole(const std::string& path)
{
    std::ifstream in(path, std::ios::binary);
    std::stringstream bytes;
    bytes << in.rdbuf();
    return bytes.str();
}

TempDir::TempDir() : owner(getpid())
{
    const char* base = getenv("TMPDIR");
    dir = std::string(base == nullptr ? "/tmp" : base) + "/velmora-unit-XXXXXX";
    if (mkdtemp(&dir[0]) == nullptr) {
        perror("mkdtemp");
        abort();
    }
    wdir.assign(dir.begin(), dir.end());
}

TempDir::~TempDir()
{
    if (getpid() != owner)
        return;
    std::error_code ignored;
    fs::remove_all(dir, ignored);
}

std::string TempDir::path(const std::string& name) const
{
    return dir + "/" + name;
}

std::wstring TempDir::wide(const std::string& name) const
{
    const std::string bytes = path(name);
    return std::wstring(bytes.begin(), bytes.end());
}

void TempDir::write(const std::string& name, const std::string& bytes) const
{
    fs::create_directories(fs::path(path(name)).parent_path());
    std::ofstream out(path(name), std::ios::binary | std::ios::trunc);
    out << bytes;
}

void TempDir::makeDir(const std::string& name) const
{
    fs::create_directories(path(name));
}

std::string TempDir::read(const std::string& name) const
{
    return readWhole(path(name));
}

bool TempDir::has(const std::string& name) const
{
    std::error_code ignored;
    return fs::symlink_status(path(name), ignored).type() != fs::file_type::not_found;
}

ArgumentVector words(std::initializer_list<const wchar_t*> texts)
{
    ArgumentVector out;
    for (const wchar_t* text : texts)
        out.push_back(wcsdup(text));
    return out;
}

std::vector<std::wstring> texts(const std::vector<wchar_t*>& list)
{
    return std::vector<std::wstring>(list.begin(), list.end());
}

PropertyList pairs(std::initializer_list<const wchar_t*> keysAndValues)
{
    PropertyList list;
    const wchar_t* key = nullptr;
    for (const wchar_t* text : keysAndValues) {
        if (key == nullptr) {
            key = text;
            continue;
        }
        appendProperty(list, key, text);
        key = nullptr;
    }
    return list;
}

PropertyList properties(const std::string& fileBytes)
{
    TempDir dir;
    dir.write("a.properties", fileBytes);
    PropertyList list;
    getProperties(dir.wide("a.properties"), list);
    return list;
}

std::string logOf(bool tracing, const std::function<void()>& action)
{
    static TempDir dir;
    setDebug(false);
    enableLogging(dir.wdir);
    setDebug(tracing);
    action();
    setDebug(false);
    const std::string bytes = dir.read("velmora.log");
    return bytes.substr(bytes.find('\n') + 1);
}

// Runs `action` in a child of its own; `status` is its wait status, the result its log.
static std::string logOfChild(const std::function<void()>& action, int& status)
{
    TempDir dir;
    fflush(nullptr);
    const pid_t child = fork();
    if (child == 0) {
        setDebug(false);
        enableLogging(dir.wdir);
        action();
        _exit(77);
    }
    waitpid(child, &status, 0);
    return dir.read("velmora.log");
}

static std::string lastLine(const std::string& log)
{
    const std::string text = log.substr(0, log.find_last_not_of('\n') + 1);
    return text.substr(text.rfind('\n') + 1);
}

static testing::AssertionResult endedFatally(int status, const std::string& log)
{
    if (WIFEXITED(status) && WEXITSTATUS(status) == 255)
        return testing::AssertionSuccess();
    return testing::AssertionFailure() << "wait status " << status << ", log: " << log;
}

testing::AssertionResult endsWith(const std::function<void()>& action, const std::string& line,
                                  int reason)
{
    int status = 0;
    const std::string log = logOfChild(action, status);
    const testing::AssertionResult ended = endedFatally(status, log);
    if (!ended)
        return ended;
    const std::string wanted = reason < 0 ? line : line + " : " + strerror(reason);
    if (lastLine(log) == wanted)
        return testing::AssertionSuccess();
    return testing::AssertionFailure()
           << "last line: " << lastLine(log) << "\nexpected: " << wanted;
}

testing::AssertionResult fatalLineHolds(const std::function<void()>& action,
                                        const std::string& text)
{
    int status = 0;
    const std::string log = logOfChild(action, status);
    const testing::AssertionResult ended = endedFatally(status, log);
    if (!ended)
        return ended;
    if (log.find(text) != std::string::npos)
        return testing::AssertionSuccess();
    return testing::AssertionFailure() << "not in the log: " << text << "\nlog: " << log;
}
