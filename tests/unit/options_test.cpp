#include "launcher/command/options.h"

#include "tests/unit/fixtures.h"

#include <cerrno>

// A predicate and the word that it looks for.
static void expectWord(bool (*predicate)(int, wchar_t**), const wchar_t* word)
{
    Line given({L"velmora", L"a", word});
    EXPECT_TRUE(predicate(given.argc, given.argv));
    Line absent({L"velmora", L"a"});
    EXPECT_FALSE(predicate(absent.argc, absent.argv));
    Line programPath({word, L"a"});
    EXPECT_FALSE(predicate(programPath.argc, programPath.argv));
    Line longer({L"velmora", (std::wstring(word) + L"x").c_str()});
    EXPECT_FALSE(predicate(longer.argc, longer.argv));
    Line behindVmargs({L"velmora", L"-vmargs", word});
    EXPECT_TRUE(predicate(behindVmargs.argc, behindVmargs.argv));
}

TEST(isRestart, LooksForItsWholeWord)
{
    expectWord(isRestart, L"-restart");
}

TEST(isDCommandOnly, LooksForItsWholeWord)
{
    expectWord(isDCommandOnly, L"-dcommand_only");
}

TEST(isInitMUService, LooksForItsWholeWord)
{
    expectWord(isInitMUService, L"-initMUService");
}

TEST(isResetConfig, LooksForItsWholeWord)
{
    expectWord(isResetConfig, L"-resetconfig");
}

TEST(isVmOverride, LooksForItsWholeWord)
{
    expectWord(isVmOverride, L"-vm");
}

TEST(isDebug, LooksForItsWholeWord)
{
    expectWord(isDebug, L"-debug");
}

TEST(isDebug, IsFalseOnARestart)
{
    Line line({L"velmora", L"-debug", L"-restart"});
    EXPECT_FALSE(isDebug(line.argc, line.argv));
    Line otherOrder({L"velmora", L"-restart", L"-debug"});
    EXPECT_FALSE(isDebug(otherOrder.argc, otherOrder.argv));
}

TEST(isDebug, KnowsNoOtherCase)
{
    Line line({L"velmora", L"-Debug"});
    EXPECT_FALSE(isDebug(line.argc, line.argv));
}

TEST(isISMPProvisioning, NeedsBothWords)
{
    Line both({L"velmora", L"-provManifest", L"-velmoraWait"});
    EXPECT_TRUE(isISMPProvisioning(both.argc, both.argv));
    Line waitAlone({L"velmora", L"-velmoraWait"});
    EXPECT_FALSE(isISMPProvisioning(waitAlone.argc, waitAlone.argv));
    Line manifestAlone({L"velmora", L"-provManifest"});
    EXPECT_FALSE(isISMPProvisioning(manifestAlone.argc, manifestAlone.argv));
}

TEST(doVersionCheck, ShowsTheVersionOnTheFatalPathWithThreeBlanks)
{
    Line line({L"velmora", L"-version"});
    EXPECT_TRUE(endsWith(
        [&] {
            errno = EACCES;
            doVersionCheck(line.argc, line.argv);
        },
        "QVMRL0031I:   version = \"20131002.1404\"", EACCES));
}

TEST(doVersionCheck, IgnoresTheWordBesideAnyOther)
{
    Line line({L"velmora", L"-version", L"-data", L"x"});
    Line one({L"velmora", L"-version", L"x"});
    Line none({L"velmora", L"-Version"});
    Line path({L"-version"});
    EXPECT_EQ(logOf(true,
                    [&] {
                        doVersionCheck(line.argc, line.argv);
                        doVersionCheck(one.argc, one.argv);
                        doVersionCheck(none.argc, none.argv);
                        doVersionCheck(path.argc, path.argv);
                    }),
              "");
}

static const char* const BAD_COUNT = "QVMRL0069E: velmora invoked with an invalid URL handler "
                                     "action - bad argument count.";

static testing::AssertionResult refusesCount(const Line& line)
{
    return endsWith(
        [&] {
            errno = EACCES;
            validateIfUrlHandlerLaunch(line.argc, line.argv);
        },
        BAD_COUNT, EACCES);
}

static std::string acceptsCount(const Line& line)
{
    return logOf(true, [&] { validateIfUrlHandlerLaunch(line.argc, line.argv); });
}

TEST(validateIfUrlHandlerLaunch, ChecksNothingWithoutTheOption)
{
    Line line({L"velmora", L"a", L"b"});
    EXPECT_EQ(acceptsCount(line), "");
}

TEST(validateIfUrlHandlerLaunch, ExpectsTheNumberOfAllWords)
{
    Line right({L"velmora", L"-maxargcnt", L"4", L"a"});
    EXPECT_EQ(acceptsCount(right), "");
    Line tooLow({L"velmora", L"-maxargcnt", L"3", L"a"});
    EXPECT_TRUE(refusesCount(tooLow));
    Line tooHigh({L"velmora", L"-maxargcnt", L"5", L"a"});
    EXPECT_TRUE(refusesCount(tooHigh));
}

TEST(validateIfUrlHandlerLaunch, DoesNotCountARestart)
{
    Line right({L"velmora", L"-maxargcnt", L"4", L"a", L"-restart"});
    EXPECT_EQ(acceptsCount(right), "");
    Line tooLow({L"velmora", L"-maxargcnt", L"3", L"a", L"-restart"});
    EXPECT_TRUE(refusesCount(tooLow));
    Line tooHigh({L"velmora", L"-maxargcnt", L"5", L"a", L"-restart"});
    EXPECT_TRUE(refusesCount(tooHigh));
}

TEST(validateIfUrlHandlerLaunch, CountsASecondRestart)
{
    Line right({L"velmora", L"-maxargcnt", L"4", L"-restart", L"-restart"});
    EXPECT_EQ(acceptsCount(right), "");
    Line tooLow({L"velmora", L"-maxargcnt", L"3", L"-restart", L"-restart"});
    EXPECT_TRUE(refusesCount(tooLow));
}

TEST(validateIfUrlHandlerLaunch, CountsNothingForNoNumber)
{
    Line last({L"velmora", L"-maxargcnt"});
    EXPECT_TRUE(refusesCount(last));
    Line word({L"velmora", L"-maxargcnt", L"three"});
    EXPECT_TRUE(refusesCount(word));
    Line empty({L"velmora", L"-maxargcnt", L""});
    EXPECT_TRUE(refusesCount(empty));
}

TEST(validateIfUrlHandlerLaunch, RefusesNumbersBeyondEveryCount)
{
    // 2^32 + 3 and 2^64 + 3 would be the right count, three, if a bit got lost.
    for (const wchar_t* count : {L"4294967299", L"18446744073709551619"}) {
        const Line line({L"velmora", L"-maxargcnt", count});
        EXPECT_TRUE(fatalLineHolds([&] { validateIfUrlHandlerLaunch(line.argc, line.argv); },
                                   std::string(BAD_COUNT) + " : "));
    }
}

TEST(validateIfUrlHandlerLaunch, TakesTheFirstOfTwo)
{
    Line line({L"velmora", L"-maxargcnt", L"5", L"-maxargcnt", L"9"});
    EXPECT_EQ(acceptsCount(line), "");
}

TEST(validateThatDoubleQuotesNotUsed, EndsForAQuoteInAnyWord)
{
    const char* message = "QVMRL0089E: velmora invoked with double quote in arg - bad argument.";
    Line inTheMiddle({L"velmora", L"a", L"b\"c"});
    Line inThePath({L"vel\"mora", L"a"});
    Line alone({L"velmora", L"\""});
    for (const Line* line : {&inTheMiddle, &inThePath, &alone})
        EXPECT_TRUE(endsWith(
            [&] {
                errno = EACCES;
                validateThatDoubleQuotesNotUsed(line->argc, line->argv);
            },
            message, EACCES));
}

TEST(validateThatDoubleQuotesNotUsed, AcceptsOtherQuotes)
{
    Line line({L"velmora", L"'a'", L"`b`", L"\x201c"});
    EXPECT_EQ(logOf(true, [&] { validateThatDoubleQuotesNotUsed(line.argc, line.argv); }), "");
}

static testing::AssertionResult refusesName(const Line& line, const char* message)
{
    return endsWith(
        [&] {
            errno = EACCES;
            validateNoJavaLibraryPath(line.argc, line.argv);
        },
        message, EACCES);
}

static const char* const JVM_PATH =
    "QVMRL0190E: velmora invoked with arg containing \"jvm.library.path\" - not allowed.";
static const char* const JAVA_PATH =
    "QVMRL0191E: velmora invoked with arg containing \"java.library.path\" - not allowed.";
static const char* const JAVA_HOME =
    "QVMRL0192E: velmora invoked with arg containing \"java.home\" - not allowed.";

TEST(validateNoJavaLibraryPath, FindsEachNameAnywhereInAWord)
{
    EXPECT_TRUE(refusesName(Line({L"velmora", L"-Djvm.library.path=/x"}), JVM_PATH));
    EXPECT_TRUE(refusesName(Line({L"velmora", L"a", L"java.library.path"}), JAVA_PATH));
    EXPECT_TRUE(refusesName(Line({L"velmora", L"-Dx=java.home.bak"}), JAVA_HOME));
}

TEST(validateNoJavaLibraryPath, LooksAtTheProgramPathToo)
{
    EXPECT_TRUE(refusesName(Line({L"/opt/java.home/velmora"}), JAVA_HOME));
}

TEST(validateNoJavaLibraryPath, AsksForTheThreeNamesInTheirOrderWithinAWord)
{
    EXPECT_TRUE(
        refusesName(Line({L"v", L"java.home,java.library.path,jvm.library.path"}), JVM_PATH));
    EXPECT_TRUE(refusesName(Line({L"v", L"java.home,java.library.path"}), JAVA_PATH));
}

TEST(validateNoJavaLibraryPath, GoesThroughTheWordsOneByOne)
{
    EXPECT_TRUE(refusesName(Line({L"v", L"java.home", L"jvm.library.path"}), JAVA_HOME));
    EXPECT_TRUE(refusesName(Line({L"v", L"java.library.path", L"jvm.library.path"}), JAVA_PATH));
}

TEST(validateNoJavaLibraryPath, AcceptsEverythingElse)
{
    Line line({L"velmora", L"java.Home", L"JVM.library.path", L"javahome", L"library.path"});
    EXPECT_EQ(logOf(true, [&] { validateNoJavaLibraryPath(line.argc, line.argv); }), "");
}

TEST(validateIfUrlHandlerLaunch, DecisionANumberWithAMinusSignIsNone)
{
    // Four, once taken modulo the width: 2^64 - (2^64 - 4) and 2^32 - (2^32 - 4).
    for (const wchar_t* count : {L"-18446744073709551612", L"-4294967292", L"-4",
                                 L" -18446744073709551612", L"\t-4294967292"}) {
        Line line({L"velmora", L"-maxargcnt", count, L"a"});
        EXPECT_FATAL(validateIfUrlHandlerLaunch(line.argc, line.argv), "QVMRL0069E");
    }
}

TEST(validateIfUrlHandlerLaunch, TakesTheDigitsThatTheWordBeginsWith)
{
    for (const wchar_t* count : {L"4", L"+4", L" 4", L"04", L"4x", L"4-x", L"4 -5"}) {
        Line line({L"velmora", L"-maxargcnt", count, L"a"});
        EXPECT_EQ(logOf(false, [&] { validateIfUrlHandlerLaunch(line.argc, line.argv); }), "");
    }
}
