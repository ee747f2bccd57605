#include "launcher/user_area/locations.h"

#include "diag/SvcDebug_linux.h"
#include "launcher/user_area/installation.h"
#include "platform/linux/wide_strings.h"
#include "tests/unit/fixtures.h"

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <filesystem>

namespace fs = std::filesystem;

static std::string narrow(const std::wstring& text)
{
    return std::string(text.begin(), text.end());
}

static std::wstring wide(const std::string& text)
{
    return std::wstring(text.begin(), text.end());
}

static const InstalledJob RCP_DIRECTORY("RCPDirectory", [](const std::string&) {
    wchar_t* dir = getRCPDirectory(0, nullptr);
    const std::string result = dir == nullptr ? "(null)" : narrow(dir);
    freeString(dir);
    return result;
});

static const InstalledJob INSTALL_DIR("InstallDir", [](const std::string& world) {
    enableLogging(wide(world));
    std::wstring out = L"before";
    getInstallDir(out, 0, nullptr);
    return narrow(out);
});

static const InstalledJob REMOVED_DIR("RemovedDir", [](const std::string& world) {
    enableLogging(wide(world));
    fs::remove_all(world + "/rcp");
    std::wstring out = L"before";
    getInstallDir(out, 0, nullptr);
    return narrow(out);
});

static const InstalledJob SERVICE_DIR("ServiceDir", [](const std::string& world) {
    enableLogging(wide(world));
    Line line({L"/the/program"});
    std::wstring nearDir = L"none";
    std::wstring farDir = L"none";
    getServiceInstallDir(nearDir, farDir, line.argc, line.argv);
    return narrow(nearDir + L" " + farDir);
});

TEST(getRCPDirectory, IsTheDirectoryOfTheExecutable)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const TempDir world;
    EXPECT_EQ(runInstalled(world, "any/velmora", "RCPDirectory").result, world.path("any"));
}

TEST(getInstallDir, IsTheParentOfADirectoryNamedRcp)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const TempDir world;
    EXPECT_EQ(runInstalled(world, "opt/app/rcp/velmora", "InstallDir").result,
              world.path("opt/app"));
}

TEST(getInstallDir, IsEmptyElsewhereWithoutAMessage)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    for (const char* place : {"app/bin/velmora", "app/RCP/velmora", "app/xrcp/velmora"}) {
        const TempDir world;
        const Ended ended = runInstalled(world, place, "InstallDir");
        EXPECT_EQ(ended.status, 0);
        EXPECT_EQ(ended.result, "");
        EXPECT_EQ(world.read("velmora.log"), "\n");
    }
}

TEST(getInstallDir, EndsWhenTheExecutablesDirectoryIsGone)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const TempDir world;
    const Ended ended = runInstalled(world, "rcp/velmora", "RemovedDir");
    EXPECT_EQ(ended.status, 255);
    EXPECT_EQ(world.read("velmora.log"),
              "\nQVMRL0049E: Unable to locate the platform's installation directory : "
              "No such file or directory\n");
}

TEST(getServiceInstallDir, GivesTheSecondAndTheSixthAncestor)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const TempDir world;
    EXPECT_EQ(runInstalled(world, "6/5/4/3/2/1/rcp/velmora", "ServiceDir").result,
              world.path("6/5/4/3/2") + " " + world.path("6"));
}

TEST(getServiceInstallDir, EndsWhenThePathRunsOutOfSlashes)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const TempDir world;
    const std::string dir = world.path("rcp");
    if (std::count(dir.begin(), dir.end(), '/') > 6)
        GTEST_SKIP() << "TMPDIR has so many levels that the path does not run out of them";
    const Ended ended = runInstalled(world, "rcp/velmora", "ServiceDir");
    EXPECT_EQ(ended.status, 255);
    const std::string log = world.read("velmora.log");
    const std::string line =
        "\nQVMRL0048E: Unable to locate the directory containing /the/program : ";
    EXPECT_EQ(log.substr(0, line.size()), line);
}

// Where below `world` an executable lies whose directory has this many components; empty when the
// world itself has too many.
static std::string placeWithComponents(const TempDir& world, long components)
{
    const fs::path dir = fs::canonical(world.dir).relative_path();
    std::string place;
    for (long i = std::distance(dir.begin(), dir.end()) + 1; i <= components; ++i)
        place += std::to_string(i) + "/";
    return place.empty() ? "" : place + "velmora";
}

TEST(getServiceInstallDir, SixComponentsLeaveNothingForTheSixthAncestor)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const TempDir world;
    const std::string place = placeWithComponents(world, 6);
    if (place.empty())
        GTEST_SKIP() << "TMPDIR has six levels or more";
    const Ended ended = runInstalled(world, place, "ServiceDir");
    EXPECT_EQ(ended.status, 255);
    EXPECT_EQ(world.read("velmora.log"),
              "\nQVMRL0048E: Unable to locate the directory containing /the/program : "
              "No such file or directory\n");
}

TEST(getServiceInstallDir, SevenComponentsLeaveTheFirst)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const TempDir world;
    const std::string place = placeWithComponents(world, 7);
    if (place.empty())
        GTEST_SKIP() << "TMPDIR has seven levels or more";
    const fs::path dir = (fs::canonical(world.dir) / place).parent_path();
    const std::string first = "/" + dir.relative_path().begin()->string();
    EXPECT_EQ(runInstalled(world, place, "ServiceDir").result,
              dir.parent_path().parent_path().string() + " " + first);
}

namespace {
struct Location {
    std::wstring path;
    int result;

    bool operator==(const Location& other) const
    {
        return path == other.path && result == other.result;
    }
};

std::ostream& operator<<(std::ostream& out, const Location& location)
{
    return out << narrow(location.path) << " " << location.result;
}
} // namespace

static Location workspaceOf(const Line& line, const Props& props)
{
    Location location = {L"before", -1};
    location.result =
        getWorkspaceLocation(location.path, props.list, line.argc, line.argv, L"/opt/app");
    return location;
}

static Location configurationOf(const Line& line, const Props& props)
{
    Location location = {L"before", -1};
    location.result =
        getConfigurationLocation(location.path, props.list, line.argc, line.argv, L"/opt/app");
    return location;
}

// Sets HOME and USER to anna's.
static void beAnna()
{
    setenv("HOME", "/home/anna", 1);
    setenv("USER", "anna", 1);
    eConfig = CONFIG_USER;
}

TEST(getWorkspaceLocation, IsFixedForTheServiceConfigurations)
{
    const Line line({L"velmora", L"-data", L"/w"});
    const Props props({L"rcp.data", L"${prop.nosuch}"});
    eConfig = CONFIG_SERVICE;
    EXPECT_EQ(workspaceOf(line, props), (Location{L"/opt/app/eclipse/.workspace", 1}));
    eConfig = CONFIG_MU_SERVICE;
    EXPECT_EQ(workspaceOf(line, props), (Location{L"/opt/app/eclipse/.muservice", 1}));
}

TEST(getWorkspaceLocation, TakesTheWordBehindDataInEveryOtherConfiguration)
{
    const Props props({L"rcp.data", L"/p"});
    for (int configuration : {CONFIG_LOCKDOWN, CONFIG_USER, CONFIG_SERIAL_MULTIUSER, CONFIG_OTHER,
                              CONFIG_MULTIUSER, CONFIG_USERPB}) {
        eConfig = configuration;
        EXPECT_EQ(workspaceOf(Line({L"velmora", L"-data", L"/w"}), props), (Location{L"/w", 1}));
    }
}

static std::wstring dataGives(const wchar_t* value)
{
    eConfig = CONFIG_USER;
    const Location location = workspaceOf(
        Line({L"velmora", L"-data", value}),
        Props({L"name", L"n", L"slash", L"x/", L"h", L"${rcp.home}", L"rcp.data", L"/p"}));
    EXPECT_EQ(location.result, 1);
    return location.path;
}

TEST(getWorkspaceLocation, DropsOneSeparatorAtTheEndOfData)
{
    EXPECT_EQ(dataGives(L"/home/anna/ws/"), L"/home/anna/ws");
    EXPECT_EQ(dataGives(L"/home/anna/ws\\"), L"/home/anna/ws");
    EXPECT_EQ(dataGives(L"a//"), L"a/");
    EXPECT_EQ(dataGives(L"/"), L"");
    EXPECT_EQ(dataGives(L""), L"");
}

TEST(getWorkspaceLocation, ReplacesTheFirstRcpHomeOfData)
{
    EXPECT_EQ(dataGives(L"${rcp.home}/ws"), L"/opt/app/ws");
    // The second one is no user placeholder: it stays.
    EXPECT_EQ(dataGives(L"${rcp.home}/${rcp.home}"), L"/opt/app/${rcp.home}");
}

TEST(getWorkspaceLocation, ResolvesTheUserPlaceholdersOfDataAndIgnoresAFailure)
{
    setenv("VELMORA_X", "v", 1);
    EXPECT_EQ(dataGives(L"/${env.VELMORA_X}/${prop.name}"), L"/v/n");
    EXPECT_EQ(dataGives(L"/${prop.nosuch}"), L"/${prop.nosuch}");
}

TEST(getWorkspaceLocation, DropsTheSeparatorOfDataBeforeAnythingIsReplaced)
{
    EXPECT_EQ(dataGives(L"/${prop.slash}"), L"/x/");
    EXPECT_EQ(dataGives(L"/${prop.slash}/"), L"/x/");
}

TEST(getWorkspaceLocation, ReplacesRcpHomeOfDataBeforeTheUserPlaceholders)
{
    EXPECT_EQ(dataGives(L"${prop.h}/w"), L"${rcp.home}/w");
}

TEST(getWorkspaceLocation, KeepsARelativeDataAndItsBackslashes)
{
    EXPECT_EQ(dataGives(L"a\\b/c"), L"a\\b/c");
}

TEST(getWorkspaceLocation, OnlyTheFirstDataCounts)
{
    eConfig = CONFIG_USER;
    EXPECT_EQ(workspaceOf(Line({L"velmora", L"-data", L"a", L"-data", L"b"}), Props({})),
              (Location{L"a", 1}));
}

TEST(getWorkspaceLocation, DataAsTheLastWordFallsBack)
{
    beAnna();
    EXPECT_EQ(workspaceOf(Line({L"velmora", L"-data"}), Props({L"rcp.data", L"/p"})),
              (Location{L"/p", 1}));
    EXPECT_EQ(workspaceOf(Line({L"velmora", L"-data"}), Props({L"rcp.install.id", L"abc"})),
              (Location{L"/home/anna/VANTOR/RCP/abc/anna", 0}));
}

static std::wstring propertyGives(const wchar_t* value)
{
    eConfig = CONFIG_USER;
    const Location location =
        workspaceOf(Line({L"velmora"}), Props({L"slash", L"x/", L"rcp.data", value}));
    EXPECT_EQ(location.result, 1);
    return location.path;
}

TEST(getWorkspaceLocation, TakesThePropertyAndDropsOneSeparatorBehindItsPlaceholders)
{
    EXPECT_EQ(propertyGives(L"x\\"), L"x");
    EXPECT_EQ(propertyGives(L"/ws//"), L"/ws/");
    EXPECT_EQ(propertyGives(L"/${prop.slash}"), L"/x");
    EXPECT_EQ(propertyGives(L""), L"");
}

TEST(getWorkspaceLocation, EndsForAPlaceholderOfThePropertyThatCannotBeResolved)
{
    EXPECT_TRUE(endsWith(
        [] {
            eConfig = CONFIG_USER;
            errno = EACCES;
            workspaceOf(Line({L"velmora"}),
                        Props({L"a", L"1", L"rcp.data", L"/${prop.a}/${prop.nosuch}"}));
        },
        "QVMRL0099E: rcp.data property is invalid (/1/${prop.nosuch})", EACCES));
}

TEST(getWorkspaceLocation, RcpHomeInThePropertyEndsTheStart)
{
    EXPECT_TRUE(endsWith(
        [] {
            eConfig = CONFIG_USER;
            errno = EACCES;
            workspaceOf(Line({L"velmora"}), Props({L"rcp.data", L"${rcp.home}/ws"}));
        },
        "QVMRL0099E: rcp.data property is invalid (${rcp.home}/ws)", EACCES));
}

TEST(getWorkspaceLocation, IsTheUsersOwnByDefault)
{
    beAnna();
    EXPECT_EQ(workspaceOf(Line({L"velmora"}), Props({L"rcp.install.id", L"abc"})),
              (Location{L"/home/anna/VANTOR/RCP/abc/anna", 0}));
    // Neither the id nor the user is searched for placeholders.
    setenv("USER", "${rcp.home}", 1);
    EXPECT_EQ(workspaceOf(Line({L"velmora"}), Props({L"rcp.install.id", L"${prop.x}"})),
              (Location{L"/home/anna/VANTOR/RCP/${prop.x}/${rcp.home}", 0}));
}

TEST(getWorkspaceLocation, TakesAnUnsetHomeAndAnEmptyUserForNothing)
{
    beAnna();
    unsetenv("HOME");
    setenv("USER", "", 1);
    EXPECT_EQ(workspaceOf(Line({L"velmora"}), Props({L"rcp.install.id", L""})),
              (Location{L"/VANTOR/RCP//", 0}));
}

TEST(getWorkspaceLocation, EndsWithoutAnInstallIdBeforeItAsksForTheUser)
{
    EXPECT_TRUE(endsWith(
        [] {
            beAnna();
            unsetenv("USER");
            errno = EACCES;
            workspaceOf(Line({L"velmora"}), Props({}));
        },
        "QVMRL0035E: Couldn't find the rcp.install.id property!", EACCES));
}

TEST(getWorkspaceLocation, EndsWithoutAUser)
{
    EXPECT_TRUE(endsWith(
        [] {
            beAnna();
            unsetenv("USER");
            errno = EACCES;
            workspaceOf(Line({L"velmora"}), Props({L"rcp.install.id", L"abc"}));
        },
        "QVMRL0037E: Couldn't find the user name!", EACCES));
}

TEST(getConfigurationLocation, IsBesideTheServiceWorkspaceAndInTheForcedOne)
{
    const Line line({L"velmora", L"-data", L"/w"});
    eConfig = CONFIG_SERVICE;
    EXPECT_EQ(configurationOf(line, Props({})), (Location{L"/opt/app/eclipse/.config", 1}));
    eConfig = CONFIG_MU_SERVICE;
    EXPECT_EQ(configurationOf(line, Props({})),
              (Location{L"/opt/app/eclipse/.muservice/.config", 1}));
}

TEST(getConfigurationLocation, IsInTheWorkspaceWithTheWorkspacesResult)
{
    beAnna();
    EXPECT_EQ(configurationOf(Line({L"velmora", L"-data", L"/w/"}), Props({})),
              (Location{L"/w/.config", 1}));
    EXPECT_EQ(configurationOf(Line({L"velmora"}), Props({L"rcp.install.id", L"abc"})),
              (Location{L"/home/anna/VANTOR/RCP/abc/anna/.config", 0}));
}

TEST(getConfigurationLocation, EndsAsTheWorkspaceDoes)
{
    EXPECT_FATAL((beAnna(), configurationOf(Line({L"velmora"}), Props({}))), "QVMRL0035E");
}

static Texts patched(const Line& args, Props& props)
{
    patchWorkspace(args.pointers, props.list);
    return texts(props.list);
}

TEST(patchWorkspace, ReplacesTheFirstRcpDataByTheWordBehindTheFirstData)
{
    Props props({L"a", L"b", L"rcp.data", L"/old", L"rcp.data", L"/second"});
    EXPECT_EQ(patched(Line({L"-data", L"/new", L"-data", L"/other"}), props),
              (Texts{L"a", L"b", L"rcp.data", L"/new", L"rcp.data", L"/second"}));
}

TEST(patchWorkspace, MakesACopyOfTheWord)
{
    Props props({L"rcp.data", L"/old"});
    Line args({L"-data", L"/new"});
    patchWorkspace(args.pointers, props.list);
    args.owned[1][1] = L'x';
    EXPECT_STREQ(findProperty(L"rcp.data", props.list), L"/new");
}

TEST(patchWorkspace, ChangesNothingWithoutAData)
{
    Props props({L"rcp.data", L"/old"});
    EXPECT_EQ(patched(Line({L"velmora", L"/new"}), props), (Texts{L"rcp.data", L"/old"}));
    EXPECT_EQ(patched(Line({L"velmora", L"-data"}), props), (Texts{L"rcp.data", L"/old"}));
    EXPECT_EQ(patched(Line(Texts()), props), (Texts{L"rcp.data", L"/old"}));
}

TEST(patchWorkspace, AddsNothingWithoutRcpData)
{
    Props props({L"a", L"b"});
    EXPECT_EQ(patched(Line({L"-data", L"/new"}), props), (Texts{L"a", L"b"}));
}

TEST(patchWorkspace, OverwritesTheKeyBehindAValueRcpData)
{
    Props props({L"a", L"rcp.data", L"key", L"v", L"rcp.data", L"/old"});
    EXPECT_EQ(patched(Line({L"-data", L"/new"}), props),
              (Texts{L"a", L"rcp.data", L"/new", L"v", L"rcp.data", L"/old"}));
}

TEST(replaceFirstRcpHome, LeavesLaterOnes)
{
    std::wstring s = L"a${rcp.home}b${rcp.home}";
    replaceFirstRcpHome(s, L"${rcp.home}!");
    EXPECT_EQ(s, L"a${rcp.home}!b${rcp.home}");
    s = L"none";
    replaceFirstRcpHome(s, L"/x");
    EXPECT_EQ(s, L"none");
}
