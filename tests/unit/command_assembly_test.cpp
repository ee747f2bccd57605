#include "launcher/command/command_assembly.h"

#include "launcher/command/launch_command.h"
#include "launcher/user_area/installation.h"
#include "platform/linux/lock_file.h"
#include "tests/unit/fixtures.h"

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <sys/stat.h>

namespace fs = std::filesystem;

namespace {
// A base location with its native executable, a workspace, and lists that give one word to each
// group of the command.
struct Assembly {
    Assembly()
        : user({L"rcp.install.id",
                L"1234",
                L"rcp.base.location",
                dir.wide("base").c_str(),
                L"vm",
                L"/jvm/java",
                L"cp",
                L"/cp.jar",
                L"-Dd",
                L"1",
                L"-Xx",
                L"2",
                L"application",
                L"${prop.name}",
                L"name",
                L"app",
                L"library.path.append",
                L"/lib",
                L"env.set.VELMORA_A",
                L"a"}),
          launcher({L"rcp.data", dir.wide("ws").c_str(), L"provisioning.application", L"prov.app"})
    {
        eConfig = CONFIG_USER;
        setMainProcess(true);
        dir.makeDir("ws/logs");
        dir.write("base/linux/x86/eclipse", "");
        chmod(dir.path("base/linux/x86/eclipse").c_str(), 0755);
    }

    ~Assembly()
    {
        setMainProcess(false);
        unsetenv("LD_LIBRARY_PATH");
    }

    Texts command(const Line& line, bool provisioning = false, bool userProvisioning = false)
    {
        return commandOf([&] {
            getUserCmdString(dir.wide("ws"), line.argc, line.argv, L"/opt/app", user.list,
                             launcher.list, vmargs, provisioning, userProvisioning);
        });
    }

    std::wstring base(const wchar_t* name) const
    {
        return dir.wide("base") + name;
    }

    std::wstring ws(const wchar_t* name = L"") const
    {
        return dir.wide("ws") + name;
    }

    // How many starts the shutdown log has recorded.
    long starts() const
    {
        const std::string log = dir.read("ws/logs/shutdown.log");
        return std::count(log.begin(), log.end(), '\n');
    }

    TempDir dir;
    Props user;
    Props launcher;
    VmargMap vmargs = {{L"vmarg.a", L"-Xa"}};
};
} // namespace

TEST(getUserCmdString, OrderOfTheNativeKind)
{
    Assembly assembly;
    EXPECT_EQ(assembly.command(Line({L"velmora", L"-u", L"-vmargs", L"-Xu"})),
              (Texts{assembly.base(L"/linux/x86/eclipse"),
                     L"--launcher.suppressErrors",
                     L"-u",
                     L"-data",
                     assembly.ws(),
                     L"-configuration",
                     assembly.ws(L"/.config"),
                     L"-application",
                     L"app",
                     L"-vm",
                     L"/jvm/java",
                     L"-startup",
                     assembly.base(L"/launcher.jar"),
                     L"-vmargs",
                     L"-Xu",
                     L"-Xa",
                     L"-Drcp.home=/opt/app",
                     L"-Drcp.data=" + assembly.ws(),
                     L"-Dcom.vantor.rcp.install.id=1234",
                     L"-Drcp.install.config=user",
                     L"-Dd=1",
                     L"-Drcp.osgi.install.area=/opt/app/rcp/eclipse",
                     L"-Xx2",
                     L"-cp",
                     L"/cp.jar"}));
}

TEST(getUserCmdString, PutsTheDaemonWordsBetweenTheVmAndTheArchive)
{
    Assembly assembly;
    setMainProcess(false);
    const Texts command = assembly.command(Line({L"velmora"}));
    const Texts::const_iterator vm = std::find(command.begin(), command.end(), L"-vm");
    ASSERT_GE(command.end() - vm, 5);
    // The number that was read last from a lock file, of which there was none.
    EXPECT_EQ(Texts(vm, vm + 5), (Texts{L"-vm", L"/jvm/java", L"-useDaemon", L"0", L"-startup"}));
    bDaemon = false;
}

TEST(getUserCmdString, OrderOfTheDirectKind)
{
    for (int configuration : {CONFIG_SERVICE, CONFIG_MU_SERVICE}) {
        Assembly assembly;
        eConfig = configuration;
        const bool forced = configuration == CONFIG_MU_SERVICE;
        const std::wstring home = L"/opt/app/eclipse/";
        const std::wstring ws = home + (forced ? L".muservice" : L".workspace");
        EXPECT_EQ(
            assembly.command(Line({L"velmora", L"-u", L"-vmargs", L"-Xu"})),
            (Texts{L"/jvm/java",
                   L"-Xu",
                   L"-Xa",
                   L"-Drcp.home=/opt/app",
                   L"-Drcp.data=" + ws,
                   L"-Dcom.vantor.rcp.install.id=1234",
                   std::wstring(L"-Drcp.install.config=") + (forced ? L"multiuser" : L"service"),
                   L"-Dd=1",
                   L"-Drcp.osgi.install.area=/opt/app/rcp/eclipse",
                   L"-Xx2",
                   L"-cp",
                   forced ? assembly.base(L"/startup.jar") : L"/cp.jar",
                   L"org.eclipse.core.launcher.Main",
                   L"-nosplash",
                   L"--launcher.suppressErrors",
                   L"-u",
                   L"-data",
                   ws,
                   L"-configuration",
                   home + (forced ? L".muservice/.config" : L".config"),
                   L"-application",
                   L"app"}));
    }
}

static Texts provisioningCommand(Assembly& assembly, bool userProvisioning)
{
    return assembly.command(Line({L"velmora", L"-u"}), true, userProvisioning);
}

static Texts expectedProvisioning(const Assembly& assembly, const Texts& flag)
{
    Texts expected = {assembly.base(L"/linux/x86/eclipse"),
                      L"--launcher.suppressErrors",
                      L"-u",
                      L"-data",
                      assembly.ws(),
                      L"-configuration",
                      assembly.ws(L"/.config"),
                      L"-application",
                      L"app",
                      L"-application",
                      L"prov.app"};
    expected.insert(expected.end(), flag.begin(), flag.end());
    for (const std::wstring& word :
         Texts{L"-vm", L"/jvm/java", L"-startup", assembly.base(L"/launcher.jar"), L"-vmargs",
               L"-Xa", L"-Drcp.home=/opt/app", L"-Drcp.data=" + assembly.ws(),
               L"-Dcom.vantor.rcp.install.id=1234", L"-Drcp.install.config=user", L"-Dd=1",
               L"-Drcp.osgi.install.area=/opt/app/rcp/eclipse", L"-Xx2", L"-cp", L"/cp.jar"})
        expected.push_back(word);
    return expected;
}

TEST(getUserCmdString, OrderOfAProvisioningRun)
{
    Assembly assembly;
    EXPECT_EQ(provisioningCommand(assembly, false), expectedProvisioning(assembly, {}));
}

TEST(getUserCmdString, AUsersProvisioningRunHasItsFlag)
{
    Assembly assembly;
    EXPECT_EQ(provisioningCommand(assembly, true),
              expectedProvisioning(assembly, {L"-userProvLaunch"}));
}

TEST(getUserCmdString, DecisionAnAbsentProvisioningApplicationIsAnEmptyWord)
{
    Assembly assembly;
    assembly.launcher.list[2][0] = L'x'; // it has another key now
    Texts expected = expectedProvisioning(assembly, {L"-userProvLaunch"});
    *std::find(expected.begin(), expected.end(), L"prov.app") = L"";
    EXPECT_EQ(provisioningCommand(assembly, true), expected);
}

TEST(getUserCmdString, AProvisioningRunIsNativeAndHasNoDaemonWords)
{
    Assembly assembly;
    setMainProcess(false);
    const Texts command = provisioningCommand(assembly, false);
    EXPECT_EQ(std::count(command.begin(), command.end(), L"-useDaemon"), 0);
}

TEST(getUserCmdString, UserProvisioningAloneHasNoEffect)
{
    Assembly assembly;
    const Texts without = assembly.command(Line({L"velmora"}), false, false);
    EXPECT_EQ(assembly.command(Line({L"velmora"}), false, true), without);
}

TEST(getUserCmdString, SetsTheChildsEnvironment)
{
    for (bool provisioning : {false, true}) {
        Assembly assembly;
        unsetenv("VELMORA_A");
        unsetenv("JAVA_HIGH_ZIPFDS");
        assembly.command(Line({L"velmora"}), provisioning);
        EXPECT_STREQ(getenv("LD_LIBRARY_PATH"), "/lib");
        EXPECT_STREQ(getenv("VELMORA_A"), "a");
        EXPECT_STREQ(getenv("JAVA_HIGH_ZIPFDS"), "500");
    }
}

TEST(getUserCmdString, TheZipLimitIsSetBehindTheNamedVariables)
{
    Assembly assembly;
    appendProperty(assembly.user.list, L"env.set.JAVA_HIGH_ZIPFDS", L"1");
    assembly.command(Line({L"velmora"}));
    EXPECT_STREQ(getenv("JAVA_HIGH_ZIPFDS"), "500");
}

TEST(getUserCmdString, TheBuildersSeeEveryWordWithTheChangedOnesReplaced)
{
    Assembly assembly;
    const Line line(
        {L"velmora", L"${rcp.home}/a", L"same", L"${workspace.location}", L"${prop.name}"});
    const Texts command = assembly.command(line);
    EXPECT_EQ(Texts(command.begin() + 2, command.begin() + 6),
              (Texts{L"/opt/app/a", L"same", assembly.ws(), L"${prop.name}"}));
    // The words themselves stay as they were.
    EXPECT_EQ(texts(line.pointers), (Texts{L"velmora", L"${rcp.home}/a", L"same",
                                           L"${workspace.location}", L"${prop.name}"}));
}

TEST(getUserCmdString, ResolvesThePropertiesBeforeTheMap)
{
    Assembly assembly;
    assembly.vmargs[L"vmarg.a"] = L"-Da=${prop.application}${rcp.data}";
    const Texts command = assembly.command(Line({L"velmora"}));
    EXPECT_EQ(std::count(command.begin(), command.end(), L"-Da=app" + assembly.ws()), 1);
    EXPECT_STREQ(findProperty(L"application", assembly.user.list), L"app");
}

TEST(getUserCmdString, RecordsTheStartInTheMainProcessOnly)
{
    Assembly assembly;
    assembly.command(Line({L"velmora"}));
    EXPECT_EQ(assembly.starts(), 1);
    setMainProcess(false);
    assembly.command(Line({L"velmora"}));
    EXPECT_EQ(assembly.starts(), 1);
    bDaemon = false;
}

// An assembly with a directory of shared classes and these levels; null for none.
static void setLevels(Assembly& assembly, const wchar_t* user, const wchar_t* launcher)
{
    assembly.dir.write("shared/deep/file", "");
    appendProperty(assembly.user.list, L"jvm.shareclasses.fullpath",
                   assembly.dir.wdir + L"\\shared");
    if (user != nullptr)
        appendProperty(assembly.user.list, L"provisioning.manifest.version", user);
    if (launcher != nullptr)
        appendProperty(assembly.launcher.list, L"provisioning.manifest.version", launcher);
}

TEST(getUserCmdString, EmptiesTheSharedClassesOnANewLevel)
{
    for (const wchar_t* user : {static_cast<const wchar_t*>(nullptr), L"1"}) {
        Assembly assembly;
        setLevels(assembly, user, L"2");
        EXPECT_EQ(logOf(false, [&] { assembly.command(Line({L"velmora"})); }), "");
        EXPECT_TRUE(fs::is_empty(assembly.dir.path("shared")));
    }
}

TEST(getUserCmdString, ADaemonProcessEmptiesTheSharedClassesToo)
{
    Assembly assembly;
    setLevels(assembly, nullptr, L"2");
    setMainProcess(false);
    assembly.command(Line({L"velmora"}));
    EXPECT_TRUE(fs::is_empty(assembly.dir.path("shared")));
    bDaemon = false;
}

TEST(getUserCmdString, KeepsTheSharedClassesOnTheSameLevel)
{
    Assembly assembly;
    setLevels(assembly, L"2", L"2");
    assembly.command(Line({L"velmora"}));
    EXPECT_TRUE(assembly.dir.has("shared/deep/file"));
}

TEST(getUserCmdString, HasNothingToSayWithoutSharedClasses)
{
    Assembly none;
    EXPECT_EQ(logOf(false, [&] { none.command(Line({L"velmora"})); }), "");
    Assembly missing;
    appendProperty(missing.user.list, L"jvm.shareclasses.fullpath", L"/nowhere/at/all");
    EXPECT_EQ(logOf(false, [&] { missing.command(Line({L"velmora"})); }), "");
}

TEST(getUserCmdString, AlwaysLogsWhatOfTheSharedClassesCouldNotBeRemovedAndGoesOn)
{
    Assembly assembly;
    setLevels(assembly, nullptr, L"2");
    const std::string shared = assembly.dir.path("shared");
    fs::remove_all(shared + "/deep");
    fs::create_symlink("/nowhere", shared + "/link");
    Texts command;
    EXPECT_EQ(
        logOf(false, [&] { command = assembly.command(Line({L"velmora"})); }),
        "\nQVMRL0086I begin: Information collected while removing shared classes directory\n"
        "Can't stat " +
            shared +
            "/link  -  Failed with error 2: No such file or directory\n"
            "\nQVMRL0087I end: Unable to remove all files in the shared classes directory.\n");
    EXPECT_FALSE(command.empty());
}

TEST(getUserCmdString, EndsForAPropertyThatCannotBeResolved)
{
    Assembly assembly;
    appendProperty(assembly.user.list, L"arg1", L"-x${prop.nosuch}");
    EXPECT_TRUE(fatalLineHolds([&] { assembly.command(Line({L"velmora"})); },
                               "QVMRL0088E: property substitution is invalid "
                               "(-x${prop.nosuch}) : "));
}
