#include "diag/SvcDebug_linux.h"
#include "diag/marker_file.h"

#include "tests/unit/separate_process.h"
#include "tests/unit/support.h"

#include <cerrno>
#include <cstdio>
#include <ctime>
#include <cwchar>
#include <fcntl.h>
#include <filesystem>
#include <memory>
#include <regex>
#include <sys/stat.h>
#include <unistd.h>

namespace fs = std::filesystem;

// Half of a pair: in no encoding a character of its own.
static const wchar_t NO_CHARACTER[] = {0xd800, 0};

static std::string a(size_t count)
{
    return std::string(count, 'a');
}

static std::wstring wideA(size_t count)
{
    return std::wstring(count, L'a');
}

static std::vector<std::string> namesIn(const std::string& dir)
{
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(dir))
        names.push_back(entry.path().filename());
    std::sort(names.begin(), names.end());
    return names;
}

static bool isTracedName(const std::string& name)
{
    return std::regex_match(name, std::regex(R"(velmora_\d{8}_\d{6}_\d{3}\.log)"));
}

// ---- Switches ----------------------------------------------------------------------------------

TEST(setDebug, IsOffUntilTheFirstCall)
{
    EXPECT_TRUE(holdsInChild([] { EXPECT_FALSE(isTracing()); }));
}

TEST(setDebug, SwitchesTracing)
{
    setDebug(true);
    EXPECT_TRUE(isTracing());
    setDebug(false);
    EXPECT_FALSE(isTracing());
}

TEST(setDebug, StoresTheSettingThatWasInForce)
{
    bool saved = true;
    setDebug(false);
    setDebug(true, saved);
    EXPECT_FALSE(saved);
    EXPECT_TRUE(isTracing());
    setDebug(false, saved);
    EXPECT_TRUE(saved);
    EXPECT_FALSE(isTracing());
}

TEST(ForcedTrace, RestoresTheSetting)
{
    for (const bool setting : {false, true}) {
        setDebug(setting);
        {
            const ForcedTrace forced;
            EXPECT_TRUE(isTracing());
        }
        EXPECT_EQ(isTracing(), setting);
    }
    setDebug(false);
}

TEST(ForcedTrace, BringsALineIntoTheLogWithoutTracing)
{
    EXPECT_EQ(logOf(false,
                    [] {
                        SvcDebugOutA("before");
                        {
                            const ForcedTrace forced;
                            SvcDebugOutA("forced");
                        }
                        SvcDebugOutA("after");
                    }),
              "forced\n");
}

// ---- Trace lines -------------------------------------------------------------------------------

static void outputDoit(const char* format, ...) __attribute__((format(printf, 1, 2)));
static void outputDoit(const char* format, ...)
{
    va_list arguments;
    va_start(arguments, format);
    output_doit(format, arguments);
    va_end(arguments);
}

TEST(traceLines, AreNotWrittenWhileTracingIsOff)
{
    wchar_t value[] = L"v";
    wchar_t* values[] = {value};
    EXPECT_EQ(logOf(false,
                    [&] {
                        Output("a %d", 1);
                        SvcDebugOutA("a");
                        SvcDebugOutA("a %d", 1);
                        SvcDebugOutA("a %s", "b");
                        SvcDebugOutW(L"a %s", L"b");
                        SvcDebugOutW(L"a", 1, values);
                        SvcDebugLastError(L"a %s", L"b");
                        SvcDebugLastError(L"a");
                    }),
              "");
}

TEST(Output, WritesOneLineInTheMannerOfPrintf)
{
    EXPECT_EQ(logOf(true, [] { Output("%s=%d%%", "x", 50); }), "x=50%\n");
    EXPECT_EQ(logOf(true, [] { Output("%s", ""); }), "\n");
}

TEST(output_doit, WritesWhateverTheSetting)
{
    EXPECT_EQ(logOf(false, [] { outputDoit("%s=%d", "x", 7); }), "x=7\n");
}

TEST(Output, WritesALineOf4095BytesWhole)
{
    EXPECT_EQ(logOf(true, [] { Output("%s", a(4094).c_str()); }), a(4094) + "\n");
    EXPECT_EQ(logOf(true, [] { Output("%s", a(4095).c_str()); }), a(4095) + "\n");
}

TEST(Output, DecisionALongerLineIsCutTo4095BytesAndEnds)
{
    EXPECT_EQ(logOf(true, [] { Output("%s", (a(4095) + "b").c_str()); }), a(4095) + "\n");
    EXPECT_EQ(logOf(true, [] { Output("%s%s", a(9000).c_str(), "b"); }), a(4095) + "\n");
    EXPECT_EQ(logOf(true, [] { Output("%s\xc3\xa9", a(4094).c_str()); }), a(4094) + "\xc3\n");
}

TEST(LineBlock, BringsItsLinesIntoTheFileWhenItEnds)
{
    TempDir dir;
    EXPECT_TRUE(holdsInChild([&] {
        EXPECT_TRUE(enableLogging(dir.wdir));
        setDebug(true);
        {
            const LineBlock block;
            SvcDebugOutA("first");
            SvcDebugOutA("second");
            EXPECT_EQ(dir.read("velmora.log"), "\n");
        }
        EXPECT_EQ(dir.read("velmora.log"), "\nfirst\nsecond\n");
        SvcDebugOutA("third");
        EXPECT_EQ(dir.read("velmora.log"), "\nfirst\nsecond\nthird\n");
    }));
}

TEST(LineBlock, AnErrorLineDoesNotWaitForItsEnd)
{
    TempDir dir;
    EXPECT_TRUE(holdsInChild([&] {
        EXPECT_TRUE(enableLogging(dir.wdir));
        setDebug(true);
        const LineBlock block;
        SvcDebugOutA("first");
        fatalErrorA("second", GO_ON, WITHOUT_ERRNO);
        EXPECT_EQ(dir.read("velmora.log"), "\nfirst\nsecond\n");
    }));
}

TEST(LineBlock, LeavesHeldLinesHeld)
{
    TempDir dir;
    EXPECT_TRUE(holdsInChild([&] {
        {
            const LineBlock block;
            fatalErrorA("first", GO_ON, WITHOUT_ERRNO);
        }
        EXPECT_TRUE(enableLogging(dir.wdir));
        EXPECT_EQ(dir.read("velmora.log"), "first\n\n");
    }));
}

TEST(SvcDebugOutA, WritesATextAsItStands)
{
    EXPECT_EQ(logOf(true, [] { SvcDebugOutA("100% %s %n %d"); }), "100% %s %n %d\n");
}

TEST(SvcDebugOutA, WritesAFormatWithOneArgument)
{
    EXPECT_EQ(logOf(true, [] { SvcDebugOutA("<%d>", -42); }), "<-42>\n");
    EXPECT_EQ(logOf(true, [] { SvcDebugOutA("<%s>", "100% %d"); }), "<100% %d>\n");
}

TEST(SvcDebugOutA, DropsATextOrFormatOf1000Characters)
{
    EXPECT_EQ(logOf(true, [] { SvcDebugOutA(a(999).c_str()); }), a(999) + "\n");
    EXPECT_EQ(logOf(true, [] { SvcDebugOutA(a(1000).c_str()); }), "");
    EXPECT_EQ(logOf(true, [] { SvcDebugOutA((a(997) + "%d").c_str(), 42); }), a(997) + "42\n");
    EXPECT_EQ(logOf(true, [] { SvcDebugOutA((a(998) + "%d").c_str(), 42); }), "");
    EXPECT_EQ(logOf(true, [] { SvcDebugOutA((a(997) + "%s").c_str(), "x"); }), a(997) + "x\n");
    EXPECT_EQ(logOf(true, [] { SvcDebugOutA((a(998) + "%s").c_str(), "x"); }), "");
}

TEST(SvcDebugOutA, DecisionAnArgumentMayBeLonger)
{
    EXPECT_EQ(logOf(true, [] { SvcDebugOutA("%s", a(1000).c_str()); }), a(1000) + "\n");
    EXPECT_EQ(logOf(true, [] { SvcDebugOutA("%s", a(4095).c_str()); }), a(4095) + "\n");
    EXPECT_EQ(logOf(true, [] { SvcDebugOutA("%s", a(4096).c_str()); }), a(4095) + "\n");
}

TEST(SvcDebugOutW, ConvertsFormatAndArgument)
{
    EXPECT_EQ(logOf(true, [] { SvcDebugOutW(L"caf\u00e9 \"%s\"!", L"\u20ac 100% %d"); }),
              "caf\xc3\xa9 \"\xe2\x82\xac 100% %d\"!\n");
    EXPECT_EQ(logOf(true, [] { SvcDebugOutW(L"without", L"x"); }), "without\n");
}

TEST(SvcDebugOutW, WritesAnArgumentThatCannotBeConvertedAsEmpty)
{
    EXPECT_EQ(logOf(true, [] { SvcDebugOutW(L"<%s>", NO_CHARACTER); }), "<>\n");
}

TEST(SvcDebugOutW, DropsAFormatOf1000CharactersBeforeTheConversion)
{
    // 997 characters of two bytes, and the conversion.
    const std::wstring format = std::wstring(997, L'\u00e9') + L"%s";
    std::string bytes;
    for (int i = 0; i < 997; ++i)
        bytes += "\xc3\xa9";
    EXPECT_EQ(logOf(true, [&] { SvcDebugOutW(format.c_str(), L"x"); }), bytes + "x\n");
    EXPECT_EQ(logOf(true, [&] { SvcDebugOutW((L"b" + format).c_str(), L"x"); }), "");
}

TEST(SvcDebugOutW, TakesALongerArgument)
{
    EXPECT_EQ(logOf(true, [] { SvcDebugOutW(L"%s", wideA(1000).c_str()); }), a(1000) + "\n");
}

static std::string listLog(const std::wstring& name, std::vector<std::wstring> values)
{
    std::vector<wchar_t*> list;
    for (std::wstring& value : values)
        list.push_back(&value[0]);
    return logOf(true,
                 [&] { SvcDebugOutW(name.c_str(), static_cast<int>(list.size()), list.data()); });
}

TEST(SvcDebugOutWList, WritesNameAndValuesAndAnEmptyLine)
{
    EXPECT_EQ(listLog(L"argv", {L"a", L"b"}), "argv=\"a, b, \"\n\n");
    EXPECT_EQ(listLog(L"argv", {L""}), "argv=\", \"\n\n");
    EXPECT_EQ(listLog(L"argv", {}), "argv=\"\"\n\n");
    EXPECT_EQ(listLog(L"caf\u00e9", {L"\u20ac"}), "caf\xc3\xa9=\"\xe2\x82\xac, \"\n\n");
}

TEST(SvcDebugOutWList, WritesSoManyValues)
{
    wchar_t first[] = L"a";
    wchar_t second[] = L"b";
    wchar_t* values[] = {first, second};
    EXPECT_EQ(logOf(true, [&] { SvcDebugOutW(L"n", 1, values); }), "n=\"a, \"\n\n");
}

TEST(SvcDebugOutWList, DeliberatelyTheTextIsItsOwnFormat)
{
    EXPECT_EQ(listLog(L"argv", {L"50%%", L"100%", L"%s%n%d", L"%y"}),
              "argv=\"50%, 100%, , %y, \"\n\n");
    // The conversion may go from one value to the next: a percent sign, a comma and a blank.
    EXPECT_EQ(listLog(L"%%name", {L"5%", L"d"}), "%name=\"5%, d, \"\n\n");
    EXPECT_EQ(listLog(L"n", {L"%-20"}), "n=\"%-20, \"\n\n");
}

TEST(SvcDebugOutWList, DropsANameOf1000Characters)
{
    EXPECT_EQ(listLog(wideA(999), {L"x"}), a(999) + "=\"x, \"\n\n");
    EXPECT_EQ(listLog(wideA(1000), {L"x"}), "");
}

TEST(SvcDebugOutWList, TakesValuesUpToTheLimitOfALine)
{
    EXPECT_EQ(listLog(L"n", {wideA(2000), wideA(1000)}),
              "n=\"" + a(2000) + ", " + a(1000) + ", \"\n\n");
    // 3 + 4088 bytes, comma, blank, quote and the line end of the text: 4095.
    EXPECT_EQ(listLog(L"n", {wideA(4088)}), "n=\"" + a(4088) + ", \"\n\n");
    // One more, and the text's own line end is cut; two more, and the quote is cut as well.
    EXPECT_EQ(listLog(L"n", {wideA(4089)}), "n=\"" + a(4089) + ", \"\n");
    EXPECT_EQ(listLog(L"n", {wideA(4090)}), "n=\"" + a(4090) + ", \n");
}

TEST(SvcDebugLastError, IsTheSameAsTheWideForm)
{
    EXPECT_EQ(logOf(true, [] { SvcDebugLastError(L"caf\u00e9 %s!", L"x"); }), "caf\xc3\xa9 x!\n");
    EXPECT_EQ(logOf(true, [] { SvcDebugLastError((wideA(998) + L"%s").c_str(), L"x"); }), "");
}

TEST(SvcDebugLastError, HasAnEmptyArgumentInItsSecondForm)
{
    EXPECT_EQ(logOf(true, [] { SvcDebugLastError(L"a %s b"); }), "a  b\n");
    EXPECT_EQ(logOf(true, [] { SvcDebugLastError(wideA(999).c_str()); }), a(999) + "\n");
    EXPECT_EQ(logOf(true, [] { SvcDebugLastError(wideA(1000).c_str()); }), "");
}

// ---- Error lines -------------------------------------------------------------------------------

static void errDoit(bool withErrno, std::string& out, const char* format, ...)
    __attribute__((format(printf, 3, 4)));
static void errDoit(bool withErrno, std::string& out, const char* format, ...)
{
    va_list arguments;
    va_start(arguments, format);
    err_doit(withErrno, out, format, arguments);
    va_end(arguments);
}

TEST(err_doit, WritesWhateverTheSettingAndCopiesTheLineWithItsEnd)
{
    std::string line;
    EXPECT_EQ(logOf(false, [&] { errDoit(WITHOUT_ERRNO, line, "%s=%d", "x", 7); }), "x=7\n");
    EXPECT_EQ(line, "x=7\n");
}

TEST(err_doit, AddsTheReasonAtItsEntry)
{
    std::string line;
    EXPECT_EQ(logOf(false,
                    [&] {
                        errno = EACCES;
                        errDoit(WITH_ERRNO, line, "%s", "x");
                    }),
              "x : Permission denied\n");
    EXPECT_EQ(line, "x : Permission denied\n");
    EXPECT_EQ(logOf(false,
                    [&] {
                        errno = 0;
                        errDoit(WITH_ERRNO, line, "%s", "x");
                    }),
              "x : Success\n");
}

TEST(err_doit, CutsTextAndReasonTogetherAt4095Bytes)
{
    // " : Permission denied" has 20 bytes.
    const auto logWith = [](size_t length) {
        return logOf(false, [&] {
            std::string line;
            errno = EACCES;
            errDoit(WITH_ERRNO, line, "%s", a(length).c_str());
        });
    };
    EXPECT_EQ(logWith(4075), a(4075) + " : Permission denied\n");
    EXPECT_EQ(logWith(4076), a(4076) + " : Permission denie\n");
    EXPECT_EQ(logWith(4094), a(4094) + " \n");
    EXPECT_EQ(logWith(4095), a(4095) + "\n");
    EXPECT_EQ(logWith(5000), a(4095) + "\n");
}

TEST(err_doit, CopiesTheLineAsItWasCut)
{
    std::string line;
    logOf(false, [&] { errDoit(WITHOUT_ERRNO, line, "%s", a(4096).c_str()); });
    EXPECT_EQ(line, a(4095) + "\n");
}

TEST(fatalError, ForwardsItsArguments)
{
    std::string line;
    EXPECT_EQ(logOf(false,
                    [&] {
                        errno = ENOENT;
                        fatalError(WITH_ERRNO, line, "%d %ls", 5, L"\u00e9");
                    }),
              "5 \xc3\xa9 : No such file or directory\n");
    EXPECT_EQ(line, "5 \xc3\xa9 : No such file or directory\n");
}

TEST(fatalErrorA, GoesOnWhenTold)
{
    EXPECT_EQ(logOf(false,
                    [] {
                        errno = EACCES;
                        fatalErrorA("wide <%ls>", L"\u20ac 100% %d", GO_ON, WITH_ERRNO);
                        errno = EACCES;
                        fatalErrorA("narrow <%s>", "\xe2\x82\xac 100% %d", GO_ON, WITH_ERRNO);
                        errno = EACCES;
                        fatalErrorA("text", GO_ON, WITH_ERRNO);
                        errno = EACCES;
                        fatalErrorW(L"caf\u00e9", GO_ON, WITH_ERRNO);
                    }),
              "wide <\xe2\x82\xac 100% %d> : Permission denied\n"
              "narrow <\xe2\x82\xac 100% %d> : Permission denied\n"
              "text : Permission denied\n"
              "caf\xc3\xa9 : Permission denied\n");
}

TEST(fatalErrorA, LeavesTheReasonOutWhenTold)
{
    EXPECT_EQ(logOf(false,
                    [] {
                        errno = EACCES;
                        fatalErrorA("wide <%ls>", L"x", GO_ON, WITHOUT_ERRNO);
                        fatalErrorA("narrow <%s>", "x", GO_ON, WITHOUT_ERRNO);
                        fatalErrorA("text", GO_ON, WITHOUT_ERRNO);
                        fatalErrorW(L"text", GO_ON, WITHOUT_ERRNO);
                    }),
              "wide <x>\nnarrow <x>\ntext\ntext\n");
}

TEST(fatalErrorA, IsWrittenWithTracingOnAsWell)
{
    EXPECT_EQ(logOf(true, [] { fatalErrorA("%s", "x", GO_ON, WITHOUT_ERRNO); }), "x\n");
}

TEST(fatalErrorA, TakesAFormatOf1000CharactersAndMore)
{
    const std::string format = a(1000) + "%s";
    EXPECT_EQ(logOf(false, [&] { fatalErrorA(format.c_str(), "x", GO_ON, WITHOUT_ERRNO); }),
              a(1000) + "x\n");
    EXPECT_EQ(logOf(false, [&] { fatalErrorA(a(4096).c_str(), GO_ON, WITHOUT_ERRNO); }),
              a(4095) + "\n");
}

TEST(fatalErrorA, DeliberatelyATextWithoutAnArgumentIsAFormat)
{
    EXPECT_EQ(logOf(false,
                    [] {
                        errno = EACCES;
                        fatalErrorA("50%% of %s%n 100% %y", GO_ON, WITH_ERRNO);
                        errno = EACCES;
                        fatalErrorW(L"50%% of %s%n 100%", GO_ON, WITH_ERRNO);
                    }),
              "50% of  100% %y : Permission denied\n50% of  100% : Permission denied\n");
}

TEST(fatalErrorA, EndsTheProcessWithStatus255)
{
    const auto with = [](void (*action)()) {
        return [action] {
            errno = EACCES;
            action();
        };
    };
    EXPECT_TRUE(endsWith(with([] { fatalErrorA("<%ls>", L"\u00e9", EXIT_PROCESS, WITH_ERRNO); }),
                         "<\xc3\xa9>", EACCES));
    EXPECT_TRUE(
        endsWith(with([] { fatalErrorA("<%s>", "x", EXIT_PROCESS, WITH_ERRNO); }), "<x>", EACCES));
    EXPECT_TRUE(
        endsWith(with([] { fatalErrorA("text", EXIT_PROCESS, WITH_ERRNO); }), "text", EACCES));
    EXPECT_TRUE(endsWith(with([] { fatalErrorW(L"text", EXIT_PROCESS, WITHOUT_ERRNO); }), "text"));
}

TEST(fatalErrorA, WritesNothingToTheStandardStreams)
{
    NEEDS_PRIVATE_TMP();
    TempDir dir;
    dir.write("out", "");
    const int out = open(dir.path("out").c_str(), O_WRONLY | O_CLOEXEC);
    ASSERT_GE(out, 0);
    EXPECT_TRUE(holdsInPrivateTmp([&] {
        EXPECT_EQ(statusOf([&] {
                      dup2(out, STDOUT_FILENO);
                      dup2(out, STDERR_FILENO);
                      setDebug(true);
                      SvcDebugOutA("trace");
                      enableLogging(L"/tmp/nowhere");
                      fatalErrorA("<%s>", "x", EXIT_PROCESS, WITH_ERRNO);
                  }),
                  255);
    }));
    close(out);
    EXPECT_EQ(dir.read("out"), "");
}

TEST(fatalErrorA, SavesTheHeldLinesWhenTheLogIsNotOpen)
{
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        EXPECT_EQ(statusOf([] {
                      addcstr_to_logque("first\n");
                      fatalErrorA("second", GO_ON, WITHOUT_ERRNO);
                      errno = EACCES;
                      fatalErrorA("third <%ls>", L"x", EXIT_PROCESS, WITH_ERRNO);
                  }),
                  255);
        EXPECT_EQ(namesIn("/tmp"), std::vector<std::string>{"velmora.log"});
        EXPECT_EQ(bytesOf("/tmp/velmora.log"), "first\nsecond\nthird <x> : Permission denied\n\n");
    }));
}

TEST(fatalErrorA, SavesTheHeldLinesOfATracedRunUnderANameOfTheirOwn)
{
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        EXPECT_EQ(statusOf([] {
                      setDebug(true);
                      SvcDebugOutA("first");
                      fatalErrorA("%s", "second", EXIT_PROCESS, WITHOUT_ERRNO);
                  }),
                  255);
        const std::vector<std::string> names = namesIn("/tmp");
        ASSERT_EQ(names.size(), 1u);
        EXPECT_TRUE(isTracedName(names[0])) << names[0];
        EXPECT_EQ(bytesOf("/tmp/" + names[0]), "first\nsecond\n\n");
    }));
}

TEST(fatalErrorA, EndsTheProcessAlsoWhenTheTemporaryLogCannotBeHad)
{
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        fs::create_directory("/tmp/velmora.log");
        EXPECT_EQ(statusOf([] { fatalErrorA("%s", "x", EXIT_PROCESS, WITH_ERRNO); }), 255);
        EXPECT_EQ(namesIn("/tmp"), std::vector<std::string>{"velmora.log"});
    }));
}

TEST(fatalErrorA, LeavesNoTemporaryLogWhenTheLogIsOpen)
{
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        fs::create_directory("/tmp/logs");
        EXPECT_EQ(statusOf([] {
                      enableLogging(L"/tmp/logs");
                      fatalErrorA("%s", "x", EXIT_PROCESS, WITHOUT_ERRNO);
                  }),
                  255);
        EXPECT_EQ(namesIn("/tmp"), std::vector<std::string>{"logs"});
        EXPECT_EQ(bytesOf("/tmp/logs/velmora.log"), "\nx\n");
    }));
}

TEST(GetLastErrorMsg, NamesNumberAndReason)
{
    std::string narrow = "before";
    errno = EACCES;
    GetLastErrorMsg(narrow);
    EXPECT_EQ(narrow, " Failed with error 13: Permission denied");
    std::wstring wide = L"before";
    errno = ENOENT;
    GetLastErrorMsg(wide);
    EXPECT_EQ(wide, L" Failed with error 2: No such file or directory");
}

TEST(tempOutBuffer, HasRoomFor1024Bytes)
{
    EXPECT_EQ(sizeof tempOutBuffer, 1024u);
}

// ---- The log file ------------------------------------------------------------------------------

TEST(enableLogging, BeginsWithTheHeldLinesInOrderAndAnEmptyLine)
{
    TempDir dir;
    EXPECT_TRUE(holdsInChild([&] {
        fatalErrorA("first", GO_ON, WITHOUT_ERRNO);
        setDebug(true);
        Output("second %d", 2);
        setDebug(false);
        addcstr_to_logque("third\nfourth\n");
        EXPECT_TRUE(enableLogging(dir.wdir));
        EXPECT_EQ(dir.read("velmora.log"), "first\nsecond 2\nthird\nfourth\n\n");
        fatalErrorA("fifth", GO_ON, WITHOUT_ERRNO);
        EXPECT_EQ(dir.read("velmora.log"), "first\nsecond 2\nthird\nfourth\n\nfifth\n");
    }));
}

TEST(enableLogging, BeginsWithAnEmptyLineWhenNothingIsHeld)
{
    TempDir dir;
    EXPECT_TRUE(holdsInChild([&] {
        EXPECT_TRUE(enableLogging(dir.wdir));
        EXPECT_EQ(dir.read("velmora.log"), "\n");
    }));
}

TEST(enableLogging, EmptiesTheHeldLines)
{
    TempDir dir;
    dir.makeDir("second");
    EXPECT_TRUE(holdsInChild([&] {
        addcstr_to_logque("held\n");
        EXPECT_TRUE(enableLogging(dir.wdir));
        EXPECT_TRUE(enableLogging(dir.wide("second")));
        EXPECT_EQ(dir.read("second/velmora.log"), "\n");
    }));
}

TEST(enableLogging, OverwritesThePlainLog)
{
    TempDir dir;
    dir.write("velmora.log", a(5000));
    EXPECT_TRUE(holdsInChild([&] {
        EXPECT_TRUE(enableLogging(dir.wdir));
        EXPECT_EQ(dir.read("velmora.log"), "\n");
    }));
}

TEST(enableLogging, GivesATracedRunALogOfItsOwn)
{
    TempDir dir;
    dir.write("velmora.log", "old");
    EXPECT_TRUE(holdsInChild([&] {
        setDebug(true);
        EXPECT_TRUE(enableLogging(dir.wdir));
        SvcDebugOutA("traced");
        const std::vector<std::string> names = namesIn(dir.dir);
        ASSERT_EQ(names.size(), 2u);
        EXPECT_EQ(names[0], "velmora.log");
        EXPECT_TRUE(isTracedName(names[1])) << names[1];
        EXPECT_EQ(dir.read(names[1]), "\ntraced\n");
        EXPECT_EQ(dir.read("velmora.log"), "old");
    }));
}

static std::string secondsAsText(time_t seconds)
{
    struct tm local = {};
    localtime_r(&seconds, &local);
    char text[30];
    strftime(text, sizeof text, "velmora_%Y%m%d_%H%M%S_", &local);
    return text;
}

// Makes every name of this second and the next a link to the file "held". The present second.
static time_t takeTheNamesOfTwoSeconds(const TempDir& dir)
{
    dir.write("held", "x");
    const time_t now = time(nullptr);
    for (int i = 0; i < 2000; ++i) {
        char milliseconds[8];
        snprintf(milliseconds, sizeof milliseconds, "%03d.log", i % 1000);
        const std::string name = secondsAsText(now + i / 1000) + milliseconds;
        EXPECT_EQ(link(dir.path("held").c_str(), dir.path(name).c_str()), 0);
    }
    return now;
}

// So there is no name before the second after these two; meanwhile it does not keep the machine busy.
TEST(enableLogging, NeverTakesANameThatExistsInATracedRun)
{
    // On a busy machine the two seconds may have passed before it looks for a name.
    time_t now = 0;
    std::unique_ptr<TempDir> dir;
    bool waited = false;
    for (int tries = 0; tries < 10 && !waited; ++tries) {
        dir = std::make_unique<TempDir>();
        now = takeTheNamesOfTwoSeconds(*dir);
        const pid_t child = startProcess([&] {
            setDebug(true);
            EXPECT_TRUE(enableLogging(dir->wdir));
        });
        waited = waitUntilAsleep(child);
        EXPECT_EQ(statusOf(child), 0);
    }
    EXPECT_TRUE(waited);
    EXPECT_EQ(dir->read("held"), "x");
    const std::vector<std::string> names = namesIn(dir->dir);
    ASSERT_EQ(names.size(), 2002u);
    const std::string& opened = names.back();
    EXPECT_TRUE(isTracedName(opened)) << opened;
    EXPECT_GE(opened, secondsAsText(now + 2) + "000.log");
    EXPECT_EQ(dir->read(opened), "\n");
}

TEST(enableLogging, SaysWhyItCannotOpenTheFileAndHoldsTheLine)
{
    TempDir dir;
    dir.makeDir("second");
    EXPECT_TRUE(holdsInChild([&] {
        addcstr_to_logque("held\n");
        EXPECT_FALSE(enableLogging(dir.wide("missing")));
        EXPECT_TRUE(enableLogging(dir.wide("second")));
        EXPECT_EQ(dir.read("second/velmora.log"),
                  "held\nQVMRL0019E: Could not open " + dir.path("missing/velmora.log") +
                      " for writing! : No such file or directory\n\n");
    }));
}

TEST(enableLogging, TurnsBackslashesInTheNameAndInTheMessage)
{
    TempDir dir;
    dir.makeDir("sub");
    EXPECT_TRUE(holdsInChild([&] {
        EXPECT_FALSE(enableLogging(dir.wdir + L"\\missing"));
        EXPECT_TRUE(enableLogging(dir.wdir + L"\\sub"));
        EXPECT_EQ(dir.read("sub/velmora.log"), "QVMRL0019E: Could not open " +
                                                   dir.path("missing/velmora.log") +
                                                   " for writing! : No such file or directory\n\n");
    }));
}

TEST(enableLogging, OpensAFileThatThePlatformDoesNotInherit)
{
    TempDir dir;
    EXPECT_TRUE(holdsInChild([&] {
        umask(022);
        EXPECT_TRUE(enableLogging(dir.wdir));
        int found = 0;
        for (const auto& entry : fs::directory_iterator("/proc/self/fd")) {
            std::error_code gone;
            if (fs::read_symlink(entry.path(), gone) != dir.path("velmora.log"))
                continue;
            ++found;
            EXPECT_EQ(fcntl(std::stoi(entry.path().filename()), F_GETFD), FD_CLOEXEC);
        }
        EXPECT_EQ(found, 1);
        struct stat entry = {};
        EXPECT_EQ(stat(dir.path("velmora.log").c_str(), &entry), 0);
        EXPECT_EQ(entry.st_mode & 07777, 0644u);
    }));
}

TEST(dumpLogToTempLocation, OpensTheLogInTmp)
{
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        addcstr_to_logque("held\n");
        EXPECT_TRUE(dumpLogToTempLocation());
        fatalErrorA("after", GO_ON, WITHOUT_ERRNO);
        EXPECT_EQ(bytesOf("/tmp/velmora.log"), "held\n\nafter\n");
    }));
}

TEST(dumpLogToTempLocation, IsFalseWhenTheFileCannotBeOpened)
{
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        fs::create_directory("/tmp/velmora.log");
        fs::create_directory("/tmp/logs");
        EXPECT_FALSE(dumpLogToTempLocation());
        EXPECT_TRUE(enableLogging(L"/tmp/logs"));
        EXPECT_EQ(bytesOf("/tmp/logs/velmora.log"),
                  "QVMRL0019E: Could not open /tmp/velmora.log for writing! : Is a directory\n\n");
    }));
}

TEST(dumpLogToTempLocation, LosesWhatAFifoDoesNotTakeInsteadOfWaiting)
{
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        ASSERT_EQ(mkfifo("/tmp/velmora.log", 0600), 0);
        addcstr_to_logque(std::string(1 << 20, 'x').c_str());
        EXPECT_TRUE(dumpLogToTempLocation());
        const int fd = open("/tmp/velmora.log", O_RDONLY | O_NONBLOCK | O_CLOEXEC);
        char taken[8] = "";
        EXPECT_EQ(read(fd, taken, 7), 7);
        EXPECT_STREQ(taken, "xxxxxxx");
        close(fd);
    }));
}

TEST(deleteTempLog, DoesNotWaitForTheOtherEndOfAFifo)
{
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        ASSERT_EQ(mkfifo("/tmp/velmora.log", 0600), 0);
        deleteTempLog();
        EXPECT_FALSE(fs::exists("/tmp/velmora.log"));
    }));
}

TEST(deleteTempLog, DeletesThePlainTemporaryLogAlone)
{
    NEEDS_PRIVATE_TMP();
    EXPECT_TRUE(holdsInPrivateTmp([] {
        deleteTempLog();
        for (const char* name : {"/tmp/velmora.log", "/tmp/velmora_20111024_093015_042.log"})
            fclose(fopen(name, "we"));
        deleteTempLog();
        EXPECT_EQ(namesIn("/tmp"), std::vector<std::string>{"velmora_20111024_093015_042.log"});
    }));
}

TEST(getLogLocation, IsTheLogDirectoryOfTheWorkspace)
{
    std::wstring out = L"before";
    getLogLocation(out, L"/home/anna/ws");
    EXPECT_EQ(out, L"/home/anna/ws/logs");
    getLogLocation(out, L"C:\\ws");
    EXPECT_EQ(out, L"C:/ws/logs");
    getLogLocation(out, L"");
    EXPECT_EQ(out, L"/logs");
}

// ---- The diagnostic marker file ----------------------------------------------------------------

TEST(debugFileExists, LooksForTheMarkerAndRemembersIt)
{
    TempDir dir;
    dir.write("with/rcp/prov.debug/debug.txt", "");
    dir.makeDir("without/rcp/prov.debug");
    EXPECT_TRUE(holdsInChild([] { EXPECT_FALSE(debugFileWasFound()); }));
    EXPECT_TRUE(debugFileExists(dir.wide("with")));
    EXPECT_TRUE(debugFileWasFound());
    EXPECT_FALSE(debugFileExists(dir.wide("without")));
    EXPECT_FALSE(debugFileWasFound());
}

TEST(waitForDeletionOfDebugFile, ReturnsAtOnceWhenNoneWasFound)
{
    TempDir dir;
    EXPECT_TRUE(holdsInChild([&] {
        const time_t before = time(nullptr);
        waitForDeletionOfDebugFile();
        EXPECT_FALSE(debugFileExists(dir.wdir));
        dir.write("rcp/prov.debug/debug.txt", "");
        waitForDeletionOfDebugFile();
        EXPECT_LE(time(nullptr), before + 5);
    }));
}

TEST(waitForDeletionOfDebugFile, SleepsUntilTheMarkerIsGone)
{
    TempDir dir;
    dir.write("rcp/prov.debug/debug.txt", "");
    const pid_t child = startProcess([&] {
        EXPECT_TRUE(debugFileExists(dir.wdir));
        waitForDeletionOfDebugFile();
        EXPECT_FALSE(dir.has("rcp/prov.debug/debug.txt"));
    });
    EXPECT_TRUE(waitUntilAsleep(child)) << "it did not wait";
    EXPECT_TRUE(waitUntilAsleepAgain(child)) << "it waited once";
    fs::remove(dir.path("rcp/prov.debug/debug.txt"));
    EXPECT_EQ(statusOf(child), 0);
}

TEST(fatalErrorA, KeepsItsWordsAroundAnArgumentThatTheLocaleCannotConvert)
{
    EXPECT_TRUE(endsWith(
        [] {
            errno = ENOENT;
            fatalErrorA("Unable to create %ls directory.", L"\xd800", EXIT_PROCESS, WITH_ERRNO);
        },
        "Unable to create  directory.", ENOENT));
}
