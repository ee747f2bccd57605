#include "launcher/provisioning_launch.h"

#include "launcher/command/launch_command.h"
#include "launcher/user_area/first_launch.h"
#include "launcher/user_area/installation.h"
#include "platform/linux/lock_file.h"
#include "tests/unit/fixtures.h"

#include <algorithm>
#include <cstdlib>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

namespace {
// An installation whose native executable records that it ran, and a user's area.
struct World {
    World()
    {
        dir.makeDir("ws/logs");
        dir.write("base/linux/x86/eclipse", "#!/bin/sh\nprintf '%s\\n' \"$@\" >\"$VELMORA_RAN\"\n");
        chmod(dir.path("base/linux/x86/eclipse").c_str(), 0755);
    }

    // checkForProvisioning in a child; its result is "not due" when the check came back.
    Ended check(std::initializer_list<const wchar_t*> userProps,
                std::initializer_list<const wchar_t*> launcherProps, bool firstLaunch = false,
                const Line& line = Line({L"velmora"}), int configuration = CONFIG_USER,
                VmargMap vmargs = {}) const
    {
        return runAside(dir, true, [&] {
            setenv("VELMORA_RAN", dir.path("ran").c_str(), 1);
            locateLockFile(line.argc, line.argv, dir.wide("ws"), L"eclipse");
            eConfig = configuration;
            userFirstLaunch = firstLaunch;
            Props user(userProps);
            Props launcher(launcherProps);
            appendProperty(user.list, L"rcp.install.id", L"1");
            appendProperty(user.list, L"rcp.base.location", dir.wide("base"));
            appendProperty(launcher.list, L"rcp.data", dir.wide("ws"));
            checkForProvisioning(dir.wide("ws"), line.argc, line.argv, L"/opt/app", user.list,
                                 launcher.list, launchArgs, vmargs);
            return std::string(userFirstLaunch ? "not due, first" : "not due");
        });
    }

    bool ran() const
    {
        return dir.has("ran");
    }

    // Whether a word was among those that the executable ran with.
    bool ranWith(const std::string& word) const
    {
        return ("\n" + dir.read("ran")).find("\n" + word + "\n") != std::string::npos;
    }

    TempDir dir;
};
} // namespace

static const std::initializer_list<const wchar_t*> LEVEL_1 = {L"provisioning.manifest.version",
                                                              L"1"};
static const std::initializer_list<const wchar_t*> DUE = {
    L"provisioning", L"true", L"provisioning.manifest.version", L"2", L"provisioning.application",
    L"prov.app"};

// Whether a run was made, and the process ended with status 0 then.
static bool provisions(std::initializer_list<const wchar_t*> userProps,
                       std::initializer_list<const wchar_t*> launcherProps,
                       bool firstLaunch = false, const Line& line = Line({L"velmora"}),
                       int configuration = CONFIG_USER)
{
    const World world;
    const Ended ended = world.check(userProps, launcherProps, firstLaunch, line, configuration);
    EXPECT_EQ(ended.status, 0) << ended.log;
    EXPECT_EQ(ended.result.empty(), world.ran());
    return world.ran();
}

TEST(checkForProvisioning, RunsOnANewLevel)
{
    EXPECT_TRUE(provisions(LEVEL_1, DUE));
    EXPECT_TRUE(provisions({}, DUE));
}

TEST(checkForProvisioning, RunsNotOnTheSameLevel)
{
    EXPECT_FALSE(provisions({L"provisioning.manifest.version", L"2"}, DUE));
}

TEST(checkForProvisioning, RunsOnAFirstLaunchWhateverTheLevel)
{
    EXPECT_TRUE(provisions({L"provisioning.manifest.version", L"2"}, DUE, true));
}

TEST(checkForProvisioning, RunsForAnInstallerWhateverTheLevel)
{
    EXPECT_TRUE(provisions({L"provisioning.manifest.version", L"2"}, DUE, false,
                           Line({L"velmora", L"-velmoraWait", L"-provManifest"})));
    EXPECT_FALSE(provisions({L"provisioning.manifest.version", L"2"}, DUE, false,
                            Line({L"velmora", L"-provManifest"})));
}

TEST(checkForProvisioning, NeedsTheWordTrueExactly)
{
    for (const wchar_t* value : {L"TRUE", L"true ", L"false", L"", L"truely"})
        EXPECT_FALSE(
            provisions({}, {L"provisioning", value, L"provisioning.application", L"a"}, true))
            << value;
    EXPECT_FALSE(provisions({L"provisioning", L"true"}, {L"provisioning.application", L"a"}, true));
}

TEST(checkForProvisioning, IsForThreeConfigurations)
{
    for (int configuration = 1; configuration <= 8; ++configuration)
        EXPECT_EQ(provisions({}, DUE, true, Line({L"velmora"}), configuration),
                  configuration == CONFIG_USER || configuration == CONFIG_MULTIUSER ||
                      configuration == CONFIG_LOCKDOWN)
            << configuration;
}

TEST(checkForProvisioning, DoesNotMarkAFirstLaunchWhereItIsNotDue)
{
    const World world;
    EXPECT_EQ(world.check({}, {L"provisioning", L"no"}).result, "not due");
    EXPECT_EQ(world.check({}, DUE, false, Line({L"velmora"}), CONFIG_USERPB).result, "not due");
    EXPECT_EQ(world.check({L"provisioning.manifest.version", L"2"}, DUE).result, "not due");
}

TEST(checkForProvisioning, LogsWhyAndTurnsTheSharedClassesOff)
{
    const World world;
    const Ended ended = world.check({}, DUE, false, Line({L"velmora"}), CONFIG_USER,
                                    {{L"vmarg.Dshare", L"-Xshareclasses:name=a"}});
    EXPECT_NE(ended.log.find("\nQVMRL0120I: \"vmarg.Dshare\" shared classes property found. "
                             "Setting -Xsharedclasses=none while provisioning\n"
                             "QVMRL0076I: Detected platform initial launch or user initial launch. "
                             "Executing platform provisioning.\n"),
              std::string::npos)
        << ended.log;
    EXPECT_TRUE(world.ranWith("-Xshareclasses=none"));
    EXPECT_FALSE(world.ranWith("-Xshareclasses:name=a"));
}

TEST(checkForProvisioning, RunsTheProvisioningApplicationForTheUser)
{
    const World world;
    world.check({}, DUE);
    EXPECT_NE(world.dir.read("ran").find("-application\nprov.app\n-userProvLaunch\n"),
              std::string::npos);
}

TEST(checkForProvisioning, RunsItWithoutTheUsersFlagForAnInstaller)
{
    const World world;
    world.check({}, DUE, true, Line({L"velmora", L"-velmoraWait", L"-provManifest"}));
    EXPECT_TRUE(world.ranWith("prov.app"));
    EXPECT_FALSE(world.ranWith("-userProvLaunch"));
}

TEST(checkForProvisioning, DoesNotGoOnToThePlatform)
{
    const World world;
    const Ended ended = world.check({}, DUE);
    EXPECT_EQ(ended.status, 0);
    EXPECT_EQ(ended.result, "");
    const size_t released = ended.log.rfind("QVMRL0306I: lock file released @ ");
    ASSERT_NE(released, std::string::npos);
    EXPECT_EQ(std::count(ended.log.begin() + static_cast<long>(released), ended.log.end(), '\n'),
              1);
}

TEST(checkForProvisioning, EndsWithStatus0WhateverTheRunsStatus)
{
    const World world;
    world.dir.write("base/linux/x86/eclipse", "#!/bin/sh\n>\"$VELMORA_RAN\"\nexit 3\n");
    EXPECT_EQ(world.check({}, DUE).status, 0);
    EXPECT_TRUE(world.ran());
}

// doProvisioning in the main process of "<world>/ws".
static Ended provision(const TempDir& world, const std::vector<std::wstring>& command)
{
    world.makeDir("ws");
    return runAside(world, false, [&] {
        Line line({L"velmora"});
        locateLockFile(line.argc, line.argv, world.wide("ws"), L"eclipse");
        const pid_t before = getpid();
        doProvisioning(PropertyList(), PropertyList(), line.argv[0], command);
        return std::string(getpid() == before ? "parent" : "child");
    });
}

// The log from the line with the begin of the parameters on.
static std::string fromParameters(const std::string& log)
{
    const size_t begin = log.find("QVMRL0129I");
    return begin == std::string::npos ? log : log.substr(begin);
}

TEST(doProvisioning, LogsTheWordsWhateverTheUserAskedFor)
{
    const TempDir world;
    EXPECT_EQ(fromParameters(provision(world, {L"/bin/true", L"%s%n", L""}).log),
              "QVMRL0129I: ===== Begin Provisioning Parameters =====\n/bin/true\n%s%n\n\n"
              "QVMRL0130I: ===== End Provisioning Parameters =====\n");
}

TEST(doProvisioning, WaitsForTheChildAndRecordsIt)
{
    const TempDir world;
    const std::wstring script = L"echo $$ >\"" + world.wide("pid") + L"\"; exit 7";
    EXPECT_EQ(provision(world, {L"/bin/sh", L"-c", script}).result, "parent");
    std::string pid = world.read("pid");
    ASSERT_FALSE(pid.empty());
    pid.pop_back();
    EXPECT_EQ(world.read("ws/.rcp.lock"), pid + "          ");
    EXPECT_EQ(world.read("ws/.rcp.main"), pid + "    ");
}

TEST(doProvisioning, ComesBackInAChildThatCannotBeExecutedToo)
{
    const TempDir world;
    const Ended ended = provision(world, {L"/no/such/program", L"x"});
    EXPECT_EQ(fromParameters(ended.log),
              "QVMRL0129I: ===== Begin Provisioning Parameters =====\n/no/such/program\nx\n"
              "QVMRL0130I: ===== End Provisioning Parameters =====\n"
              "Unable to execute /no/such/program : No such file or directory\n");
    // The parent waited for it, so the parent's word is the last.
    EXPECT_EQ(ended.result, "parent");
    EXPECT_EQ(ended.status, 0);
}
