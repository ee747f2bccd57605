#include "launcher/user_area/workspace_reset.h"

#include "launcher/user_area/installation.h"
#include "tests/unit/fixtures.h"
#include "tests/unit/separate_process.h"

#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace fs = std::filesystem;

typedef std::vector<std::string> Names;

// Everything below `dir`, as relative paths, sorted; links are not followed.
static Names tree(const TempDir& dir, const std::string& place = "")
{
    Names names;
    const fs::path top = place.empty() ? dir.dir : dir.path(place);
    for (const fs::directory_entry& entry : fs::recursive_directory_iterator(top))
        names.push_back(entry.path().lexically_relative(top));
    std::sort(names.begin(), names.end());
    return names;
}

static bool copied(const TempDir& dir, const wchar_t* dstName, const wchar_t* srcName)
{
    return handleCopy(dir.wdir, dstName, dir.wdir, srcName, false, false);
}

TEST(handleCopy, CopiesAFileAndLeavesTheSource)
{
    const TempDir dir;
    dir.write("src", "text\n");
    EXPECT_EQ(logOf(true, [&] { EXPECT_TRUE(copied(dir, L"dst", L"src")); }), "");
    EXPECT_EQ(dir.read("dst"), "text\n");
    EXPECT_EQ(dir.read("src"), "text\n");
}

TEST(handleCopy, MovesAFile)
{
    const TempDir dir;
    dir.write("a/src", "text");
    EXPECT_TRUE(handleCopy(dir.wdir, L"dst", dir.wdir + L"\\a", L"src", true, true));
    EXPECT_EQ(tree(dir), (Names{"a", "dst"}));
    EXPECT_EQ(dir.read("dst"), "text");
}

TEST(handleCopy, LogsAMissingOptionalSource)
{
    const TempDir dir;
    dir.write("dst", "kept");
    const std::string line = "QVMRL0110I: '" + dir.path("src") + "' not found\n";
    EXPECT_EQ(logOf(true, [&] { EXPECT_FALSE(copied(dir, L"dst", L"src")); }), line);
    EXPECT_EQ(logOf(false, [&] { EXPECT_FALSE(copied(dir, L"dst", L"src")); }), "");
    EXPECT_EQ(dir.read("dst"), "kept");
}

TEST(handleCopy, EndsWithoutASourceThatMustExist)
{
    const TempDir dir;
    EXPECT_TRUE(endsWith([&] { handleCopy(dir.wide("d"), L"", dir.wide("a"), L"b", true, true); },
                         "QVMRL0109E: Unable to locate '" + dir.path("a/b") + "' for copying",
                         ENOENT));
}

TEST(handleCopy, DeletesAFileInTheWay)
{
    const TempDir dir;
    dir.write("src", "new");
    dir.write("dst", "old and longer");
    EXPECT_TRUE(copied(dir, L"dst", L"src"));
    EXPECT_EQ(dir.read("dst"), "new");
}

TEST(handleCopy, DeletesALinkToADirectoryInTheWayAndNotTheDirectory)
{
    const TempDir dir;
    dir.write("real/file", "");
    dir.write("src", "new");
    fs::create_directory_symlink(dir.path("real"), dir.path("dst"));
    EXPECT_TRUE(copied(dir, L"dst", L"src"));
    EXPECT_EQ(tree(dir), (Names{"dst", "real", "real/file", "src"}));
    EXPECT_EQ(dir.read("dst"), "new");
}

TEST(handleCopy, MovesADirectoryInTheWayAsideAndRemovesIt)
{
    const TempDir dir;
    dir.write("src", "new");
    dir.write("dst/deep/file", "old");
    EXPECT_TRUE(copied(dir, L"dst", L"src"));
    EXPECT_EQ(tree(dir), (Names{"dst", "src"}));
    EXPECT_EQ(dir.read("dst"), "new");
}

namespace {
// The clearing names 1 to 5 that are taken by directories, one bit for each, lowest first.
struct ClearingWorld {
    explicit ClearingWorld(unsigned taken)
    {
        dir.write("src/new", "");
        // A link that leads nowhere cannot be removed by the protocol: what is moved aside stays,
        // and shows its name.
        dir.makeDir("dst");
        fs::create_symlink("/nowhere", dir.path("dst/mark"));
        for (unsigned k = 1; k <= 5; ++k) {
            if ((taken & 1U << (k - 1)) != 0)
                dir.write(name(k) + "/leftover/file", "");
        }
    }

    static std::string name(unsigned k)
    {
        return "dstdeleteme000" + std::to_string(k);
    }

    TempDir dir;
};
} // namespace

// By hand: the lowest name that is free, by the set of the taken ones; 1 when none is.
static const unsigned LOWEST_FREE[32] = {1, 2, 1, 3, 1, 2, 1, 4, 1, 2, 1, 3, 1, 2, 1, 5,
                                         1, 2, 1, 3, 1, 2, 1, 4, 1, 2, 1, 3, 1, 2, 1, 1};

TEST(handleCopy, TakesTheLowestFreeClearingNameAndRemovesTheOthers)
{
    for (unsigned taken = 0; taken < 32; ++taken) {
        const ClearingWorld world(taken);
        EXPECT_TRUE(handleDirMove(world.dir.wide("dst"), world.dir.wide("src"), true));
        const std::string aside = ClearingWorld::name(LOWEST_FREE[taken]);
        EXPECT_EQ(tree(world.dir), (Names{"dst", "dst/new", aside, aside + "/mark"})) << taken;
    }
}

TEST(handleCopy, LeavesNothingOfADirectoryThatCanBeRemoved)
{
    for (unsigned taken = 0; taken < 32; ++taken) {
        const ClearingWorld world(taken);
        fs::remove(world.dir.path("dst/mark"));
        EXPECT_TRUE(handleDirMove(world.dir.wide("dst"), world.dir.wide("src"), true));
        EXPECT_EQ(tree(world.dir), (Names{"dst", "dst/new"})) << taken;
    }
}

// All names are taken, and what has this one cannot be removed.
static ClearingWorld& blocked(ClearingWorld& world, unsigned k)
{
    fs::create_symlink("/nowhere", world.dir.path(ClearingWorld::name(k) + "/stuck"));
    return world;
}

TEST(handleCopy, GoesOnWhenALeftoverThatIsNotNeededCannotBeRemoved)
{
    for (unsigned k = 2; k <= 5; ++k) {
        ClearingWorld world(31);
        blocked(world, k);
        EXPECT_EQ(logOf(true,
                        [&] {
                            EXPECT_TRUE(
                                handleDirMove(world.dir.wide("dst"), world.dir.wide("src"), true));
                        }),
                  "");
        const std::string left = ClearingWorld::name(k);
        EXPECT_EQ(tree(world.dir),
                  (Names{"dst", "dst/new", ClearingWorld::name(1), ClearingWorld::name(1) + "/mark",
                         left, left + "/stuck"}));
    }
}

TEST(handleCopy, EndsWhenTheDirectoryInTheWayCannotBeMovedAside)
{
    ClearingWorld world(31);
    blocked(world, 1);
    EXPECT_TRUE(endsWith([&] { handleDirMove(world.dir.wide("dst"), world.dir.wide("src"), true); },
                         "QVMRL0112E: Can't move file/dir  '" + world.dir.path("dst") + "'",
                         ENOTEMPTY));
    EXPECT_TRUE(world.dir.has("src/new"));
    EXPECT_TRUE(world.dir.has("dst/mark"));
}

TEST(handleCopy, TakesAFileUnderAClearingNameForTaken)
{
    const TempDir dir;
    dir.write("src/new", "");
    dir.write("dst/old", "");
    dir.write("dstdeleteme0001", "a file");
    EXPECT_TRUE(handleDirMove(dir.wide("dst"), dir.wide("src"), true));
    EXPECT_EQ(tree(dir), (Names{"dst", "dst/new", "dstdeleteme0001"}));
}

TEST(handleCopy, LooksAtNoOtherClearingName)
{
    const TempDir dir;
    dir.write("src", "new");
    dir.makeDir("dst");
    for (const char* name :
         {"dstdeleteme0000", "dstdeleteme0006", "dst/deleteme0001", "dstdeleteme1"})
        dir.makeDir(name);
    EXPECT_TRUE(copied(dir, L"dst", L"src"));
    EXPECT_EQ(tree(dir),
              (Names{"dst", "dstdeleteme0000", "dstdeleteme0006", "dstdeleteme1", "src"}));
}

// The administrator may do what these tests see refused. True when this process is none, or not
// any more.
static bool becomeOrdinary()
{
    return geteuid() != 0 || setresuid(65534, 65534, 65534) == 0;
}

TEST(handleCopy, EndsWhenAFileInTheWayCannotBeDeleted)
{
    const TempDir dir;
    dir.write("src", "");
    dir.write("locked/dst", "kept");
    chmod(dir.dir.c_str(), 0755);
    chmod(dir.path("locked").c_str(), 0555);
    const Ended ended = runAside(dir, false, [&] {
        if (!becomeOrdinary())
            return std::string("still the administrator");
        handleCopy(dir.wide("locked"), L"dst", dir.wdir, L"src", true, false);
        return std::string("no end");
    });
    chmod(dir.path("locked").c_str(), 0755);
    EXPECT_EQ(ended.status, 255);
    EXPECT_EQ(ended.log, "QVMRL0111E: Can't delete old copy of file '" + dir.path("locked/dst") +
                             "' : Permission denied\n");
    EXPECT_EQ(dir.read("locked/dst"), "kept");
}

TEST(handleCopy, EndsWhenTheSourceCannotBeMoved)
{
    const TempDir dir;
    dir.write("src", "");
    EXPECT_TRUE(
        endsWith([&] { handleFileMove(dir.wide("missing"), L"dst", dir.wdir, L"src", true); },
                 "QVMRL0141E: Can't move file/dir  '" + dir.path("src") + "'", ENOENT));
    EXPECT_TRUE(endsWith([&] { handleDirMove(dir.wide("missing/dst"), dir.wide("src"), true); },
                         "QVMRL0141E: Can't move file/dir  '" + dir.path("src") + "'", ENOENT));
}

TEST(handleCopy, EndsWithTheCopysOwnMessages)
{
    const TempDir dir;
    dir.write("src", "");
    dir.makeDir("directory");
    EXPECT_TRUE(
        endsWith([&] { handleCopy(dir.wide("missing"), L"dst", dir.wdir, L"src", true, false); },
                 "QVMRL0191E: Unable to open destination file " + dir.path("missing/dst") +
                     " to be copied to",
                 ENOENT));
    EXPECT_TRUE(endsWith([&] { copied(dir, L"dst", L"directory"); },
                         "QVMRL0193E: Did not encounter EOF while copying file contents", EISDIR));
}

TEST(handleFileMove, MovesAFileOrLogsThatItIsMissing)
{
    const TempDir dir;
    dir.write("src", "text");
    EXPECT_TRUE(handleFileMove(dir.wdir, L"dst", dir.wdir, L"src", true));
    EXPECT_EQ(tree(dir), (Names{"dst"}));
    EXPECT_FALSE(handleFileMove(dir.wdir, L"dst", dir.wdir, L"src", false));
}

TEST(handleDirMove, MovesAWholeDirectory)
{
    const TempDir dir;
    dir.write("src/a/b", "text");
    EXPECT_TRUE(handleDirMove(dir.wdir + L"\\dst", dir.wide("src"), true));
    EXPECT_EQ(tree(dir), (Names{"dst", "dst/a", "dst/a/b"}));
    EXPECT_FALSE(handleDirMove(dir.wide("dst"), dir.wide("src"), false));
}

namespace {
// A workspace WS = "ws" with the configuration location CFG = "ws/.config".
struct Area {
    Area()
    {
        eConfig = CONFIG_USER;
        dir.makeDir("ws/.config/org.eclipse.update");
        dir.makeDir("base");
    }

    void fillUpdateArea() const
    {
        dir.write("ws/.config/org.eclipse.update/platform.xml", "<p>\n");
        dir.write("ws/.config/org.eclipse.update/registry", "registry\n");
        dir.write("ws/.config/org.eclipse.update/bookmarks.xml", "<b>\n");
        dir.write("ws/.config/config.ini", "ini");
    }

    void reuse() const
    {
        createReusableWorkspace(dir.wide("ws"), dir.wide("ws/.config"));
    }

    void reset() const
    {
        resetWorkspace(dir.wide("ws"), dir.wide("ws/.config"), dir.wide("base"));
    }

    void resetDirs() const
    {
        resetMetaDataDirs(dir.wide("ws"), dir.wide("ws/.config"), dir.wide("base"));
    }

    std::string notFound(const std::string& place) const
    {
        return "QVMRL0110I: '" + dir.path("ws/" + place) + "' not found\n";
    }

    TempDir dir;
};
} // namespace

static const Names NEW_AREA = {".config",
                               ".config/org.eclipse.update",
                               ".config/org.eclipse.update/bookmarks.xml",
                               ".config/org.eclipse.update/registry",
                               ".configbak",
                               ".configbak/config.ini",
                               ".configbak/org.eclipse.update",
                               ".configbak/org.eclipse.update/bookmarks.xml",
                               ".configbak/org.eclipse.update/platform.xml",
                               ".configbak/org.eclipse.update/registry"};

static void expectCarriedOver(const Area& area)
{
    EXPECT_EQ(area.dir.read("ws/.config/org.eclipse.update/registry"), "registry\n");
    EXPECT_EQ(area.dir.read("ws/.config/org.eclipse.update/bookmarks.xml"), "<b>\n");
    EXPECT_EQ(area.dir.read("ws/.configbak/config.ini"), "ini");
}

TEST(createReusableWorkspace, PutsTheConfigurationAsideAndCarriesOver)
{
    const Area area;
    area.fillUpdateArea();
    EXPECT_EQ(logOf(true, [&] { area.reuse(); }), "");
    Names expected = NEW_AREA;
    expected.push_back("platform.xml.old");
    EXPECT_EQ(tree(area.dir, "ws"), expected);
    expectCarriedOver(area);
}

TEST(createReusableWorkspace, LeavesPlatformXmlInTheWorkspaceAsARecord)
{
    const Area area;
    area.fillUpdateArea();
    area.reuse();
    EXPECT_EQ(area.dir.read("ws/platform.xml.old"), "<p>\n");
    EXPECT_FALSE(area.dir.has("ws/.config/org.eclipse.update/platform.xml"));
}

TEST(createReusableWorkspace, LogsWhatThereIsNotInItsOrder)
{
    const Area area;
    EXPECT_EQ(logOf(true, [&] { area.reuse(); }),
              area.notFound(".config/org.eclipse.update/platform.xml") +
                  area.notFound(".config/org.eclipse.update/registry") +
                  area.notFound(".config/org.eclipse.update/bookmarks.xml") +
                  area.notFound("registry.old") + area.notFound("bookmarks.xml.old"));
    EXPECT_EQ(tree(area.dir, "ws"), (Names{".config", ".config/org.eclipse.update", ".configbak",
                                           ".configbak/org.eclipse.update"}));
}

TEST(createReusableWorkspace, ClearsAnOlderBackupAndItsLeftovers)
{
    const Area area;
    area.fillUpdateArea();
    area.dir.write("ws/.configbak/older", "");
    area.dir.write("ws/.configbakdeleteme0003/oldest", "");
    area.reuse();
    Names expected = NEW_AREA;
    expected.push_back("platform.xml.old");
    EXPECT_EQ(tree(area.dir, "ws"), expected);
    expectCarriedOver(area);
}

TEST(createReusableWorkspace, ReplacesOlderSavedCopies)
{
    const Area area;
    area.fillUpdateArea();
    area.dir.write("ws/registry.old/in/the/way", "");
    area.dir.write("ws/bookmarks.xml.old", "old");
    area.dir.write("ws/platform.xml.old", "old");
    area.reuse();
    expectCarriedOver(area);
    EXPECT_EQ(area.dir.read("ws/platform.xml.old"), "<p>\n");
}

TEST(createReusableWorkspace, TakesUpTheSavedCopiesOfAnInterruptedRun)
{
    const Area area;
    area.dir.write("ws/registry.old", "registry\n");
    area.dir.write("ws/bookmarks.xml.old", "<b>\n");
    area.dir.write("ws/.config/config.ini", "ini");
    area.reuse();
    expectCarriedOver(area);
    EXPECT_FALSE(area.dir.has("ws/registry.old"));
    EXPECT_FALSE(area.dir.has("ws/bookmarks.xml.old"));
}

TEST(createReusableWorkspace, EndsWithoutAConfiguration)
{
    const Area area;
    fs::remove_all(area.dir.path("ws/.config"));
    EXPECT_TRUE(endsWith(
        [&] { area.reuse(); },
        "QVMRL0109E: Unable to locate '" + area.dir.path("ws/.config") + "' for copying", ENOENT));
}

TEST(createReusableWorkspace, EndsForARegistryThatIsADirectory)
{
    const Area area;
    area.dir.makeDir("ws/.config/org.eclipse.update/registry");
    EXPECT_TRUE(endsWith([&] { area.reuse(); },
                         "QVMRL0193E: Did not encounter EOF while copying file contents", EISDIR));
    EXPECT_FALSE(area.dir.has("ws/.configbak"));
}

TEST(resetWorkspace, PutsTheConfigurationAsideAndCarriesOverWithoutPlatformXml)
{
    const Area area;
    area.fillUpdateArea();
    area.dir.write("base/rcpinstall.properties", "a=b\n");
    area.reset();
    EXPECT_EQ(tree(area.dir, "ws"), NEW_AREA);
    expectCarriedOver(area);
}

TEST(resetWorkspace, LogsWhatThereIsNotInItsOrder)
{
    const Area area;
    area.dir.write("ws/.config/rcpinstall.properties", "");
    EXPECT_EQ(logOf(true, [&] { area.reset(); }),
              area.notFound(".config/org.eclipse.update/registry") +
                  area.notFound(".config/org.eclipse.update/bookmarks.xml") +
                  area.notFound("registry.old") + area.notFound("bookmarks.xml.old"));
}

TEST(resetWorkspace, DeletesThePluginStateWhichAReuseKeeps)
{
    for (bool reset : {false, true}) {
        const Area area;
        area.dir.write("ws/.config/rcpinstall.properties", "resetDir.a=org.example.state\n");
        area.dir.write("ws/.metadata/.plugins/org.example.state/deep/file", "");
        area.dir.write("ws/.metadata/.plugins/org.example.other/file", "");
        if (reset)
            area.reset();
        else
            area.reuse();
        EXPECT_EQ(area.dir.has("ws/.metadata/.plugins/org.example.state"), !reset);
        EXPECT_TRUE(area.dir.has("ws/.metadata/.plugins/org.example.other/file"));
    }
}

TEST(resetWorkspace, SavesBeforeItDeletesPluginState)
{
    const Area area;
    area.fillUpdateArea();
    // Neither properties file exists: the reset ends between the two.
    EXPECT_FATAL(area.reset(), "QVMRL0106E");
    EXPECT_EQ(area.dir.read("ws/registry.old"), "registry\n");
    EXPECT_EQ(area.dir.read("ws/bookmarks.xml.old"), "<b>\n");
    EXPECT_FALSE(area.dir.has("ws/platform.xml.old"));
    EXPECT_FALSE(area.dir.has("ws/.configbak"));
}

// What a renewal logs in a child that is no administrator and that makes directories which it may
// not enter itself.
static Ended endOfLockedOut(const Area& area, const std::function<void()>& renew)
{
    area.dir.write("base/rcpinstall.properties", "");
    area.dir.makeDir("ws");
    chmod(area.dir.dir.c_str(), 0755);
    chmod(area.dir.path("ws").c_str(), 0777);
    const Ended ended = runAside(area.dir, false, [&] {
        if (!becomeOrdinary())
            return std::string("still the administrator");
        umask(0777);
        renew();
        return std::string("no end");
    });
    chmod(area.dir.path("ws/.config").c_str(), 0755);
    return ended;
}

TEST(createReusableWorkspace, EndsWhenTheUpdateAreaCannotBeMade)
{
    const Area area;
    const Ended ended = endOfLockedOut(area, [&] { area.reuse(); });
    EXPECT_EQ(ended.status, 255);
    EXPECT_EQ(ended.log, "QVMRL0044E: Unable to create " +
                             area.dir.path("ws/.config/org.eclipse.update") +
                             " directory. : Permission denied\n");
    EXPECT_TRUE(area.dir.has("ws/.configbak/org.eclipse.update"));
}

TEST(resetWorkspace, EndsWhenTheUpdateAreaCannotBeMade)
{
    const Area area;
    const Ended ended = endOfLockedOut(area, [&] { area.reset(); });
    EXPECT_EQ(ended.status, 255);
    EXPECT_EQ(ended.log, "QVMRL0045E: Unable to create " +
                             area.dir.path("ws/.config/org.eclipse.update") +
                             " directory. : Permission denied\n");
    EXPECT_TRUE(area.dir.has("ws/.configbak/org.eclipse.update"));
}

TEST(resetMetaDataDirs, DeletesEachNamedDirectoryOfTheUsersFile)
{
    const Area area;
    area.dir.write("ws/.config/rcpinstall.properties",
                   "resetDir.a=one\nother=three\nresetDir.b=two/nested\nresetDir.c=missing\n");
    area.dir.write("base/rcpinstall.properties", "resetDir.x=three\n");
    for (const char* state : {"one/file", "two/nested/deep/file", "two/kept", "three/file"})
        area.dir.write(std::string("ws/.metadata/.plugins/") + state, "");
    EXPECT_EQ(logOf(false, [&] { area.resetDirs(); }), "");
    EXPECT_EQ(tree(area.dir, "ws/.metadata/.plugins"),
              (Names{"three", "three/file", "two", "two/kept"}));
}

TEST(resetMetaDataDirs, FallsBackToTheInstallationsFileAndItsVariant)
{
    const Area area;
    area.dir.write("base/rcpinstall.properties", "resetDir.x=one\n");
    area.dir.write("base/config/user/rcpinstall.properties", "resetDir.x=two\n");
    area.dir.makeDir("ws/.metadata/.plugins/one");
    area.dir.makeDir("ws/.metadata/.plugins/two");
    area.resetDirs();
    EXPECT_EQ(tree(area.dir, "ws/.metadata/.plugins"), (Names{"one"}));
}

TEST(resetMetaDataDirs, EndsWithoutAnyFile)
{
    const Area area;
    EXPECT_TRUE(endsWith([&] { area.resetDirs(); },
                         "QVMRL0106E: Unable to locate " +
                             area.dir.path("base/rcpinstall.properties") + " file.",
                         ENOENT));
}

TEST(resetMetaDataDirs, PassesAnEmptyValueOver)
{
    const Area area;
    area.dir.write("ws/.config/rcpinstall.properties", "resetDir.a=\nresetDir.b=one\n");
    area.dir.makeDir("ws/.metadata/.plugins/one");
    area.dir.makeDir("ws/.metadata/.plugins/two");
    area.resetDirs();
    EXPECT_EQ(tree(area.dir, "ws/.metadata/.plugins"), (Names{"two"}));
}

TEST(resetMetaDataDirs, TakesTheValueAsItStandsDotsIncluded)
{
    const Area area;
    area.dir.write("ws/.config/rcpinstall.properties", "resetDir.a=../.other\n");
    area.dir.makeDir("ws/.metadata/.plugins");
    area.dir.write("ws/.metadata/.other/file", "");
    area.resetDirs();
    EXPECT_EQ(tree(area.dir, "ws/.metadata"), (Names{".plugins"}));
}

TEST(resetMetaDataDirs, KnowsItsPrefixExactly)
{
    const Area area;
    area.dir.write("ws/.config/rcpinstall.properties",
                   "resetDir=one\nresetdir.a=one\nxresetDir.a=one\n");
    area.dir.makeDir("ws/.metadata/.plugins/one");
    area.resetDirs();
    EXPECT_EQ(tree(area.dir, "ws/.metadata/.plugins"), (Names{"one"}));
}

TEST(resetMetaDataDirs, EndsWithTheListOfWhatCouldNotBeRemoved)
{
    const Area area;
    area.dir.write("ws/.config/rcpinstall.properties", "resetDir.a=one\nresetDir.b=two\n");
    area.dir.makeDir("ws/.metadata/.plugins/one/in");
    area.dir.makeDir("ws/.metadata/.plugins/two");
    const std::string one = area.dir.path("ws/.metadata/.plugins/one");
    fs::create_symlink("/nowhere", one + "/in/link");
    const Ended ended = runAside(area.dir, false, [&] {
        area.resetDirs();
        return std::string("no end");
    });
    EXPECT_EQ(ended.status, 255);
    const std::string text =
        "\nQVMRL0107E begin: Error removing metadata plugin directory\n"
        "Can't stat " +
        one +
        "/in/link  -  Failed with error 2: No such file or directory\n"
        "Can't delete dir " +
        one +
        "/in  -  Failed with error 39: Directory not empty\n"
        "\nQVMRL0108E end: Unable to remove all files in the metadata plugin directory. "
        "Please correct the problems listed above : ";
    EXPECT_EQ(ended.log.substr(0, text.size()), text);
    EXPECT_TRUE(area.dir.has("ws/.metadata/.plugins/two"));
}

TEST(handleCopy, DecisionACopyAppearsWholeUnderItsName)
{
    const TempDir dir;
    // A directory at the place aside: the copy falls back to the straight way, and is whole.
    dir.write("src", "text\n");
    dir.makeDir("dst.part");
    EXPECT_TRUE(copied(dir, L"dst", L"src"));
    EXPECT_EQ(dir.read("dst"), "text\n");
    EXPECT_TRUE(dir.has("dst.part"));
}

TEST(handleCopy, DecisionACopyThatCannotBeFinishedLeavesNothingUnderItsName)
{
    const TempDir dir;
    dir.write("src", "begun \xff not decodable\n");
    EXPECT_FATAL(handleCopy(dir.wdir, L"dst", dir.wdir, L"src", false, false),
                 "QVMRL0193E: Did not encounter EOF while copying file contents");
    EXPECT_FALSE(dir.has("dst"));
    EXPECT_FALSE(dir.has("dst.part"));
}

TEST(handleCopy, EndsWhenTheCopyCannotGetItsName)
{
    const TempDir dir;
    dir.write("src", "text\n");
    EXPECT_TRUE(endsWith(
        [&] {
            ASSERT_TRUE(makeFail(SYS_rename, EIO));
            copied(dir, L"dst", L"src");
        },
        "QVMRL0113E: Can't copy file  '" + dir.path("src") + "'", EIO));
    EXPECT_EQ(tree(dir), Names{"src"});
}
