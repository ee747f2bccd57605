#include "tests/unit/fixtures.h"

#include "diag/SvcDebug_linux.h"
#include "launcher/command/launch_command.h"

#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <filesystem>
#include <fstream>
#include <map>
#include <sched.h>
#include <sys/mount.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

static const int REFUSED = 78;

static std::vector<wchar_t*> pointersTo(std::vector<std::wstring>& owned)
{
    std::vector<wchar_t*> pointers;
    for (std::wstring& word : owned)
        pointers.push_back(&word[0]);
    return pointers;
}

Line::Line(std::initializer_list<const wchar_t*> words)
    : Line(std::vector<std::wstring>(words.begin(), words.end()))
{}

Line::Line(const std::vector<std::wstring>& words)
    : owned(words), pointers(pointersTo(owned)), argc(static_cast<int>(owned.size())),
      argv(pointers.data())
{}

Props::Props(std::initializer_list<const wchar_t*> keysAndValues)
    : Props(std::vector<std::wstring>(keysAndValues.begin(), keysAndValues.end()))
{}

Props::Props(const std::vector<std::wstring>& keysAndValues)
{
    for (size_t i = 0; i + 1 < keysAndValues.size(); i += 2)
        appendProperty(list, keysAndValues[i], keysAndValues[i + 1]);
}

Props::~Props()
{
    freeProperties(list);
}

Texts commandOf(const std::function<void()>& builder)
{
    launchArgs.clear();
    builder();
    return launchArgs;
}

static std::string readIfThere(const TempDir& dir, const std::string& name)
{
    return dir.has(name) ? dir.read(name) : std::string();
}

// Ends the child.
static void runAction(const TempDir& dir, bool tracing, const std::function<std::string()>& action)
{
    const std::string place = dir.path("aside");
    setDebug(false);
    enableLogging(std::wstring(place.begin(), place.end()));
    setDebug(tracing);
    dir.write("aside/result", action());
    _exit(0);
}

static Ended endOf(const TempDir& dir, pid_t child)
{
    Ended ended = {0, "", ""};
    waitpid(child, &ended.status, 0);
    ended.status = WIFEXITED(ended.status) ? WEXITSTATUS(ended.status) : -ended.status;
    ended.result = readIfThere(dir, "aside/result");
    ended.log = readIfThere(dir, "aside/velmora.log");
    if (!ended.log.empty())
        ended.log.erase(0, ended.log.find('\n') + 1);
    return ended;
}

static pid_t forkAside(const TempDir& dir)
{
    dir.makeDir("aside");
    dir.write("aside/result", "");
    fflush(nullptr);
    return fork();
}

Ended runAside(const TempDir& dir, bool tracing, const std::function<std::string()>& action)
{
    const pid_t child = forkAside(dir);
    if (child == 0)
        runAction(dir, tracing, action);
    return endOf(dir, child);
}

static bool writeText(const char* path, const std::string& text)
{
    const int fd = open(path, O_WRONLY | O_CLOEXEC);
    if (fd < 0)
        return false;
    const bool written = write(fd, text.data(), text.size()) == static_cast<ssize_t>(text.size());
    close(fd);
    return written;
}

static bool enterNamespaces()
{
    const std::string user = std::to_string(geteuid());
    const std::string group = std::to_string(getegid());
    if (unshare(CLONE_NEWUSER | CLONE_NEWNS) != 0)
        return false;
    return writeText("/proc/self/setgroups", "deny") &&
           writeText("/proc/self/uid_map", user + " " + user + " 1") &&
           writeText("/proc/self/gid_map", group + " " + group + " 1") &&
           mount("none", "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0;
}

// Gives this process an empty /tmp in which `dir` stands at its place.
static bool enterPrivateTmp(const std::string& dir)
{
    if (!enterNamespaces())
        return false;
    const int kept = open(dir.c_str(), O_PATH | O_DIRECTORY);
    if (kept < 0 || mount("none", "/tmp", "tmpfs", 0, "mode=1777") != 0)
        return false;
    std::error_code trouble;
    std::filesystem::create_directories(dir, trouble);
    const std::string source = "/proc/self/fd/" + std::to_string(kept);
    const bool bound = mount(source.c_str(), dir.c_str(), nullptr, MS_BIND, nullptr) == 0;
    close(kept);
    return bound;
}

std::string privateTmpRefusal()
{
    const TempDir dir;
    const pid_t child = forkAside(dir);
    if (child == 0)
        _exit(enterPrivateTmp(dir.dir) ? 0 : REFUSED);
    return endOf(dir, child).status == 0 ? "" : "the kernel refuses user and mount namespaces";
}

Ended runInPrivateTmp(const TempDir& dir, bool tracing, const std::function<std::string()>& action)
{
    const pid_t child = forkAside(dir);
    if (child == 0) {
        if (!enterPrivateTmp(dir.dir))
            _exit(REFUSED);
        runAction(dir, tracing, action);
    }
    return endOf(dir, child);
}

typedef std::map<std::string, std::string (*)(const std::string&)> Jobs;

static Jobs& jobs()
{
    static Jobs known;
    return known;
}

InstalledJob::InstalledJob(const char* name, std::string (*job)(const std::string&))
{
    jobs()[name] = job;
}

// Before the first test of a copy that was started for a job: does the job and ends the process.
struct JobInsteadOfTests : testing::Environment {
    void SetUp() override
    {
        const char* name = getenv("VELMORA_UNIT_JOB");
        const char* world = getenv("VELMORA_UNIT_WORLD");
        if (name == nullptr || world == nullptr)
            return;
        const std::string dir = world;
        const std::string result = jobs().at(name)(dir);
        std::ofstream(dir + "/aside/result") << result;
        _exit(0);
    }
};

[[maybe_unused]] static testing::Environment* const jobInsteadOfTests =
    testing::AddGlobalTestEnvironment(new JobInsteadOfTests);

// The name of the running test, so that the copy has one to run, and comes to its environment.
static std::string ownFilter()
{
    const testing::TestInfo* test = testing::UnitTest::GetInstance()->current_test_info();
    return std::string("--gtest_filter=") + test->test_suite_name() + "." + test->name();
}

Ended runInstalled(const TempDir& world, const std::string& place, const std::string& name)
{
    const std::string copy = world.path(place);
    const std::string filter = ownFilter();
    std::filesystem::create_directories(std::filesystem::path(copy).parent_path());
    std::filesystem::copy_file("/proc/self/exe", copy);
    const pid_t child = forkAside(world);
    if (child == 0) {
        if (!enterPrivateTmp(world.dir))
            _exit(REFUSED);
        setenv("VELMORA_UNIT_JOB", name.c_str(), 1);
        setenv("VELMORA_UNIT_WORLD", world.dir.c_str(), 1);
        unsetenv("GTEST_OUTPUT");
        const int nowhere = open("/dev/null", O_RDWR | O_CLOEXEC);
        dup2(nowhere, STDOUT_FILENO);
        execl(copy.c_str(), copy.c_str(), filter.c_str(), static_cast<char*>(nullptr));
        _exit(REFUSED);
    }
    return endOf(world, child);
}

void limitFileSize(long bytes)
{
    signal(SIGXFSZ, SIG_IGN);
    struct rlimit limit = {};
    getrlimit(RLIMIT_FSIZE, &limit);
    limit.rlim_cur = static_cast<rlim_t>(bytes);
    setrlimit(RLIMIT_FSIZE, &limit);
}
