#include "platform/linux/directories.h"

#include "tests/unit/separate_process.h"
#include "tests/unit/support.h"

#include <cerrno>
#include <filesystem>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace fs = std::filesystem;

static void linkTo(const std::string& target, const std::string& link)
{
    ASSERT_EQ(::symlink(target.c_str(), link.c_str()), 0);
}

static unsigned modeOf(const std::string& path)
{
    struct stat entry = {};
    return lstat(path.c_str(), &entry) == 0 ? entry.st_mode & 07777 : 0;
}

// Every path below `dir`, in order.
static std::vector<std::string> pathsIn(const std::string& dir)
{
    std::vector<std::string> paths;
    for (const auto& entry : fs::recursive_directory_iterator(dir))
        paths.push_back(entry.path().string().substr(dir.size() + 1));
    std::sort(paths.begin(), paths.end());
    return paths;
}

typedef std::vector<std::string> Paths;

static void forbidWriting(const std::string& path)
{
    fs::permissions(path, fs::perms(0555));
}

// What a report says of a path, or of none.
static std::string line(const std::string& what, const std::string& reason)
{
    return what + "  -  Failed with error " + reason + "\n";
}

static const char* const NO_ENTRY = "2: No such file or directory";
static const char* const NO_PERMISSION = "13: Permission denied";
static const char* const NO_DIRECTORY = "20: Not a directory";
static const char* const NOT_EMPTY = "39: Directory not empty";

static std::wstring wide(const std::string& text)
{
    return std::wstring(text.begin(), text.end());
}

// ---- Making ------------------------------------------------------------------------------------

TEST(createDirectory, MakesOneWithMode0775LessTheUmask)
{
    TempDir dir;
    const mode_t mask = umask(0);
    EXPECT_TRUE(createDirectory((dir.wdir + L"/caf\u00e9").c_str()));
    umask(027);
    EXPECT_TRUE(createDirectory(dir.wide("masked").c_str()));
    umask(mask);
    EXPECT_EQ(modeOf(dir.path("caf\xc3\xa9")), 0775u);
    EXPECT_EQ(modeOf(dir.path("masked")), 0750u);
}

TEST(createDirectory, IsFalseWithTheReasonLeftInErrno)
{
    TempDir dir;
    EXPECT_FALSE(createDirectory(dir.wdir.c_str()));
    EXPECT_EQ(errno, EEXIST);
    EXPECT_FALSE(createDirectory(dir.wide("no/sub").c_str()));
    EXPECT_EQ(errno, ENOENT);
}

TEST(mkdirs, MakesEveryLevel)
{
    TempDir dir;
    const mode_t mask = umask(0);
    EXPECT_TRUE(mkdirs(dir.wide("a/b/c").c_str()));
    umask(mask);
    EXPECT_EQ(pathsIn(dir.dir), (Paths{"a", "a/b", "a/b/c"}));
    EXPECT_EQ(modeOf(dir.path("a")), 0775u);
    EXPECT_EQ(modeOf(dir.path("a/b/c")), 0775u);
}

TEST(mkdirs, SplitsOnBothSeparatorsAndPassesOverEmptyParts)
{
    TempDir dir;
    EXPECT_TRUE(mkdirs((dir.wdir + L"\\a//b\\/\\c/").c_str()));
    EXPECT_EQ(pathsIn(dir.dir), (Paths{"a", "a/b", "a/b/c"}));
}

TEST(mkdirs, BeginsARelativePathAtTheRoot)
{
    TempDir dir;
    EXPECT_TRUE(mkdirs(dir.wide("a/b").substr(1).c_str()));
    EXPECT_EQ(pathsIn(dir.dir), (Paths{"a", "a/b"}));
}

TEST(mkdirs, IsFalseWhenTheLastLevelExists)
{
    TempDir dir;
    dir.makeDir("a/b");
    EXPECT_FALSE(mkdirs(dir.wide("a/b").c_str()));
    EXPECT_EQ(errno, EEXIST);
    EXPECT_TRUE(mkdirs(dir.wide("a/b/c").c_str()));
}

TEST(mkdirs, IsFalseWhenTheLastLevelCannotBeMade)
{
    TempDir dir;
    dir.write("file", "");
    EXPECT_FALSE(mkdirs(dir.wide("file/a/b").c_str()));
    EXPECT_EQ(errno, ENOTDIR);
}

TEST(mkdirs, LeavesTheReasonOfTheLevelsThatStood)
{
    TempDir dir;
    for (const char* path : {"a", "b/c/d", "b/c/e/f/g"}) {
        errno = 0;
        EXPECT_TRUE(mkdirs(dir.wide(path).c_str()));
        EXPECT_EQ(errno, EEXIST) << path;
    }
    errno = EPIPE;
    EXPECT_TRUE(mkdirs(L"/"));
    EXPECT_EQ(errno, EPIPE);
}

TEST(mkdirs, MakesTheLevelsAboveOneThatCannotBeMade)
{
    TempDir dir;
    EXPECT_FALSE(mkdirs((dir.wide("a/b/") + std::wstring(300, L'x')).c_str()));
    EXPECT_EQ(errno, ENAMETOOLONG);
    EXPECT_EQ(pathsIn(dir.dir), (Paths{"a", "a/b"}));
    // The whole path is too long, though each of its names is not.
    std::wstring deep = dir.wide("c");
    for (int i = 0; i < 20; ++i)
        deep += L"/" + std::wstring(250, L'x');
    EXPECT_FALSE(mkdirs(deep.c_str()));
    EXPECT_EQ(errno, ENAMETOOLONG);
    EXPECT_TRUE(dir.has("c/" + std::string(250, 'x') + "/" + std::string(250, 'x')));
}

TEST(mkdirs, MakesALevelThatThePathLeavesAgain)
{
    TempDir dir;
    EXPECT_TRUE(mkdirs(dir.wide("a/../b/./c").c_str()));
    EXPECT_EQ(pathsIn(dir.dir), (Paths{"a", "b", "b/c"}));
}

TEST(mkdirs, ALinkThatLeadsNowhereStandsInTheWay)
{
    TempDir dir;
    ASSERT_EQ(symlink(dir.path("nowhere").c_str(), dir.path("link").c_str()), 0);
    EXPECT_FALSE(mkdirs(dir.wide("link").c_str()));
    EXPECT_EQ(errno, EEXIST);
    EXPECT_FALSE(mkdirs(dir.wide("link/a").c_str()));
    EXPECT_EQ(errno, ENOENT);
    EXPECT_FALSE(dir.has("nowhere"));
}

TEST(mkdirs, IsTrueForAPathWithoutParts)
{
    EXPECT_TRUE(mkdirs(L""));
    EXPECT_TRUE(mkdirs(L"/"));
    EXPECT_TRUE(mkdirs(L"//\\"));
}

// ---- The worker --------------------------------------------------------------------------------

// What the worker answers and reports, both of them: "1" or "0" and the report.
static std::string removed(const std::string& dir, const std::string& pattern)
{
    std::string report;
    const bool ok = removeDirectoryContents(dir, pattern, "", report);
    return (ok ? "1" : "0") + report;
}

TEST(removeDirectoryContents, RemovesEverythingButTheDirectory)
{
    TempDir dir;
    dir.write("top/a/b/file", "");
    dir.write("top/.hidden", "");
    dir.write("top/\xff", "");
    dir.makeDir("top/empty");
    linkTo("../kept", dir.path("top/link"));
    dir.write("kept", "");
    EXPECT_EQ(removed(dir.path("top"), "*"), "1");
    EXPECT_EQ(pathsIn(dir.dir), (Paths{"kept", "top"}));
}

TEST(removeDirectoryContents, SucceedsInAnEmptyDirectory)
{
    TempDir dir;
    EXPECT_EQ(removed(dir.dir, "*"), "1");
    EXPECT_EQ(removed(dir.dir, "x"), "1");
}

TEST(removeDirectoryContents, RemovesFilesWhoseNamesContainThePattern)
{
    TempDir dir;
    for (const char* name : {"a.log", "x.logfile", ".log", "alog", "A.LOG", "sub/a.log", "c.log/x"})
        dir.write(name, "");
    EXPECT_EQ(removed(dir.dir, ".log"), "1");
    EXPECT_EQ(pathsIn(dir.dir), (Paths{"A.LOG", "alog", "c.log", "c.log/x", "sub", "sub/a.log"}));
}

TEST(removeDirectoryContents, KnowsNoWildcardButTheLoneStar)
{
    TempDir dir;
    for (const char* name : {"a.log", "a*.log", "**"})
        dir.write(name, "");
    EXPECT_EQ(removed(dir.dir, "*.log"), "1");
    EXPECT_EQ(pathsIn(dir.dir), (Paths{"**", "a.log"}));
    EXPECT_EQ(removed(dir.dir, "**"), "1");
    EXPECT_EQ(pathsIn(dir.dir), Paths{"a.log"});
}

TEST(removeDirectoryContents, FindsAnEmptyPatternInEveryFilesName)
{
    TempDir dir;
    dir.write("file", "");
    dir.write("sub/file", "");
    EXPECT_EQ(removed(dir.dir, ""), "1");
    EXPECT_EQ(pathsIn(dir.dir), (Paths{"sub", "sub/file"}));
}

TEST(removeDirectoryContents, LeavesALinkToADirectoryAloneWhenItLooksForAPattern)
{
    TempDir dir;
    dir.write("other/a.log", "");
    dir.makeDir("top");
    linkTo("../other", dir.path("top/x.log"));
    linkTo("../other/a.log", dir.path("top/y.log"));
    EXPECT_EQ(removed(dir.path("top"), ".log"), "1");
    EXPECT_EQ(pathsIn(dir.dir), (Paths{"other", "other/a.log", "top", "top/x.log"}));
}

TEST(removeDirectoryContents, EmptiesTheDirectoryBehindALinkAndCannotRemoveTheLink)
{
    TempDir dir;
    dir.write("other/sub/file", "");
    dir.makeDir("top");
    linkTo("../other", dir.path("top/link"));
    EXPECT_EQ(removed(dir.path("top"), "*"),
              "0" + line("Can't delete dir " + dir.path("top/link"), NO_DIRECTORY));
    EXPECT_EQ(pathsIn(dir.dir), (Paths{"other", "top", "top/link"}));
}

// The system follows 40 links of one path. Now and then it refuses earlier: that was seen while
// others mounted file systems.
TEST(removeDirectoryContents, FollowsALinkThatLeadsBackUntilTheSystemRefuses)
{
    TempDir dir;
    dir.makeDir("top");
    linkTo(".", dir.path("top/back"));
    std::string report;
    EXPECT_FALSE(removeDirectoryContents(dir.path("top"), "*", "", report));
    const std::string last = line("Can't delete dir " + dir.path("top/back"), NO_DIRECTORY);
    EXPECT_EQ(report.compare(0, 11, "Can't stat "), 0);
    EXPECT_NE(report.find("/back  -  Failed with error 40: Too many levels of symbolic links\n"),
              std::string::npos);
    EXPECT_EQ(report.substr(report.size() - std::min(report.size(), last.size())), last);
    EXPECT_LE(std::count(report.begin(), report.end(), '\n'), 41);
    EXPECT_EQ(pathsIn(dir.path("top")), Paths{"back"});
}

// Followed to the end, these would be 2 to the 40th directories. (A file would be gone when it is
// met again, and how often it is met hangs on the order in which a directory is read.)
TEST(removeDirectoryContents, DecisionEntersTenThousandDirectoriesThroughLinks)
{
    TempDir dir;
    dir.makeDir("top/sub");
    linkTo(".", dir.path("top/back"));
    linkTo("..", dir.path("top/sub/up"));
    std::string report;
    EXPECT_FALSE(removeDirectoryContents(dir.path("top"), "*", "", report));
    EXPECT_EQ(pathsIn(dir.path("top")), (Paths{"back", "sub", "sub/up"}));
    // Every link leads to the top, which is entered 10,001 times. Each time there is a line for
    // each of the links, and one for the directory that is none and stands in no limit. Where the
    // system refuses a link early, there are fewer.
    const auto lines = std::count(report.begin(), report.end(), '\n');
    EXPECT_LE(lines, 30003);
    EXPECT_GE(lines, 29800);
}

TEST(removeDirectoryContents, ReportsALinkThatLeadsNowhereWhateverThePattern)
{
    TempDir dir;
    linkTo("nowhere", dir.path("link"));
    dir.write("file", "");
    EXPECT_EQ(removed(dir.dir, "x"), "0" + line("Can't stat " + dir.path("link"), NO_ENTRY));
    EXPECT_EQ(removed(dir.dir, "*"), "0" + line("Can't stat " + dir.path("link"), NO_ENTRY));
    EXPECT_EQ(pathsIn(dir.dir), Paths{"link"});
}

TEST(removeDirectoryContents, ReportsADirectoryThatCannotBeOpened)
{
    TempDir dir;
    EXPECT_EQ(removed(dir.path("no"), "*"), "0" + line("Error in " + dir.path("no"), NO_ENTRY));
    dir.write("file", "");
    EXPECT_EQ(removed(dir.path("file"), "x"),
              "0" + line("Error in " + dir.path("file"), NO_DIRECTORY));
}

TEST(removeDirectoryContents, ReportsAFileThatCannotBeDeleted)
{
    TempDir dir;
    dir.write("top/file", "");
    forbidWriting(dir.path("top"));
    giveToOrdinaryUser(dir.dir);
    EXPECT_TRUE(holdsAsOrdinaryUser([&] {
        for (const char* pattern : {"*", "file"})
            EXPECT_EQ(removed(dir.path("top"), pattern),
                      "0" + line("Can't delete file " + dir.path("top/file"), NO_PERMISSION));
        fs::permissions(dir.path("top"), fs::perms(0755));
    }));
}

TEST(removeDirectoryContents, ReportsDepthFirstAndTriesTheDirectoryAllTheSame)
{
    TempDir dir;
    dir.write("top/a/b/file", "");
    forbidWriting(dir.path("top/a/b"));
    giveToOrdinaryUser(dir.dir);
    EXPECT_TRUE(holdsAsOrdinaryUser([&] {
        EXPECT_EQ(removed(dir.path("top"), "*"),
                  "0" + line("Can't delete file " + dir.path("top/a/b/file"), NO_PERMISSION) +
                      line("Can't delete dir " + dir.path("top/a/b"), NOT_EMPTY) +
                      line("Can't delete dir " + dir.path("top/a"), NOT_EMPTY));
        fs::permissions(dir.path("top/a/b"), fs::perms(0755));
    }));
}

TEST(removeDirectoryContents, RemovesAnEmptyDirectoryThatItCannotLookInto)
{
    TempDir dir;
    dir.makeDir("top/closed");
    fs::permissions(dir.path("top/closed"), fs::perms::none);
    giveToOrdinaryUser(dir.dir);
    EXPECT_TRUE(holdsAsOrdinaryUser([&] {
        EXPECT_EQ(removed(dir.path("top"), "*"),
                  "0" + line("Error in " + dir.path("top/closed"), NO_PERMISSION));
        EXPECT_EQ(pathsIn(dir.path("top")), Paths());
    }));
}

TEST(removeDirectoryContents, GoesOnAfterEveryFailure)
{
    TempDir dir;
    for (int i = 0; i < 20; ++i) {
        linkTo("nowhere", dir.path("link" + std::to_string(i)));
        dir.write("file" + std::to_string(i), "");
    }
    std::string report = "before\n";
    EXPECT_FALSE(removeDirectoryContents(dir.dir, "*", "", report));
    EXPECT_EQ(pathsIn(dir.dir).size(), 20u);
    EXPECT_EQ(report.compare(0, 7, "before\n"), 0);
    EXPECT_EQ(std::count(report.begin(), report.end(), '\n'), 21);
    for (int i = 0; i < 20; ++i) {
        const std::string wanted =
            "\n" + line("Can't stat " + dir.path("link" + std::to_string(i)), NO_ENTRY);
        EXPECT_NE(report.find(wanted), std::string::npos) << wanted;
    }
}

TEST(removeDirectoryContents, WritesTheIndentNowhere)
{
    TempDir dir;
    dir.makeDir("sub");
    linkTo("nowhere", dir.path("sub/link"));
    std::string report;
    EXPECT_FALSE(removeDirectoryContents(dir.dir, "*", "xxxx", report));
    EXPECT_EQ(report, line("Can't stat " + dir.path("sub/link"), NO_ENTRY) +
                          line("Can't delete dir " + dir.path("sub"), NOT_EMPTY));
}

TEST(removeDirectoryContents, ReportsADirectoryThatCannotBeReadToItsEnd)
{
    TempDir dir;
    dir.write("file", "");
    EXPECT_TRUE(holdsInChild([&] {
        ASSERT_TRUE(makeFail(SYS_getdents64, EIO));
        EXPECT_EQ(removed(dir.dir, "*"), "0" + line("readdir error ", "5: Input/output error"));
    }));
}

TEST(removeDirectoryContents, MeansEverythingWithoutAPattern)
{
    TempDir dir;
    dir.write("a/file", "");
    std::string report;
    EXPECT_TRUE(removeDirectoryContents(dir.dir, "", report));
    EXPECT_EQ(report, "");
    EXPECT_EQ(pathsIn(dir.dir), Paths());
}

TEST(removeDirectoryContents, GivesTheReportAsWideText)
{
    TempDir dir;
    dir.write("caf\xc3\xa9/file", "");
    linkTo("nowhere", dir.path("caf\xc3\xa9/link"));
    std::wstring errorText = L"before";
    EXPECT_FALSE(removeDirectoryContents(dir.wdir + L"/caf\u00e9", errorText));
    EXPECT_EQ(errorText,
              L"Can't stat " + dir.wdir +
                  L"/caf\u00e9/link  -  Failed with error 2: No such file or directory\n");
    EXPECT_EQ(pathsIn(dir.path("caf\xc3\xa9")), Paths{"link"});
}

TEST(removeDirectoryContents, IsTrueByAWidePathAsWell)
{
    TempDir dir;
    dir.write("a/file", "");
    std::wstring errorText;
    EXPECT_TRUE(removeDirectoryContents(dir.wdir, errorText));
    EXPECT_EQ(errorText, L"");
    EXPECT_EQ(pathsIn(dir.dir), Paths());
}

// ---- The directory itself, and patterns --------------------------------------------------------

TEST(removeDirectoryAndContents, RemovesTheDirectoryToo)
{
    TempDir dir;
    dir.write("top/a/file", "");
    std::wstring errorText;
    EXPECT_TRUE(removeDirectoryAndContents(dir.wide("top"), errorText));
    EXPECT_EQ(errorText, L"");
    EXPECT_EQ(pathsIn(dir.dir), Paths());
}

TEST(removeDirectoryAndContents, DoesNotTryTheDirectoryWhenSomethingStayed)
{
    TempDir dir;
    dir.makeDir("top");
    linkTo("nowhere", dir.path("top/link"));
    std::wstring errorText = L"before";
    EXPECT_FALSE(removeDirectoryAndContents(dir.wide("top"), errorText));
    EXPECT_EQ(errorText, wide(line("Can't stat " + dir.path("top/link"), NO_ENTRY)));
    EXPECT_TRUE(dir.has("top"));
}

// The emptied directory cannot be removed under this name.
TEST(removeDirectoryAndContents, ReportsTheDirectoryWhenItStayed)
{
    TempDir dir;
    dir.write("top/file", "");
    std::wstring errorText = L"before";
    EXPECT_FALSE(removeDirectoryAndContents(dir.wide("top/."), errorText));
    EXPECT_EQ(errorText,
              wide(line("Can't delete dir " + dir.path("top/."), "22: Invalid argument")));
    EXPECT_EQ(pathsIn(dir.dir), Paths{"top"});
}

TEST(removeDirectoryAndContents, ReportsADirectoryThatIsNotThere)
{
    TempDir dir;
    std::wstring errorText;
    EXPECT_FALSE(removeDirectoryAndContents(dir.wide("no"), errorText));
    EXPECT_EQ(errorText, wide(line("Error in " + dir.path("no"), NO_ENTRY)));
}

TEST(removeFileWithPatternFromDirectory, DeletesFilesOfTheDirectoryItself)
{
    TempDir dir;
    for (const char* name : {"a.log", "x.logfile", "b.txt", "sub/a.log"})
        dir.write(name, "");
    std::wstring errorText;
    EXPECT_TRUE(removeFileWithPatternFromDirectory(dir.wdir, L".log", errorText));
    EXPECT_EQ(errorText, L"");
    EXPECT_EQ(pathsIn(dir.dir), (Paths{"b.txt", "sub", "sub/a.log"}));
}

TEST(removeFileWithPatternFromDirectory, ConvertsThePattern)
{
    TempDir dir;
    dir.write("caf\xc3\xa9.log", "");
    dir.write("cafe.log", "");
    std::wstring errorText;
    EXPECT_TRUE(removeFileWithPatternFromDirectory(dir.wdir, L"f\u00e9", errorText));
    EXPECT_EQ(pathsIn(dir.dir), Paths{"cafe.log"});
}

TEST(removeFileWithPatternFromDirectory, GivesTheReport)
{
    TempDir dir;
    std::wstring errorText = L"before";
    EXPECT_FALSE(removeFileWithPatternFromDirectory(dir.wide("no"), L"x", errorText));
    EXPECT_EQ(errorText, wide(line("Error in " + dir.path("no"), NO_ENTRY)));
}

TEST(removeFileWithPatternFromDirectory, MeansEverythingByALoneStar)
{
    TempDir dir;
    dir.write("a/file", "");
    std::wstring errorText;
    EXPECT_TRUE(removeFileWithPatternFromDirectory(dir.wdir, L"*", errorText));
    EXPECT_EQ(pathsIn(dir.dir), Paths());
}

TEST(removeFileWithPatternFromDirectory, DecisionPatternThatCannotBeConvertedDeletesNothing)
{
    TempDir dir;
    dir.write("a", "");
    std::wstring report = L"before";
    EXPECT_FALSE(removeFileWithPatternFromDirectory(dir.wdir, L"\xd800", report));
    EXPECT_TRUE(dir.has("a"));
    EXPECT_EQ(report, L"");
}

TEST(ensureDirectory, MakesEveryLevel)
{
    TempDir dir;
    EXPECT_TRUE(ensureDirectory(dir.wide("a/b").c_str()));
    EXPECT_TRUE(std::filesystem::is_directory(dir.path("a/b")));
}

TEST(ensureDirectory, DecisionOneThatStandsThereByNowIsAsGood)
{
    TempDir dir;
    dir.makeDir("a");
    EXPECT_TRUE(ensureDirectory(dir.wide("a").c_str()));
}

TEST(ensureDirectory, FailsWhereAFileOrALinkStands)
{
    TempDir dir;
    dir.write("file", "");
    dir.makeDir("a");
    ASSERT_EQ(symlink(dir.path("a").c_str(), dir.path("link").c_str()), 0);
    for (const char* name : {"file", "link"}) {
        errno = 0;
        EXPECT_FALSE(ensureDirectory(dir.wide(name).c_str()));
        EXPECT_EQ(errno, EEXIST);
    }
}
