#include "launcher/user_area/startup_arguments.h"

#include "tests/unit/fixtures.h"

#include <cerrno>
#include <cstdlib>
#include <filesystem>

namespace fs = std::filesystem;

static const char* const LIBRARY_PATH = "com.vantor.rcp.core.internal.librarypath=";

// The file that these words give, for a restart by "/x" and the rcp home "/opt/app".
static std::string recordOf(const Line& line, const wchar_t* restartExe = L"/x",
                            std::initializer_list<const wchar_t*> properties = {})
{
    const TempDir dir;
    const Props props(properties);
    unsetenv("LD_LIBRARY_PATH");
    writeStartupArgs(line.argc, line.argv, dir.wdir, restartExe, props.list, L"/opt/app");
    return dir.read("args.properties");
}

// The same, when only arg1 is of interest: its entry's text behind the "=".
static std::string valueOf(const std::wstring& word)
{
    const std::string head = "arg0=/x\narg1=";
    const std::string tail = std::string("\nargc=2\n") + LIBRARY_PATH + "\n";
    const std::string record = recordOf(Line(Texts{L"velmora", word}));
    EXPECT_EQ(record.substr(0, head.size()), head);
    EXPECT_EQ(record.substr(record.size() - tail.size()), tail);
    return record.substr(head.size(), record.size() - head.size() - tail.size());
}

static std::string ownPath()
{
    return fs::read_symlink("/proc/self/exe").string();
}

TEST(writeStartupArgs, RecordsTheWordsTheirNumberAndTheLibraryPath)
{
    EXPECT_EQ(recordOf(Line({L"velmora", L"-x", L"", L"y"})),
              std::string("arg0=/x\narg1=-x\narg2=\narg3=y\nargc=4\n") + LIBRARY_PATH + "\n");
}

TEST(writeStartupArgs, LeavesOutWhatIsForThisStartAlone)
{
    EXPECT_EQ(recordOf(Line({L"velmora", L"-resetconfig", L"-data", L"${rcp.home}/ws",
                             L"-rcp_old_pid", L"4711", L"-x"}),
                       nullptr),
              "arg0=" + ownPath() + "\narg1=-data\narg2=/opt/app/ws\narg3=-x\nargc=4\n" +
                  LIBRARY_PATH + "\n");
    EXPECT_EQ(recordOf(Line({L"velmora", L"-restart", L"a", L"-resetconfig"})),
              std::string("arg0=/x\narg1=a\nargc=2\n") + LIBRARY_PATH + "\n");
}

TEST(writeStartupArgs, LeavesOutOnlyTheFirstOfEach)
{
    EXPECT_EQ(recordOf(Line({L"velmora", L"-resetconfig", L"-resetconfig", L"-rcp_old_pid", L"1",
                             L"-rcp_old_pid", L"2", L"-restart", L"-restart"})),
              std::string("arg0=/x\narg1=-resetconfig\narg2=-rcp_old_pid\narg3=2\n"
                          "arg4=-restart\nargc=5\n") +
                  LIBRARY_PATH + "\n");
}

TEST(writeStartupArgs, LeavesOutAnOldPidWithoutAValueToo)
{
    EXPECT_EQ(recordOf(Line({L"velmora", L"a", L"-rcp_old_pid"})),
              std::string("arg0=/x\narg1=a\nargc=2\n") + LIBRARY_PATH + "\n");
}

TEST(writeStartupArgs, RecordsTheLaunchersOwnPathWithoutARestartExecutable)
{
    const std::string expected = "arg0=" + ownPath() + "\nargc=1\n" + LIBRARY_PATH + "\n";
    EXPECT_EQ(recordOf(Line({L"whatever"}), nullptr), expected);
    EXPECT_EQ(recordOf(Line({L"whatever"}), L""), expected);
}

TEST(writeStartupArgs, NumbersBeyondTen)
{
    EXPECT_EQ(
        recordOf(Line({L"v", L"1", L"2", L"3", L"4", L"5", L"6", L"7", L"8", L"9", L"a", L"b"})),
        std::string("arg0=/x\narg1=1\narg2=2\narg3=3\narg4=4\narg5=5\narg6=6\narg7=7\n"
                    "arg8=8\narg9=9\narg10=a\narg11=b\nargc=12\n") +
            LIBRARY_PATH + "\n");
}

// The word behind the first "-data", as recorded.
static std::string dataOf(const wchar_t* value)
{
    setenv("VELMORA_X", "v", 1);
    const std::string record =
        recordOf(Line({L"velmora", L"-data", value}), L"/x", {L"name", L"n", L"h", L"${rcp.home}"});
    const std::string head = "arg0=/x\narg1=-data\narg2=";
    EXPECT_EQ(record.substr(0, head.size()), head);
    return record.substr(head.size(), record.find('\n', head.size()) - head.size());
}

TEST(writeStartupArgs, ResolvesThePlaceholdersOfData)
{
    EXPECT_EQ(dataOf(L"${rcp.home}/${env.VELMORA_X}/${prop.name}"), "/opt/app/v/n");
    // The second is no user placeholder and stays, and so does one that nothing stands for.
    EXPECT_EQ(dataOf(L"${rcp.home}/${rcp.home}"), "/opt/app/${rcp.home}");
    EXPECT_EQ(dataOf(L"${prop.nosuch}/a"), "${prop.nosuch}/a");
    EXPECT_EQ(dataOf(L"relative"), "relative");
}

TEST(writeStartupArgs, ReplacesRcpHomeOfDataBeforeTheUserPlaceholders)
{
    EXPECT_EQ(dataOf(L"${prop.h}/w"), "${rcp.home}/w");
}

TEST(writeStartupArgs, KeepsASeparatorAtTheEndOfData)
{
    EXPECT_EQ(dataOf(L"/w/"), "/w/");
    EXPECT_EQ(dataOf(L"/w\\"), "/w\\\\");
}

TEST(writeStartupArgs, ResolvesOnlyBehindTheFirstData)
{
    EXPECT_EQ(recordOf(Line({L"velmora", L"${rcp.home}", L"-data", L"${rcp.home}", L"-data",
                             L"${rcp.home}"})),
              std::string("arg0=/x\narg1=${rcp.home}\narg2=-data\narg3=/opt/app\narg4=-data\n"
                          "arg5=${rcp.home}\nargc=6\n") +
                  LIBRARY_PATH + "\n");
}

TEST(writeStartupArgs, SearchesDataFromTheProgramPathOn)
{
    EXPECT_EQ(recordOf(Line({L"-data", L"${rcp.home}", L"-data", L"${rcp.home}"})),
              std::string("arg0=/x\narg1=/opt/app\narg2=-data\narg3=${rcp.home}\nargc=4\n") +
                  LIBRARY_PATH + "\n");
}

TEST(writeStartupArgs, AValueOfDataThatIsLeftOutIsNotMadeUpForByTheNextWord)
{
    const std::string expected =
        std::string("arg0=/x\narg1=-data\narg2=${rcp.home}\nargc=3\n") + LIBRARY_PATH + "\n";
    EXPECT_EQ(recordOf(Line({L"velmora", L"-data", L"-resetconfig", L"${rcp.home}"})), expected);
    EXPECT_EQ(recordOf(Line({L"velmora", L"-data", L"-rcp_old_pid", L"1", L"${rcp.home}"})),
              expected);
}

TEST(writeStartupArgs, RecordsDataAsTheLastWordAsItIs)
{
    EXPECT_EQ(recordOf(Line({L"velmora", L"-data"})),
              std::string("arg0=/x\narg1=-data\nargc=2\n") + LIBRARY_PATH + "\n");
}

TEST(writeStartupArgs, EscapesWhatIsSpecialToJava)
{
    EXPECT_EQ(valueOf(L"a=b"), "a\\=b");
    EXPECT_EQ(valueOf(L"a:b"), "a\\:b");
    EXPECT_EQ(valueOf(L"#!"), "\\#\\!");
    EXPECT_EQ(valueOf(L"a\\b"), "a\\\\b");
    EXPECT_EQ(valueOf(L" a b "), " a b ");
    EXPECT_EQ(valueOf(L"\t\n\r\f\x01\x1f"), "\\u0009\\u000a\\u000d\\u000c\\u0001\\u001f");
    EXPECT_EQ(valueOf(L"~\x7f"), "~\\u007f");
    EXPECT_EQ(valueOf(L"${a}%s%n"), "${a}%s%n");
}

TEST(writeStartupArgs, EscapesEveryCharacterBeyondAscii)
{
    EXPECT_EQ(valueOf(L"\x80\x00e9\x00ff"), "\\u0080\\u00e9\\u00ff");
    EXPECT_EQ(valueOf(L"\x0416\x20ac\xffff"), "\\u0416\\u20ac\\uffff");
    // Of larger codes the low 16 bits alone.
    EXPECT_EQ(valueOf(L"\U0001F600\U00010000"), "\\uf600\\u0000");
}

TEST(writeStartupArgs, RecordsTheLibraryPathThatItWasStartedWith)
{
    const TempDir dir;
    setenv("LD_LIBRARY_PATH", "/a:/b", 1);
    const Line line({L"velmora"});
    writeStartupArgs(line.argc, line.argv, dir.wdir, L"/x", PropertyList(), L"/opt/app");
    unsetenv("LD_LIBRARY_PATH");
    EXPECT_EQ(dir.read("args.properties"),
              std::string("arg0=/x\nargc=1\n") + LIBRARY_PATH + "/a\\:/b\n");
}

TEST(writeStartupArgs, ReplacesTheWholeFile)
{
    const TempDir dir;
    dir.write("c/args.properties", std::string(5000, 'x'));
    const Line line({L"velmora"});
    unsetenv("LD_LIBRARY_PATH");
    writeStartupArgs(line.argc, line.argv, dir.wdir + L"\\c", L"/x", PropertyList(), L"/opt/app");
    EXPECT_EQ(dir.read("c/args.properties"),
              std::string("arg0=/x\nargc=1\n") + LIBRARY_PATH + "\n");
}

TEST(writeStartupArgs, EndsWhenTheFileCannotBeOpened)
{
    const TempDir dir;
    dir.makeDir("args.properties");
    const Line line({L"velmora"});
    EXPECT_TRUE(endsWith(
        [&] { writeStartupArgs(line.argc, line.argv, dir.wdir, nullptr, PropertyList(), L""); },
        "QVMRL0097E: Could not open " + dir.path("args.properties") + " for writing!", EISDIR));
}

// The identifier of the line that a start ends with whose record, with a first word of this
// length, has no room on the disk.
static std::string identifierOnAFullDisk(const TempDir& dir, size_t length)
{
    const std::wstring exe(length, L'x');
    const Line line({L"velmora"});
    const Ended ended = runAside(dir, false, [&] {
        writeStartupArgs(line.argc, line.argv, dir.wdir, exe.c_str(), PropertyList(), L"");
        return std::string("no end");
    });
    EXPECT_EQ(ended.status, 255);
    const std::string text =
        ": Error writing to " + dir.path("args.properties") + " file. : No space left on device\n";
    EXPECT_EQ(ended.log.substr(ended.log.find(':')), text);
    return ended.log.substr(0, ended.log.find(':'));
}

TEST(writeStartupArgs, EndsWhenTheDiskIsFull)
{
    const TempDir dir;
    fs::create_symlink("/dev/full", dir.path("args.properties"));
    EXPECT_EQ(identifierOnAFullDisk(dir, 1), "QVMRL0117E");
    EXPECT_EQ(identifierOnAFullDisk(dir, 100000), "QVMRL0020E");
    // The shortest word that does not go into the stream's buffer; one less, and it is the number
    // of words that finds the buffer full.
    size_t fits = 1;
    size_t tooLong = 100000;
    while (tooLong - fits > 1) {
        const size_t middle = (fits + tooLong) / 2;
        if (identifierOnAFullDisk(dir, middle) == "QVMRL0020E")
            tooLong = middle;
        else
            fits = middle;
    }
    EXPECT_EQ(identifierOnAFullDisk(dir, fits), "QVMRL0116E");
}
