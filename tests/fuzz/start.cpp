// A whole start, up to the finished command, in a small world that the input fills: files of the
// installation, the words of the command line, the user's area of an earlier start.
//
// An input can name any path and have it emptied: that is what an installation may ask for. So this
// target runs only where the root file system is read-only (tests/fuzz/run sees to that).
#include "launcher/command/launch_command.h"
#include "launcher/startup.h"
#include "launcher/user_area/first_launch.h"
#include "launcher/user_area/installation.h"
#include "platform/linux/argument_vector.h"
#include "platform/linux/lock_file.h"
#include "tests/fuzz/harness.h"

#include <cstdlib>
#include <filesystem>
#include <list>
#include <sys/statvfs.h>

static const std::string& home()
{
    static const std::string dir = [] {
        struct statvfs root = {};
        if (statvfs("/", &root) != 0 || (root.f_flag & ST_RDONLY) == 0)
            finding("the root file system is not read-only: use tests/fuzz/run");
        return std::filesystem::read_symlink("/proc/self/exe").parent_path().parent_path().string();
    }();
    return dir;
}

static void putInHome(const std::string& name, const std::string& bytes)
{
    const std::filesystem::path path = home() + "/" + name;
    std::filesystem::create_directories(path.parent_path());
    FILE* file = fopen(path.c_str(), "w");
    if (file == nullptr)
        return;
    fwrite(bytes.data(), 1, bytes.size(), file);
    fclose(file);
}

static void forgetEarlierStart()
{
    launchArgs.clear();
    bRestart = false;
    bDaemon = false;
    userFirstLaunch = false;
    eConfig = CONFIG_OTHER;
    IS_LOCKDOWN = false;
    setMainProcess(false);
    clearenv();
    setenv("HOME", (home() + "/home").c_str(), 1);
    setenv("USER", "anna", 1);
    setenv("PATH", "/usr/bin:/bin", 1);
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    endsByJump = true;
    Bytes bytes = {data, size};
    std::error_code ignored;
    std::filesystem::remove_all(home() + "/home", ignored);
    std::filesystem::remove_all(home() + "/base", ignored);
    forgetEarlierStart();

    std::list<std::wstring> kept = {L"velmora"};
    const unsigned count = bytes.number(6);
    for (unsigned i = 0; i < count; ++i)
        kept.push_back(wide(bytes.line()));
    ArgumentVector argv;
    for (std::wstring& word : kept)
        argv.push_back(&word[0]);
    const unsigned flags = bytes.number(256);
    if ((flags & 1) != 0)
        putInHome("home/VANTOR/RCP/id/anna/.rcp.lock", bytes.part());
    if ((flags & 2) != 0)
        putInHome("home/VANTOR/RCP/id/anna/.config/rcpinstall.properties", bytes.part());
    if ((flags & 4) != 0)
        putInHome("home/VANTOR/RCP/id/anna/.sid", "");
    if ((flags & 8) != 0)
        putInHome("home/VANTOR/RCP/id/anna/logs/shutdown.log", bytes.part());
    // What the input does not say: enough for a start to get far.
    const std::string known = (flags & 16) != 0 ? ""
                                                : "rcp.install.id=id\nrcp.base.location=" + home() +
                                                      "/base\ninstall.configuration=user\n";
    putInHome("rcp/velmora.properties", bytes.part() + "\n" + known);
    putInHome("base/rcpinstall.properties", bytes.part());
    putInHome("base/platform.xml", bytes.part());
    putInHome("base/config.ini", "a=b\n");
    putInHome("base/linux/x86/eclipse", "");
    std::filesystem::permissions(home() + "/base/linux/x86/eclipse",
                                 std::filesystem::perms::owner_all, ignored);
    putInHome("rcp/deploy/jvm.properties", bytes.rest());
    platformLooks = (flags & 32) != 0 ? 50 : 0;
    const int argc = static_cast<int>(argv.size());
    const bool came = runs([&] {
        startup(argc, argv.data(), launchArgs);
        freeExecArguments(newExecArguments(launchArgs, "begin", "end"));
    });
    if (came && launchArgs.empty() && (flags & 16) == 0 && !startsJvmDirectly())
        finding("a start that came to its end without a command");
    return 0;
}
