#include "launcher/user_area/user_properties.h"

#include "launcher/user_area/first_launch.h"
#include "launcher/user_area/installation.h"
#include "tests/unit/fixtures.h"
#include "tests/unit/separate_process.h"

#include <cerrno>
#include <csignal>
#include <filesystem>
#include <sys/inotify.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

namespace fs = std::filesystem;

static const char* const USER_FILE = "ws/.config/rcpinstall.properties";

namespace {
// A base location and a user's configuration location.
struct World {
    World()
    {
        eConfig = CONFIG_USER;
        userFirstLaunch = false;
        dir.makeDir("ws/.config");
        dir.makeDir("base");
    }

    std::wstring create(const Props& props) const
    {
        return createRCPInstallProps(dir.wide("ws"), dir.wide("ws/.config"), dir.wide("base"),
                                     L"/opt/app", props.list);
    }

    TempDir dir;
};
} // namespace

static const std::initializer_list<const wchar_t*> REQUIRED = {
    L"rcp.install.id", L"1234", L"rcp.base.location", L"/base", L"install.configuration", L"user"};

static const char* const BLOCK =
    "rcp.install.id=1234\nrcp.base.location=/base\ninstall.configuration=user\n";

// The user's file that this base file gives, without the block.
static std::string linesOf(const std::string& baseFile)
{
    const World world;
    world.dir.write("base/rcpinstall.properties", baseFile);
    world.create(Props(REQUIRED));
    const std::string whole = world.dir.read(USER_FILE);
    const std::string block = BLOCK;
    EXPECT_GE(whole.size(), block.size());
    EXPECT_EQ(whole.substr(whole.size() - block.size()), block);
    return whole.substr(0, whole.size() - block.size());
}

// The block for these properties.
static std::string blockOf(std::initializer_list<const wchar_t*> properties)
{
    const World world;
    world.dir.write("base/rcpinstall.properties", "");
    world.create(Props(properties));
    return world.dir.read(USER_FILE);
}

TEST(createConfigIni, CopiesTheInstallationsFileAndMarksTheFirstLaunch)
{
    const World world;
    world.dir.write("base/config.ini", "a=b\n\n  c\n");
    createConfigIni(world.dir.wide("ws/.config"), world.dir.wide("base"));
    EXPECT_EQ(world.dir.read("ws/.config/config.ini"), "a=b\n\n  c\n");
    EXPECT_TRUE(userFirstLaunch);
    EXPECT_FALSE(world.dir.has("ws/.config/config.ini.part"));
}

TEST(createConfigIni, PrefersTheVariantOfTheConfiguration)
{
    const World world;
    world.dir.write("base/config.ini", "base");
    world.dir.write("base/config/user/config.ini", "user");
    createConfigIni(world.dir.wide("ws") + L"\\.config", world.dir.wide("base"));
    EXPECT_EQ(world.dir.read("ws/.config/config.ini"), "user");
}

TEST(createConfigIni, NeverRefreshesTheUsersCopy)
{
    const World world;
    world.dir.write("base/config.ini", "new");
    world.dir.write("ws/.config/config.ini", "old");
    createConfigIni(world.dir.wide("ws/.config"), world.dir.wide("base"));
    EXPECT_EQ(world.dir.read("ws/.config/config.ini"), "old");
    EXPECT_FALSE(userFirstLaunch);
}

TEST(createConfigIni, EndsWithoutTheInstallationsFile)
{
    const World world;
    EXPECT_TRUE(
        endsWith([&] { createConfigIni(world.dir.wide("ws/.config"), world.dir.wide("base")); },
                 "QVMRL0190E: Unable to open source file " + world.dir.path("base/config.ini") +
                     " to be copied",
                 ENOENT));
    EXPECT_FALSE(world.dir.has("ws/.config/config.ini"));
}

TEST(createConfigIni, EndsWhenTheCopyCannotGetItsName)
{
    const World world;
    world.dir.write("base/config.ini", "a=1\n");
    EXPECT_TRUE(endsWith(
        [&] {
            ASSERT_TRUE(makeFail(SYS_rename, EIO));
            createConfigIni(world.dir.wide("ws/.config"), world.dir.wide("base"));
        },
        "QVMRL0009E: Unable to copy config.ini to the user directory.", EIO));
    EXPECT_TRUE(fs::is_empty(world.dir.path("ws/.config")));
}

TEST(createConfigIni, LeavesNothingBehindWhenTheDiskIsFull)
{
    const World world;
    world.dir.write("base/config.ini", std::string(20000, 'x'));
    const Ended ended = runAside(world.dir, false, [&] {
        limitFileSize(8192);
        createConfigIni(world.dir.wide("ws/.config"), world.dir.wide("base"));
        return std::string("no end");
    });
    EXPECT_EQ(ended.status, 255);
    EXPECT_EQ(ended.log, "QVMRL0192E: Encountered error copying file contents : File too large\n");
    EXPECT_TRUE(fs::is_empty(world.dir.path("ws/.config")));
}

TEST(createRCPInstallProps, WritesTheLinesAndTheBlockAndMarksTheFirstLaunch)
{
    const World world;
    world.dir.write("base/rcpinstall.properties", "# a comment\nkey=value\n");
    EXPECT_EQ(world.create(Props(REQUIRED)), world.dir.wide(USER_FILE));
    EXPECT_EQ(world.dir.read(USER_FILE), std::string("# a comment\nkey=value\n") + BLOCK);
    EXPECT_TRUE(userFirstLaunch);
}

TEST(createRCPInstallProps, LeavesNoOtherFileBehind)
{
    const World world;
    world.dir.write("base/rcpinstall.properties", "key=value\n");
    world.create(Props(REQUIRED));
    EXPECT_EQ(std::distance(fs::directory_iterator(world.dir.path("ws/.config")),
                            fs::directory_iterator()),
              1);
}

TEST(createRCPInstallProps, NeverRewritesTheUsersFile)
{
    const World world;
    world.dir.write("base/rcpinstall.properties", "new=1\n");
    world.dir.write(USER_FILE, "old=1");
    EXPECT_EQ(world.create(Props({})), world.dir.wide(USER_FILE));
    EXPECT_EQ(world.dir.read(USER_FILE), "old=1");
    EXPECT_FALSE(userFirstLaunch);
}

TEST(createRCPInstallProps, EndsWithoutTheInstallationsFile)
{
    const World world;
    EXPECT_TRUE(endsWith([&] { world.create(Props(REQUIRED)); },
                         "QVMRL0190E: Unable to open source file " +
                             world.dir.path("base/rcpinstall.properties") + " to be copied",
                         ENOENT));
    EXPECT_FALSE(world.dir.has(USER_FILE));
}

TEST(createRCPInstallProps, WritesTheBlockInItsOrder)
{
    EXPECT_EQ(blockOf({L"com.vantor.rcp.core.bidi", L"on", L"com.vantor.rcp.core.locale", L"de",
                       L"install.configuration", L"user", L"rcp.base.location", L"/base",
                       L"jvm.location", L"/jvm", L"rcp.install.id", L"1234"}),
              "rcp.install.id=1234\nvm=/jvm\nrcp.base.location=/base\ninstall.configuration=user\n"
              "com.vantor.rcp.core.locale=de\ncom.vantor.rcp.core.bidi=on\n");
}

TEST(createRCPInstallProps, HasNoVmForAnEmptyJvmLocation)
{
    EXPECT_EQ(blockOf({L"rcp.install.id", L"1234", L"rcp.base.location", L"/base", L"jvm.location",
                       L"", L"install.configuration", L"user", L"com.vantor.rcp.core.locale", L"",
                       L"com.vantor.rcp.core.bidi", L""}),
              std::string(BLOCK) + "com.vantor.rcp.core.locale=\ncom.vantor.rcp.core.bidi=\n");
}

TEST(createRCPInstallProps, TurnsAndEscapesTheTwoPathsAlone)
{
    EXPECT_EQ(blockOf({L"rcp.install.id", L"a\\b=\x00e9", L"jvm.location", L"C:\\jre\\\x00e9",
                       L"rcp.base.location", L"/b=\\!", L"install.configuration", L"a\\:b"}),
              "rcp.install.id=a\\b=\xc3\xa9\nvm=C\\:/jre/\\u00e9\nrcp.base.location=/b\\=/\\!\n"
              "install.configuration=a\\:b\n");
}

TEST(createRCPInstallProps, TheBlockIsItsOwnFormat)
{
    EXPECT_EQ(blockOf({L"rcp.install.id", L"50%%a%20n%sb%y", L"rcp.base.location", L"/x%%y",
                       L"install.configuration", L"user"}),
              "rcp.install.id=50%ab%y\nrcp.base.location=/x%y\ninstall.configuration=user\n");
}

TEST(createRCPInstallProps, CopiesPerCentSignsOfTheLinesAsTheyStand)
{
    EXPECT_EQ(linesOf("a=50%%%s%n\n"), "a=50%%%s%n\n");
}

TEST(createRCPInstallProps, DropsTheLinesOfOtherSystems)
{
    EXPECT_EQ(linesOf("a.linux=1\nb.win32=2\nc.macosx=3\nd.x=4\n-De.win32=5\n"),
              "a=1\nd.x=4\n-De.win32=5\n");
}

TEST(createRCPInstallProps, DropsTheContinuationOfADroppedLine)
{
    EXPECT_EQ(linesOf("a.win32=1\\\nmore.linux=2\\\nlast\nb=3\n"), "b=3\n");
}

TEST(createRCPInstallProps, KeepsTheContinuationOfAKeptLineUnjudged)
{
    EXPECT_EQ(linesOf("a.linux=1\\\nb.win32=2\\\n#c\nd.win32=3\ne=4\n"),
              "a=1\\\nb.win32=2\\\n#c\ne=4\n");
}

TEST(createRCPInstallProps, KeepsCommentsWhichNeverContinue)
{
    EXPECT_EQ(linesOf("# a.win32=1\\\nb.win32=2\n! c\\\nd=3\n"), "# a.win32=1\\\n! c\\\nd=3\n");
}

TEST(createRCPInstallProps, AnEvenNumberOfBackslashesContinuesNothing)
{
    EXPECT_EQ(linesOf("a.win32=1\\\\\nb=2\nc=3\\\\\nd.win32=4\n"), "b=2\nc=3\\\\\n");
}

TEST(createRCPInstallProps, DropsBlankLinesAndIndentation)
{
    EXPECT_EQ(linesOf("\n\n  a=1\n\n    b=2\n\n"), "a=1\nb=2\n");
}

TEST(createRCPInstallProps, SplitsALineOfMoreThan2024Bytes)
{
    const std::string full = "a=" + std::string(2022, 'x');
    EXPECT_EQ(linesOf(full + "\nb=1\n"), full + "\nb=1\n");
    EXPECT_EQ(linesOf(full + "y\nb=1\n"), full + "\ny\nb=1\n");
}

TEST(createRCPInstallProps, PiecesThatCutACharacterInTwoAreEmptyLines)
{
    // The first piece ends behind byte 2024, the first of the two of U+00E9; the second piece
    // begins with the other.
    EXPECT_EQ(linesOf("a=" + std::string(2021, 'x') + "\xc3\xa9yy\nb=1\n"), "\n\nb=1\n");
}

TEST(createRCPInstallProps, EndsWhenARequiredValueIsMissing)
{
    const std::vector<std::wstring> all(REQUIRED.begin(), REQUIRED.end());
    for (size_t missing = 0; missing < all.size(); missing += 2) {
        std::vector<std::wstring> rest = all;
        rest.erase(rest.begin() + static_cast<long>(missing),
                   rest.begin() + static_cast<long>(missing) + 2);
        const World world;
        world.dir.write("base/rcpinstall.properties", "  a.linux=1\n\nb.win32=2\n");
        EXPECT_TRUE(
            fatalLineHolds([&] { world.create(Props(rest)); },
                           "QVMRL0008E: Unable to calculate necessary values for user specific "
                           "rcpinstall.properties file. : "));
        // The plain copy stays as the user's file, and the line copy is left behind.
        EXPECT_EQ(world.dir.read(USER_FILE), "  a.linux=1\n\nb.win32=2\n");
        EXPECT_EQ(world.dir.read(std::string(USER_FILE) + ".new"), "a=1\n");
    }
}

// What is left of REQUIRED without the configuration.
static const std::initializer_list<const wchar_t*> INCOMPLETE = {L"rcp.install.id", L"abc",
                                                                 L"rcp.base.location", L"/base"};

TEST(createRCPInstallProps, WithoutARequiredValueAPlainCopyThatCannotBeMadeLeavesNothing)
{
    const World world;
    world.dir.write("base/rcpinstall.properties", "a=1\n\xa9");
    EXPECT_TRUE(fatalLineHolds([&] { world.create(Props(INCOMPLETE)); },
                               "QVMRL0193E: Did not encounter EOF while copying file contents"));
    EXPECT_TRUE(fs::is_empty(world.dir.path("ws/.config")));
}

TEST(createRCPInstallProps, EndsWhenThePlainCopyCannotGetItsName)
{
    const World world;
    world.dir.write("base/rcpinstall.properties", "a=1\n");
    EXPECT_TRUE(endsWith(
        [&] {
            ASSERT_TRUE(makeFail(SYS_rename, EIO));
            world.create(Props(INCOMPLETE));
        },
        "QVMRL0022E: Unable to copy rcpinstall.properties to the user directory.", EIO));
    EXPECT_TRUE(fs::is_empty(world.dir.path("ws/.config")));
}

// The name of the first file in `dir` that somebody has written and closed, while `child` runs.
static std::string firstWritten(int watch)
{
    alignas(struct inotify_event) char bytes[4096];
    if (read(watch, bytes, sizeof bytes) <= 0)
        return "";
    return reinterpret_cast<const struct inotify_event*>(bytes)->name;
}

TEST(createRCPInstallProps, KilledBeforeTheRewritingLeavesNothingThatALaterStartBelieves)
{
    const World world;
    world.dir.write("base/rcpinstall.properties", "a.win32=1\n");
    // The rewriting waits for somebody to read what it writes, which nobody does.
    const std::string newFile = world.dir.path(std::string(USER_FILE) + ".new");
    ASSERT_EQ(mkfifo(newFile.c_str(), 0600), 0);
    const int watch = inotify_init1(IN_CLOEXEC);
    inotify_add_watch(watch, world.dir.path("ws/.config").c_str(), IN_CLOSE_WRITE);
    fflush(nullptr);
    const pid_t child = fork();
    if (child == 0) {
        world.create(Props(REQUIRED));
        _exit(1);
    }
    EXPECT_EQ(firstWritten(watch), "rcpinstall.properties.part");
    kill(child, SIGKILL);
    int status = 0;
    waitpid(child, &status, 0);
    close(watch);
    EXPECT_TRUE(WIFSIGNALED(status));
    EXPECT_FALSE(world.dir.has(USER_FILE));
    fs::remove(newFile);
    world.create(Props(REQUIRED));
    EXPECT_EQ(world.dir.read(USER_FILE), BLOCK);
}

// fixUserRCPInstallProperties for these two places.
static int fixed(const World& world, const char* from, const char* to)
{
    std::wstring userPath = world.dir.wide(from);
    std::wstring newPath = world.dir.wide(to);
    const Props props(REQUIRED);
    return fixUserRCPInstallProperties(L"/ws", userPath, newPath, L"/opt/app", props.list);
}

static const char* const CANNOT_OPEN =
    "QVMRL0074E: Unable to open user specific rcpinstall.properties and temporary "
    "rcpinstall.properties files.\n";

TEST(fixUserRCPInstallProperties, WritesTheNewFileAndLeavesTheOld)
{
    const World world;
    world.dir.write("a", "x.linux=1\n");
    EXPECT_EQ(fixed(world, "a", "b"), 0);
    EXPECT_EQ(world.dir.read("a"), "x.linux=1\n");
    EXPECT_EQ(world.dir.read("b"), std::string("x=1\n") + BLOCK);
}

TEST(fixUserRCPInstallProperties, ConvertsBothPathsInPlace)
{
    const World world;
    world.dir.write("d/a", "");
    std::wstring userPath = world.dir.wdir + L"\\d\\a";
    std::wstring newPath = world.dir.wdir + L"\\d\\b";
    const Props props(REQUIRED);
    EXPECT_EQ(fixUserRCPInstallProperties(L"", userPath, newPath, L"", props.list), 0);
    EXPECT_EQ(userPath, world.dir.wide("d/a"));
    EXPECT_EQ(newPath, world.dir.wide("d/b"));
}

TEST(fixUserRCPInstallProperties, MakesAnEmptyNewFileWhenOnlyTheInputIsMissing)
{
    const World world;
    EXPECT_EQ(logOf(false, [&] { EXPECT_EQ(fixed(world, "missing", "b"), -1); }), CANNOT_OPEN);
    EXPECT_TRUE(world.dir.has("b"));
    EXPECT_EQ(world.dir.read("b"), "");
}

TEST(fixUserRCPInstallProperties, LogsAnOutputThatCannotBeOpened)
{
    const World world;
    world.dir.write("a", "x=1\n");
    world.dir.makeDir("b");
    EXPECT_EQ(logOf(false, [&] { EXPECT_EQ(fixed(world, "a", "b"), -1); }), CANNOT_OPEN);
    EXPECT_EQ(world.dir.read("a"), "x=1\n");
}

TEST(createRCPInstallProps, LeavesNoUserFileWhenTheNewOneCannotBeOpened)
{
    const World world;
    world.dir.write("base/rcpinstall.properties", "a=1\n");
    // A link to a place that cannot be: the rewriting cannot open it; it is then moved into place.
    fs::create_symlink(world.dir.path("missing/x"),
                       world.dir.path(std::string(USER_FILE) + ".new"));
    EXPECT_EQ(logOf(false, [&] { world.create(Props(REQUIRED)); }), CANNOT_OPEN);
    EXPECT_FALSE(fs::exists(world.dir.path(USER_FILE)));
    EXPECT_TRUE(userFirstLaunch);
}

TEST(fixUserRCPInstallProperties, LogsABlockThatCannotBeWritten)
{
    const World world;
    world.dir.write("a", "");
    fs::create_symlink("/dev/full", world.dir.path("b"));
    EXPECT_EQ(logOf(false, [&] { EXPECT_EQ(fixed(world, "a", "b"), 0); }),
              "QVMRL0015E: Unable to append values to user specific rcpinstall.properties "
              "file.\n");
}

TEST(fixUserRCPInstallProperties, LogsALineThatCannotBeWrittenAndGoesOn)
{
    const World world;
    std::string lines;
    for (int i = 0; i < 1000; ++i)
        lines += "a=" + std::string(100, 'x') + "\n";
    world.dir.write("a", lines);
    fs::create_symlink("/dev/full", world.dir.path("b"));
    const std::string log = logOf(false, [&] { EXPECT_EQ(fixed(world, "a", "b"), 0); });
    const std::string line = "QVMRL0001E: Error while copying base rcpinstall.properties to user "
                             "specific rcpinstall.properties file.\n";
    EXPECT_EQ(log.substr(0, line.size()), line);
    EXPECT_NE(log.find(line, line.size()), std::string::npos);
    const std::string last = "QVMRL0015E: Unable to append values to user specific "
                             "rcpinstall.properties file.\n";
    EXPECT_EQ(log.substr(log.size() - last.size()), last);
}
