#include "platform/linux/files.h"

#include "platform/linux/wide_strings.h"
#include "tests/unit/separate_process.h"
#include "tests/unit/support.h"

#include <cerrno>
#include <csignal>
#include <cwchar>
#include <fcntl.h>
#include <filesystem>
#include <sys/mount.h>
#include <sys/stat.h>
#include <unistd.h>

namespace fs = std::filesystem;

// Half of a pair: in no encoding a character of its own.
static const wchar_t NO_CHARACTER[] = {0xd800, 0};

static std::string a(size_t count)
{
    return std::string(count, 'a');
}

static void linkTo(const std::string& target, const std::string& link)
{
    ASSERT_EQ(::symlink(target.c_str(), link.c_str()), 0);
}

static unsigned modeOf(const std::string& path)
{
    struct stat entry = {};
    return lstat(path.c_str(), &entry) == 0 ? entry.st_mode & 07777 : 0;
}

static std::vector<std::string> namesIn(const std::string& dir)
{
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(dir))
        names.push_back(entry.path().filename());
    std::sort(names.begin(), names.end());
    return names;
}

typedef std::vector<std::string> Names;

// ---- Questions ---------------------------------------------------------------------------------

TEST(exists, IsTrueForWhatCanBeOpenedForReading)
{
    TempDir dir;
    dir.write("caf\xc3\xa9", "");
    dir.makeDir("sub");
    linkTo("sub", dir.path("link"));
    EXPECT_TRUE(exists((dir.wdir + L"/caf\u00e9").c_str()));
    EXPECT_TRUE(exists(dir.wide("sub").c_str()));
    EXPECT_TRUE(exists(dir.wide("link").c_str()));
    EXPECT_TRUE(existsA(dir.path("caf\xc3\xa9").c_str()));
    EXPECT_TRUE(existsA(dir.path("sub").c_str()));
}

TEST(exists, IsFalseForWhatIsNotThereAndForNull)
{
    TempDir dir;
    linkTo("nowhere", dir.path("link"));
    for (const char* name : {"missing", "missing/file", "link"}) {
        EXPECT_FALSE(exists(dir.wide(name).c_str())) << name;
        EXPECT_FALSE(existsA(dir.path(name).c_str())) << name;
    }
    EXPECT_FALSE(exists(L""));
    EXPECT_FALSE(existsA(""));
    EXPECT_FALSE(exists(nullptr));
    EXPECT_FALSE(existsA(nullptr));
}

TEST(exists, IsFalseForAFileThatMayNotBeRead)
{
    TempDir dir;
    dir.write("file", "");
    fs::permissions(dir.path("file"), fs::perms::owner_write);
    giveToOrdinaryUser(dir.dir);
    EXPECT_TRUE(holdsAsOrdinaryUser([&] {
        EXPECT_FALSE(exists(dir.wide("file").c_str()));
        EXPECT_FALSE(existsA(dir.path("file").c_str()));
    }));
}

TEST(exists, IsTrueForAFifoWithoutWaitingForItsOtherEnd)
{
    TempDir dir;
    ASSERT_EQ(mkfifo(dir.path("fifo").c_str(), 0600), 0);
    EXPECT_TRUE(exists(dir.wide("fifo").c_str()));
    EXPECT_TRUE(existsA(dir.path("fifo").c_str()));
}

static int leased = -1;

static void giveUpTheLease(int)
{
    fcntl(leased, F_SETLEASE, F_UNLCK);
}

TEST(exists, WaitsUntilALeaseOnTheFileIsGivenUp)
{
    TempDir dir;
    dir.write("file", "");
    EXPECT_EQ(statusOf([&] {
                  signal(SIGIO, giveUpTheLease);
                  leased = open(dir.path("file").c_str(), O_RDWR | O_CLOEXEC);
                  EXPECT_EQ(fcntl(leased, F_SETLEASE, F_WRLCK), 0);
                  EXPECT_TRUE(existsA(dir.path("file").c_str()));
                  EXPECT_EQ(fcntl(leased, F_GETLEASE), F_UNLCK);
              }),
              0);
}

TEST(isDirectory, IsTrueForADirectoryItselfAlone)
{
    TempDir dir;
    dir.makeDir("sub");
    dir.write("file", "");
    linkTo("sub", dir.path("link"));
    EXPECT_TRUE(isDirectory(dir.wide("sub").c_str()));
    EXPECT_FALSE(isDirectory(dir.wide("file").c_str()));
    EXPECT_FALSE(isDirectory(dir.wide("link").c_str()));
    EXPECT_FALSE(isDirectory(dir.wide("missing").c_str()));
    EXPECT_FALSE(isDirectory(nullptr));
}

TEST(isExecutable, AsksForTheOwnersBitAndFollowsLinks)
{
    TempDir dir;
    for (const char* name : {"owner", "group", "others"})
        dir.write(name, "");
    fs::permissions(dir.path("owner"), fs::perms(0100));
    fs::permissions(dir.path("group"), fs::perms(0670));
    fs::permissions(dir.path("others"), fs::perms(0667));
    linkTo("owner", dir.path("link"));
    linkTo("nowhere", dir.path("dangling"));
    EXPECT_TRUE(isExecutable(dir.wide("owner").c_str()));
    EXPECT_TRUE(isExecutable(dir.wide("link").c_str()));
    EXPECT_FALSE(isExecutable(dir.wide("group").c_str()));
    EXPECT_FALSE(isExecutable(dir.wide("others").c_str()));
    EXPECT_FALSE(isExecutable(dir.wide("dangling").c_str()));
    EXPECT_FALSE(isExecutable(dir.wide("missing").c_str()));
    EXPECT_FALSE(isExecutable(nullptr));
}

// ---- Single operations -------------------------------------------------------------------------

TEST(deleteFile, RemovesAFileOrALink)
{
    TempDir dir;
    dir.write("file", "");
    linkTo("file", dir.path("link"));
    EXPECT_TRUE(deleteFile(dir.wide("link").c_str()));
    EXPECT_EQ(namesIn(dir.dir), Names{"file"});
    EXPECT_TRUE(deleteFile(dir.wide("file").c_str()));
    EXPECT_EQ(namesIn(dir.dir), Names());
}

TEST(deleteFile, IsFalseWithTheReasonLeftInErrno)
{
    TempDir dir;
    dir.makeDir("sub");
    EXPECT_EQ(logOf(true,
                    [&] {
                        EXPECT_FALSE(deleteFile(dir.wide("missing").c_str()));
                        EXPECT_EQ(errno, ENOENT);
                        EXPECT_FALSE(deleteFile(dir.wide("sub").c_str()));
                    }),
              "");
    EXPECT_TRUE(dir.has("sub"));
}

TEST(moveFile, TakesThePlaceOfWhatStandsThere)
{
    TempDir dir;
    dir.write("from", "new");
    dir.write("to", "old");
    EXPECT_TRUE(moveFile(dir.wide("from").c_str(), dir.wide("to").c_str()));
    EXPECT_EQ(namesIn(dir.dir), Names{"to"});
    EXPECT_EQ(dir.read("to"), "new");
}

TEST(moveFile, IsFalseWithTheReasonLeftInErrno)
{
    TempDir dir;
    dir.write("from", "x");
    EXPECT_FALSE(moveFile(dir.wide("missing").c_str(), dir.wide("to").c_str()));
    EXPECT_EQ(errno, ENOENT);
    dir.makeDir("to");
    EXPECT_FALSE(moveFile(dir.wide("from").c_str(), dir.wide("to").c_str()));
    EXPECT_EQ(errno, EISDIR);
    EXPECT_EQ(dir.read("from"), "x");
}

TEST(symlink, MakesALinkToTheTextAsItStands)
{
    TempDir dir;
    EXPECT_TRUE(symlink(L"../no where/\u00e9", dir.wide("link").c_str()));
    EXPECT_EQ(fs::read_symlink(dir.path("link")), fs::path("../no where/\xc3\xa9"));
    EXPECT_FALSE(symlink(L"other", dir.wide("link").c_str()));
    EXPECT_EQ(errno, EEXIST);
}

// ---- Copying -----------------------------------------------------------------------------------

static std::string copied(const std::string& bytes)
{
    TempDir dir;
    dir.write("from", bytes);
    dir.write("to", "something longer that stood there before");
    EXPECT_TRUE(copyFile(dir.wide("from").c_str(), dir.wide("to").c_str()));
    EXPECT_EQ(dir.read("from"), bytes);
    return dir.read("to");
}

TEST(copyFile, CopiesTheBytesOfATextAsTheyAre)
{
    for (const std::string& bytes :
         {std::string(), std::string("\n"), std::string("a"), std::string("a\r\n\n  b\t\nc"),
          std::string("caf\xc3\xa9 \xe2\x82\xac \xf0\x9f\x98\x80\n"), std::string("%s %n %%\n")})
        EXPECT_EQ(copied(bytes), bytes);
}

TEST(copyFile, CopiesLinesOfEveryLength)
{
    for (const size_t length : {998u, 999u, 1000u, 1001u, 2000u, 5000u})
        EXPECT_EQ(copied(a(length) + "\nb"), a(length) + "\nb");
    std::string accents;
    for (int i = 0; i < 3000; ++i)
        accents += "\xc3\xa9";
    EXPECT_EQ(copied(accents), accents);
}

TEST(copyFile, CreatesTheDestination)
{
    TempDir dir;
    dir.write("from", "x");
    const mode_t mask = umask(027);
    EXPECT_TRUE(copyFile(dir.wide("from").c_str(), dir.wide("to").c_str()));
    umask(mask);
    EXPECT_EQ(dir.read("to"), "x");
    EXPECT_EQ(modeOf(dir.path("to")), 0640u);
}

// A piece is a text that a zero ends, so what follows a zero in the same piece is lost. That shows
// how long a piece is.
TEST(copyFile, CopiesInPiecesOfAtMost1000Characters)
{
    const std::string zero(1, '\0');
    EXPECT_EQ(copied("a" + zero + "b\nc"), "ac");
    EXPECT_EQ(copied(zero + a(999) + "b\n"), "b\n");
    EXPECT_EQ(copied(zero + a(998) + "b\n"), "\n");
}

TEST(copyFile, EndsTheProcessWithoutASourceBeforeItTouchesTheDestination)
{
    TempDir dir;
    dir.write("to", "before");
    EXPECT_TRUE(endsWith(
        [&] { copyFile(dir.wide("from").c_str(), dir.wide("to").c_str()); },
        "QVMRL0190E: Unable to open source file " + dir.path("from") + " to be copied", ENOENT));
    EXPECT_EQ(dir.read("to"), "before");
}

TEST(copyFile, EndsTheProcessWithoutADestination)
{
    TempDir dir;
    dir.write("from", "x");
    EXPECT_TRUE(endsWith([&] { copyFile(dir.wide("from").c_str(), dir.wide("no/to").c_str()); },
                         "QVMRL0191E: Unable to open destination file " + dir.path("no/to") +
                             " to be copied to",
                         ENOENT));
    dir.makeDir("sub");
    EXPECT_TRUE(endsWith([&] { copyFile(dir.wide("from").c_str(), dir.wide("sub").c_str()); },
                         "QVMRL0191E: Unable to open destination file " + dir.path("sub") +
                             " to be copied to",
                         EISDIR));
}

// A short text reaches the disk only at its end, a long one before.
TEST(copyFile, EndsTheProcessWhenTheDiskIsFull)
{
    TempDir dir;
    for (const size_t length : {10u, 100000u}) {
        dir.write("from", a(length));
        EXPECT_TRUE(endsWith([&] { copyFile(dir.wide("from").c_str(), L"/dev/full"); },
                             "QVMRL0192E: Encountered error copying file contents", ENOSPC));
    }
}

TEST(copyFile, DecisionADirectoryEndsTheProcess)
{
    TempDir dir;
    dir.makeDir("from");
    EXPECT_TRUE(endsWith([&] { copyFile(dir.wide("from").c_str(), dir.wide("to").c_str()); },
                         "QVMRL0193E: Did not encounter EOF while copying file contents", EISDIR));
}

TEST(copyFile, DecisionBytesThatTheLocaleCannotDecodeEndTheProcess)
{
    TempDir dir;
    // No beginning of a character; one with ASCII in its middle.
    for (const char* bad : {"good\nbad \xff\ngood\n", "good\nbad \xe2\x82 \xac good\n"}) {
        dir.write("from", bad);
        EXPECT_TRUE(endsWith([&] { copyFile(dir.wide("from").c_str(), dir.wide("to").c_str()); },
                             "QVMRL0193E: Did not encounter EOF while copying file contents",
                             EILSEQ));
    }
}

// ---- Files that are made once and believed for ever --------------------------------------------

TEST(placeForNewFile, IsBesideATargetThatIsNotThere)
{
    TempDir dir;
    EXPECT_EQ(placeForNewFile(dir.wide("new")), dir.wide("new.part"));
    EXPECT_EQ(placeForNewFile(dir.wide("no/new")), dir.wide("no/new.part"));
}

TEST(placeForNewFile, DecisionIsTheTargetItselfWhenAnythingStandsThere)
{
    TempDir dir;
    dir.write("file", "");
    dir.makeDir("sub");
    linkTo("nowhere", dir.path("link"));
    for (const char* name : {"file", "sub", "link", "file/below"})
        EXPECT_EQ(placeForNewFile(dir.wide(name)), dir.wide(name));
}

TEST(placeForNewFile, IsTheTargetItselfWhenItCannotBeLookedAt)
{
    TempDir dir;
    dir.makeDir("closed");
    fs::permissions(dir.path("closed"), fs::perms::none);
    giveToOrdinaryUser(dir.dir);
    EXPECT_TRUE(holdsAsOrdinaryUser([&] {
        EXPECT_EQ(placeForNewFile(dir.wide("closed/new")), dir.wide("closed/new"));
        fs::permissions(dir.path("closed"), fs::perms::owner_all);
    }));
}

TEST(openNewFile, OpensThePlace)
{
    TempDir dir;
    std::wstring place = dir.wide("new.part");
    FILE* file = openNewFile(place, dir.wide("new").c_str(), L"w");
    ASSERT_NE(file, nullptr);
    EXPECT_EQ(place, dir.wide("new.part"));
    EXPECT_EQ(write(fileno(file), "x", 1), 1);
    fclose(file);
    EXPECT_EQ(dir.read("new.part"), "x");
    EXPECT_FALSE(dir.has("new"));
}

TEST(openNewFile, OpensTheTargetWhenSomethingIsInTheWay)
{
    TempDir dir;
    dir.makeDir("new.part");
    std::wstring place = dir.wide("new.part");
    FILE* file = openNewFile(place, dir.wide("new").c_str(), L"w");
    ASSERT_NE(file, nullptr);
    EXPECT_EQ(place, dir.wide("new"));
    fclose(file);
    EXPECT_TRUE(dir.has("new"));
}

TEST(openNewFile, GivesTheTargetsReasonWhenNeitherCanBeOpened)
{
    TempDir dir;
    dir.makeDir("new.part");
    dir.makeDir("new");
    linkTo("new.part/no/where", dir.path("dangling"));
    std::wstring place = dir.wide("new.part");
    EXPECT_EQ(openNewFile(place, dir.wide("dangling").c_str(), L"w"), nullptr);
    EXPECT_EQ(errno, ENOENT);
    place = dir.wide("new");
    EXPECT_EQ(openNewFile(place, dir.wide("new").c_str(), L"w"), nullptr);
    EXPECT_EQ(errno, EISDIR);
}

TEST(publishNewFile, RenamesThePlaceToTheTarget)
{
    TempDir dir;
    dir.write("new.part", "x");
    EXPECT_TRUE(publishNewFile(dir.wide("new.part"), dir.wide("new")));
    EXPECT_EQ(namesIn(dir.dir), Names{"new"});
    EXPECT_EQ(dir.read("new"), "x");
}

TEST(publishNewFile, LeavesAFileThatWasWrittenStraight)
{
    TempDir dir;
    dir.write("new", "x");
    EXPECT_TRUE(publishNewFile(dir.wide("new"), dir.wide("new")));
    EXPECT_EQ(dir.read("new"), "x");
}

TEST(publishNewFile, IsFalseWhenTheRenamingFailed)
{
    TempDir dir;
    EXPECT_FALSE(publishNewFile(dir.wide("new.part"), dir.wide("new")));
    EXPECT_EQ(errno, ENOENT);
}

TEST(copyNewFile, DecisionTheCopyAppearsWholeAtItsTarget)
{
    TempDir dir;
    dir.write("from", "caf\xc3\xa9\n");
    const mode_t mask = umask(022);
    EXPECT_TRUE(copyNewFile(dir.wide("from").c_str(), dir.wide("new").c_str()));
    umask(mask);
    EXPECT_EQ(namesIn(dir.dir), (Names{"from", "new"}));
    EXPECT_EQ(dir.read("new"), "caf\xc3\xa9\n");
    EXPECT_EQ(modeOf(dir.path("new")), 0644u);
}

TEST(copyNewFile, ReplacesWhatALauncherThatWasKilledLeftBeside)
{
    TempDir dir;
    dir.write("from", "x");
    dir.write("new.part", "half of something that was longer");
    EXPECT_TRUE(copyNewFile(dir.wide("from").c_str(), dir.wide("new").c_str()));
    EXPECT_EQ(namesIn(dir.dir), (Names{"from", "new"}));
    EXPECT_EQ(dir.read("new"), "x");
}

TEST(copyNewFile, DecisionADanglingLinkIsWrittenThrough)
{
    TempDir dir;
    dir.write("from", "x");
    linkTo("elsewhere", dir.path("new"));
    EXPECT_TRUE(copyNewFile(dir.wide("from").c_str(), dir.wide("new").c_str()));
    EXPECT_EQ(namesIn(dir.dir), (Names{"elsewhere", "from", "new"}));
    EXPECT_EQ(fs::read_symlink(dir.path("new")), fs::path("elsewhere"));
    EXPECT_EQ(dir.read("elsewhere"), "x");
}

TEST(copyNewFile, OverwritesAFileThatStandsThere)
{
    TempDir dir;
    dir.write("from", "x");
    dir.write("new", "something longer");
    struct stat before = {};
    ASSERT_EQ(stat(dir.path("new").c_str(), &before), 0);
    EXPECT_TRUE(copyNewFile(dir.wide("from").c_str(), dir.wide("new").c_str()));
    struct stat after = {};
    ASSERT_EQ(stat(dir.path("new").c_str(), &after), 0);
    EXPECT_EQ(before.st_ino, after.st_ino);
    EXPECT_EQ(dir.read("new"), "x");
}

// A name of 255 bytes is the longest, so there is no longer one to write aside.
TEST(copyNewFile, WritesANameStraightThatIsTooLongForAPlaceBesideIt)
{
    TempDir dir;
    dir.write("from", "x");
    for (const size_t length : {250u, 251u, 255u}) {
        EXPECT_TRUE(copyNewFile(dir.wide("from").c_str(), dir.wide(a(length)).c_str()));
        EXPECT_EQ(dir.read(a(length)), "x");
    }
    EXPECT_EQ(namesIn(dir.dir), (Names{a(250), a(251), a(255), "from"}));
}

TEST(copyNewFile, NamesTheTargetWhenNothingCanBeOpened)
{
    TempDir dir;
    dir.write("from", "x");
    EXPECT_TRUE(endsWith([&] { copyNewFile(dir.wide("from").c_str(), dir.wide("no/new").c_str()); },
                         "QVMRL0191E: Unable to open destination file " + dir.path("no/new") +
                             " to be copied to",
                         ENOENT));
    EXPECT_TRUE(endsWith(
        [&] { copyNewFile(dir.wide("no").c_str(), dir.wide("new").c_str()); },
        "QVMRL0190E: Unable to open source file " + dir.path("no") + " to be copied", ENOENT));
    EXPECT_EQ(namesIn(dir.dir), Names{"from"});
}

TEST(copyNewFile, LeavesNothingBehindWhenTheSourceCannotBeReadToItsEnd)
{
    TempDir dir;
    dir.write("from", "good\n\xff");
    EXPECT_TRUE(endsWith([&] { copyNewFile(dir.wide("from").c_str(), dir.wide("new").c_str()); },
                         "QVMRL0193E: Did not encounter EOF while copying file contents", EILSEQ));
    EXPECT_EQ(namesIn(dir.dir), Names{"from"});
}

// A disk of one page, which the directory needs none of.
static void mountTinyDisk(const std::string& dir)
{
    ASSERT_EQ(mkdir(dir.c_str(), 0755), 0);
    ASSERT_EQ(mount("tmpfs", dir.c_str(), "tmpfs", MS_NOSUID | MS_NODEV, "size=4096"), 0);
}

TEST(copyNewFile, LeavesNothingBehindOnAFullDisk)
{
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        mountTinyDisk("/tmp/tiny");
        TempDir dir;
        for (const size_t length : {4097u, 100000u}) {
            dir.write("from", a(length));
            EXPECT_TRUE(endsWith([&] { copyNewFile(dir.wide("from").c_str(), L"/tmp/tiny/new"); },
                                 "QVMRL0192E: Encountered error copying file contents", ENOSPC));
            EXPECT_EQ(namesIn("/tmp/tiny"), Names());
        }
        dir.write("from", a(4096));
        EXPECT_TRUE(copyNewFile(dir.wide("from").c_str(), L"/tmp/tiny/new"));
        EXPECT_EQ(namesIn("/tmp/tiny"), Names{"new"});
        EXPECT_EQ(bytesOf("/tmp/tiny/new"), a(4096));
    }));
}

TEST(copyNewFile, LeavesAFileThatWasWrittenStraightOnAFullDisk)
{
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        mountTinyDisk("/tmp/tiny");
        TempDir dir;
        dir.write("from", a(5000));
        linkTo("elsewhere", "/tmp/tiny/new");
        EXPECT_TRUE(endsWith([&] { copyNewFile(dir.wide("from").c_str(), L"/tmp/tiny/new"); },
                             "QVMRL0192E: Encountered error copying file contents", ENOSPC));
        EXPECT_EQ(namesIn("/tmp/tiny"), (Names{"elsewhere", "new"}));
    }));
}

// ---- Opening and reading -----------------------------------------------------------------------

TEST(open_file, OpensAStreamOfBytes)
{
    TempDir dir;
    FILE* file = nullptr;
    open_file(file, (dir.wdir + L"/caf\u00e9").c_str(), L"w");
    ASSERT_NE(file, nullptr);
    EXPECT_LT(fwide(file, 0), 0);
    EXPECT_EQ(fcntl(fileno(file), F_GETFD), FD_CLOEXEC);
    fclose(file);
    EXPECT_EQ(namesIn(dir.dir), Names{"caf\xc3\xa9"});
}

TEST(open_wfile, OpensAStreamForWideOutput)
{
    TempDir dir;
    FILE* file = nullptr;
    open_wfile(file, dir.wide("file").c_str(), L"w+");
    ASSERT_NE(file, nullptr);
    EXPECT_GT(fwide(file, 0), 0);
    EXPECT_EQ(fcntl(fileno(file), F_GETFD), FD_CLOEXEC);
    fclose(file);
}

TEST(open_prop_file, OpensAPathOfBytes)
{
    TempDir dir;
    dir.write("\xff", "x");
    FILE* file = nullptr;
    open_prop_file(file, dir.path("\xff").c_str(), "r");
    ASSERT_NE(file, nullptr);
    EXPECT_EQ(fwide(file, 0), 0);
    EXPECT_EQ(fcntl(fileno(file), F_GETFD), FD_CLOEXEC);
    fclose(file);
}

TEST(openers, GiveNullWithTheReasonLeftInErrno)
{
    TempDir dir;
    FILE* const before = stdin;
    FILE* file = before;
    open_file(file, dir.wide("missing").c_str(), L"r");
    EXPECT_EQ(file, nullptr);
    EXPECT_EQ(errno, ENOENT);
    file = before;
    open_wfile(file, dir.wdir.c_str(), L"w");
    EXPECT_EQ(file, nullptr);
    EXPECT_EQ(errno, EISDIR);
    file = before;
    open_prop_file(file, dir.path("missing").c_str(), "r");
    EXPECT_EQ(file, nullptr);
    EXPECT_EQ(errno, ENOENT);
}

static FILE* openedForWriting(const TempDir& dir, const std::string& name)
{
    FILE* file = nullptr;
    open_file(file, dir.wide(name).c_str(), L"w");
    return file;
}

TEST(openers, KeepFourStreamsApart)
{
    TempDir dir;
    const Names names = {"one", "two", "three", "four"};
    std::vector<FILE*> files;
    for (const std::string& name : names) {
        files.push_back(openedForWriting(dir, name));
        ASSERT_NE(files.back(), nullptr);
        EXPECT_GE(fputs(name.c_str(), files.back()), 0);
    }
    for (FILE* file : files)
        fclose(file);
    for (const std::string& name : names)
        EXPECT_EQ(dir.read(name), name);
}

TEST(openers, KeepAStreamApartFromTheNextThree)
{
    TempDir dir;
    FILE* kept = openedForWriting(dir, "kept");
    ASSERT_NE(kept, nullptr);
    EXPECT_GE(fputs("kept", kept), 0);
    for (const char* name : {"1", "2", "3"}) {
        FILE* file = openedForWriting(dir, name);
        ASSERT_NE(file, nullptr);
        EXPECT_GE(fputs(name, file), 0);
        fclose(file);
        EXPECT_EQ(dir.read(name), name);
    }
    fclose(kept);
    EXPECT_EQ(dir.read("kept"), "kept");
}

TEST(openers, CannotOpenAPathThatTheLocaleCannotConvert)
{
    FILE* file = stdin;
    open_file(file, NO_CHARACTER, L"r");
    EXPECT_EQ(file, nullptr);
    EXPECT_FALSE(exists(NO_CHARACTER));
}

// A file that is open for reading, with what reads it.
struct Reader {
    explicit Reader(const std::string& bytes)
    {
        dir.write("file", bytes);
        open_file(file, dir.wide("file").c_str(), L"r");
    }
    ~Reader()
    {
        fclose(file);
    }
    Reader(const Reader&) = delete;
    Reader& operator=(const Reader&) = delete;

    // What readFile returns and hands over: "1 text".
    std::wstring read(const wchar_t* format)
    {
        wchar_t out[LINE_ROOM];
        wmemset(out, L'x', LINE_ROOM);
        const int result = readFile(file, format, out);
        return std::to_wstring(result) + L" " + out;
    }

    TempDir dir;
    FILE* file = nullptr;
};

static const wchar_t* const LINE = L"%2024[^\n]\n";
static const wchar_t* const TRIMMED_LINE = L" %2024[^\n]\n";

TEST(readFile, HandsOverOneLineAfterTheOther)
{
    Reader reader("one\n  two caf\xc3\xa9 %s\nthree");
    EXPECT_EQ(reader.read(TRIMMED_LINE), L"1 one");
    EXPECT_EQ(reader.read(TRIMMED_LINE), L"1 two caf\u00e9 %s");
    EXPECT_EQ(reader.read(TRIMMED_LINE), L"1 three");
    EXPECT_EQ(reader.read(TRIMMED_LINE), L"-1 ");
}

TEST(readFile, TakesTheFormatOfEachCall)
{
    Reader reader("one\ntwo\n\nthree\n");
    EXPECT_EQ(reader.read(L"%2[^\n]"), L"1 on");
    EXPECT_EQ(reader.read(LINE), L"1 e");
    EXPECT_EQ(reader.read(L"%2024[^\n]"), L"1 two");
    EXPECT_EQ(reader.read(L"%2024[^\n]"), L"0 ");
    EXPECT_EQ(reader.read(TRIMMED_LINE), L"1 three");
}

TEST(readFile, DecisionHandsOverAnEmptyLineWhenNothingMatched)
{
    Reader head("\none\n");
    EXPECT_EQ(head.read(LINE), L"0 ");
    Reader empty("");
    EXPECT_EQ(empty.read(LINE), L"-1 ");
}

TEST(readFile, DecisionHandsOverAnEmptyLineForBytesThatCannotBeConverted)
{
    Reader reader("good \xff\nnext\n");
    EXPECT_EQ(reader.read(LINE), L"1 ");
    EXPECT_EQ(reader.read(LINE), L"1 next");
}

TEST(readFile, ReadsALineOf2024BytesWhole)
{
    Reader reader(a(2024) + "\nb\n");
    EXPECT_EQ(reader.read(LINE), L"1 " + std::wstring(2024, L'a'));
    EXPECT_EQ(reader.read(LINE), L"1 b");
}

TEST(readFile, ReadsALineOf2025BytesInTwo)
{
    Reader reader(a(2024) + "c\nb\n");
    EXPECT_EQ(reader.read(LINE), L"1 " + std::wstring(2024, L'a'));
    EXPECT_EQ(reader.read(LINE), L"1 c");
    EXPECT_EQ(reader.read(LINE), L"1 b");
}

// The limit counts bytes: 1012 characters of two, and one cut in two, which makes both parts empty.
TEST(readFile, CountsBytes)
{
    std::string accents;
    for (int i = 0; i < 1012; ++i)
        accents += "\xc3\xa9";
    Reader whole(accents + "b\n");
    EXPECT_EQ(whole.read(LINE), L"1 " + std::wstring(1012, L'\u00e9'));
    EXPECT_EQ(whole.read(LINE), L"1 b");
    Reader cut("b" + accents + "\nnext\n");
    EXPECT_EQ(cut.read(LINE), L"1 ");
    EXPECT_EQ(cut.read(LINE), L"1 ");
    EXPECT_EQ(cut.read(LINE), L"1 next");
}

TEST(readFile, EndsTheTextAtAZero)
{
    Reader reader(std::string("ab\0cd\nnext\n", 11));
    EXPECT_EQ(reader.read(LINE), L"1 ab");
    EXPECT_EQ(reader.read(LINE), L"1 next");
}

// Each result and line that `read` takes out of the text, and where the text is then.
template <typename Read>
static std::string scanned(std::string text, Read read)
{
    FILE* file = fmemopen(&text[0], text.size(), "r");
    std::string all;
    int result = 0;
    do {
        std::string line;
        result = read(file, line);
        all += std::to_string(result) + " " + line + " " + std::to_string(ftell(file));
        all += feof(file) != 0 ? " end\n" : "\n";
    } while (result != EOF);
    fclose(file);
    return all;
}

static int readByTheCLibrary(FILE* file, std::string& line)
{
    char bytes[LINE_ROOM] = "";
    const int result = fscanf(file, " %2024[^\n]\n", bytes);
    line = bytes;
    return result;
}

static int readByUs(FILE* file, std::string& line)
{
    wchar_t text[LINE_ROOM];
    const int result = readFile(file, TRIMMED_LINE, text);
    wcstochar(line, text);
    return result;
}

// Its own scanner serves the format of the properties: every text of five of these characters.
TEST(readFile, ScansATrimmedLineAsTheCLibraryDoes)
{
    const std::string letters("a \n\t\0\r", 6);
    for (int number = 0; number < 6 * 6 * 6 * 6 * 6; ++number) {
        std::string text;
        for (int rest = number, i = 0; i < 5; ++i, rest /= 6)
            text += letters[static_cast<size_t>(rest % 6)];
        ASSERT_EQ(scanned(text, readByUs), scanned(text, readByTheCLibrary)) << number;
    }
    for (const size_t length : {2023U, 2024U, 2025U, 4048U, 4049U}) {
        for (const char* end : {"", "\n", " \n", "\n\n b", " b"})
            ASSERT_EQ(scanned(a(length) + end, readByUs),
                      scanned(a(length) + end, readByTheCLibrary))
                << length << end;
    }
}

static std::vector<std::wstring> linesOf(const std::string& bytes)
{
    Reader reader(bytes);
    std::vector<std::wstring> lines;
    wchar_t line[LINE_ROOM];
    while (readCopiedLine(reader.file, line))
        lines.push_back(line);
    return lines;
}

typedef std::vector<std::wstring> Lines;

TEST(readCopiedLine, ReadsTheLinesOfAFile)
{
    EXPECT_EQ(linesOf("one\ntwo words\nthree\n"), (Lines{L"one", L"two words", L"three"}));
    EXPECT_EQ(linesOf("one\ntwo"), (Lines{L"one", L"two"}));
    EXPECT_EQ(linesOf(""), Lines());
}

TEST(readCopiedLine, SwallowsBlankLinesAndTheIndentationBehindALineEnd)
{
    EXPECT_EQ(linesOf("  one \n\n  two\n \t\n\n\tthree\n\n"), (Lines{L"  one ", L"two", L"three"}));
    EXPECT_EQ(linesOf("a\r\n\r\nb\r\n"), (Lines{L"a\r", L"b\r"}));
}

TEST(readCopiedLine, DecisionSwallowsLineEndsAtTheHeadOfAFile)
{
    EXPECT_EQ(linesOf("\none\n"), Lines{L"one"});
    EXPECT_EQ(linesOf("\n\n \n\n  one\ntwo\n"), (Lines{L"one", L"two"}));
}

TEST(readCopiedLine, DecisionEndsInAFileOfBlankLines)
{
    EXPECT_EQ(linesOf("\n"), Lines());
    EXPECT_EQ(linesOf("\n\n \n\t\n"), Lines());
}

TEST(readCopiedLine, ReadsALineOf2025BytesInTwo)
{
    EXPECT_EQ(linesOf(a(2024) + "\nb"), (Lines{std::wstring(2024, L'a'), L"b"}));
    EXPECT_EQ(linesOf(a(2024) + "c\nb"), (Lines{std::wstring(2024, L'a'), L"c", L"b"}));
}

TEST(readCopiedLine, EndsAtADirectory)
{
    TempDir dir;
    FILE* file = nullptr;
    open_file(file, dir.wdir.c_str(), L"r");
    ASSERT_NE(file, nullptr);
    wchar_t line[LINE_ROOM];
    EXPECT_FALSE(readCopiedLine(file, line));
    fclose(file);
}

TEST(flushToDisk, FlushesWhatWasWritten)
{
    TempDir dir;
    FILE* file = nullptr;
    open_file(file, dir.wide("file").c_str(), L"w");
    ASSERT_NE(file, nullptr);
    EXPECT_GE(fputs("x", file), 0);
    EXPECT_EQ(dir.read("file"), "");
    EXPECT_TRUE(flushToDisk(file));
    EXPECT_EQ(dir.read("file"), "x");
    fclose(file);
}

TEST(flushToDisk, IsFalseWhenItCannotBeWrittenOrIsNoDisk)
{
    FILE* full = nullptr;
    open_file(full, L"/dev/full", L"w");
    ASSERT_NE(full, nullptr);
    EXPECT_GE(fputs("x", full), 0);
    EXPECT_FALSE(flushToDisk(full));
    fclose(full);
    FILE* null = nullptr;
    open_file(null, L"/dev/null", L"w");
    ASSERT_NE(null, nullptr);
    EXPECT_FALSE(flushToDisk(null));
    EXPECT_EQ(errno, EINVAL);
    fclose(null);
}

// A copy of `bytes` ends the process since its last character is not whole.
static testing::AssertionResult endsForACutCharacter(const std::string& bytes)
{
    TempDir dir;
    dir.write("from", bytes);
    return endsWith([&] { copyFile(dir.wide("from").c_str(), dir.wide("to").c_str()); },
                    "QVMRL0193E: Did not encounter EOF while copying file contents", EILSEQ);
}

TEST(copyFile, DecisionACharacterThatTheEndOfTheFileCutsOffEndsTheProcess)
{
    EXPECT_TRUE(endsForACutCharacter("good\n\xc3"));
    EXPECT_TRUE(endsForACutCharacter("good\xe2\x82"));
    for (const size_t length : {0, 1, 4093, 4094, 4095, 4096, 4097}) {
        EXPECT_TRUE(endsForACutCharacter(std::string(length, 'a') + "\xc3")) << length;
        EXPECT_TRUE(endsForACutCharacter(std::string(length, 'a') + "\xf0\x9f\x98")) << length;
    }
}

TEST(copyFile, KeepsCharactersThatABufferOfTheStreamDivides)
{
    TempDir dir;
    for (const char* character : {"\xc3\xa4", "\xe2\x82\xac", "\xf0\x9f\x98\x80"}) {
        for (size_t before = 0; before < 4; ++before) {
            std::string bytes(before, 'a');
            for (int i = 0; i < 6000; ++i)
                bytes += character;
            dir.write("from", bytes);
            EXPECT_TRUE(copyFile(dir.wide("from").c_str(), dir.wide("to").c_str()));
            EXPECT_TRUE(dir.read("to") == bytes) << character << before;
        }
    }
}

TEST(copyNewFile, LinkAtThePlaceAsideIsNotFollowed)
{
    TempDir dir;
    dir.write("from", "text\n");
    dir.write("victim", "untouched");
    ASSERT_EQ(::symlink(dir.path("victim").c_str(), dir.path("new.part").c_str()), 0);
    EXPECT_TRUE(copyNewFile(dir.wide("from").c_str(), dir.wide("new").c_str()));
    EXPECT_EQ(dir.read("victim"), "untouched");
    EXPECT_EQ(dir.read("new"), "text\n");
    EXPECT_FALSE(std::filesystem::is_symlink(dir.path("new")));
    EXPECT_FALSE(dir.has("new.part"));
}
