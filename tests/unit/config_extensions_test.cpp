#include "launcher/command/config_extensions.h"

#include "diag/SvcDebug_linux.h"
#include "diag/marker_file.h"
#include "tests/unit/fixtures.h"

#include <cerrno>

namespace {
// A merge and what it gives.
struct Merge {
    Merge(const Line& line, Props& props, const std::wstring& rcpHome = L"/nowhere")
    {
        ArgumentVector args;
        int argc = 0;
        wchar_t** argv = nullptr;
        addConfigExtentionsToArg(argc, argv, line.argc, line.argv, props.list, args, map, rcpHome);
        words = Texts(argv, argv + argc);
        vector = texts(args);
        delete[] argv;
    }

    Texts words;
    Texts vector;
    VmargMap map;
};
} // namespace

static Texts merged(const Line& line, Props& props)
{
    const Merge merge(line, props);
    EXPECT_EQ(merge.vector, merge.words);
    return merge.words;
}

// The list of extension "a" with these words, numbered from 1.
static std::vector<std::wstring> extension(const Texts& words)
{
    std::vector<std::wstring> list;
    for (size_t n = 1; n <= words.size(); ++n) {
        list.push_back(L"config.a." + std::to_wstring(n));
        list.push_back(words[n - 1]);
    }
    return list;
}

static Texts mergedWith(const Texts& extensionWords, const Line& line)
{
    Props props(extension(extensionWords));
    return merged(line, props);
}

static Texts removedPairs(std::vector<std::wstring> words, const wchar_t* option,
                          void (*remove)(ArgumentVector&, const wchar_t*))
{
    const Line line(words);
    ArgumentVector args = line.pointers;
    remove(args, option);
    return texts(args);
}

TEST(removeDuplicatePairs, LeavesTheValueOfTheDroppedOption)
{
    EXPECT_EQ(removedPairs({L"-data", L"A", L"-data", L"B"}, L"-data", removeDuplicatePairs),
              (Texts{L"-data", L"A", L"B"}));
}

TEST(removeDuplicatePairs, LeavesASingleOptionAndOtherWords)
{
    EXPECT_EQ(removedPairs({L"-data", L"A", L"-Data", L"-datax"}, L"-data", removeDuplicatePairs),
              (Texts{L"-data", L"A", L"-Data", L"-datax"}));
    EXPECT_EQ(removedPairs({}, L"-data", removeDuplicatePairs), Texts());
}

TEST(removeDuplicatePairs, CountsTheFirstElementToo)
{
    EXPECT_EQ(removedPairs({L"-data", L"-data"}, L"-data", removeDuplicatePairs),
              (Texts{L"-data"}));
}

TEST(removeDuplicateSingles, LeavesTwoOfThree)
{
    EXPECT_EQ(removedPairs({L"-debug", L"-debug", L"-debug"}, L"-debug", removeDuplicateSingles),
              (Texts{L"-debug", L"-debug"}));
}

TEST(addConfigExtentionsToArg, PassesTheWordsOnWithoutAnExtension)
{
    Props props({});
    EXPECT_EQ(
        merged(Line({L"velmora", L"-data", L"A", L"-data", L"B", L"-product", L"-product"}), props),
        (Texts{L"velmora", L"-data", L"A", L"-data", L"B", L"-product", L"-product"}));
}

TEST(addConfigExtentionsToArg, TakesVmargWordsIntoTheMapWithoutAnExtension)
{
    Props props({});
    const Merge merge(Line({L"velmora", L"vmarg.a=-Da=1=2", L"x", L"vmarg.b=", L"Vmarg.c=1"}),
                      props);
    EXPECT_EQ(merge.words, (Texts{L"velmora", L"x", L"Vmarg.c=1"}));
    EXPECT_EQ(merge.map, (VmargMap{{L"vmarg.a", L"-Da=1=2"}, {L"vmarg.b", L""}}));
}

TEST(addConfigExtentionsToArg, EndsForAVmargOfTheCommandLineWithoutAValue)
{
    EXPECT_TRUE(endsWith(
        [] {
            Props props({});
            const Line line({L"velmora", L"vmarg.a"});
            errno = EACCES;
            const Merge merge(line, props);
        },
        "QVMRL0033E: velmora invoked with an invalid vmarg.", EACCES));
}

TEST(addConfigExtentionsToArg, EndsForAVmargOfTheExtensionWithoutAValue)
{
    EXPECT_TRUE(endsWith(
        [] {
            Props props(extension({L"vmarg.a"}));
            const Line line({L"velmora", L"-config", L"a"});
            errno = EACCES;
            const Merge merge(line, props);
        },
        "QVMRL0128E: velmora invoked with an invalid vmarg.", EACCES));
}

TEST(addConfigExtentionsToArg, ConfigAsTheLastWordIsAbsentAndStays)
{
    EXPECT_EQ(mergedWith({L"-x"}, Line({L"velmora", L"-data", L"A", L"-config"})),
              (Texts{L"velmora", L"-data", L"A", L"-config"}));
}

TEST(addConfigExtentionsToArg, AnUnknownNameMergesNothingAndGoes)
{
    EXPECT_EQ(mergedWith({L"-x"}, Line({L"velmora", L"-config", L"b", L"-y"})),
              (Texts{L"velmora", L"-y"}));
}

TEST(addConfigExtentionsToArg, OnlyTheFirstConfigCounts)
{
    EXPECT_EQ(mergedWith({L"-x"}, Line({L"velmora", L"-config", L"a", L"-config", L"b"})),
              (Texts{L"velmora", L"-config", L"b", L"-x"}));
}

TEST(addConfigExtentionsToArg, AppendsTheWordsWhenThereIsNoVmargs)
{
    EXPECT_EQ(mergedWith({L"-1", L"-2", L"-3", L"-4", L"-5", L"-6"},
                         Line({L"velmora", L"-u", L"-config", L"a", L"-w"})),
              (Texts{L"velmora", L"-u", L"-w", L"-1", L"-2", L"-3", L"-4", L"-5", L"-6"}));
}

TEST(addConfigExtentionsToArg, AppendsItsVmargsTooWhenTheLauncherHasNone)
{
    EXPECT_EQ(mergedWith({L"-1", L"-2", L"-vmargs", L"-X1", L"-X2", L"-X3"},
                         Line({L"velmora", L"-config", L"a", L"-u"})),
              (Texts{L"velmora", L"-u", L"-1", L"-2", L"-vmargs", L"-X1", L"-X2", L"-X3"}));
}

TEST(addConfigExtentionsToArg, InsertsItsPlatformWordsBeforeTheLaunchersVmargs)
{
    EXPECT_EQ(mergedWith({L"-1", L"-2", L"-3", L"-4", L"-5", L"-6"},
                         Line({L"velmora", L"-config", L"a", L"-u", L"-vmargs", L"-Xmx1g"})),
              (Texts{L"velmora", L"-u", L"-1", L"-2", L"-3", L"-4", L"-5", L"-6", L"-vmargs",
                     L"-Xmx1g"}));
}

TEST(addConfigExtentionsToArg, PutsItsJvmWordsBehindTheLaunchers)
{
    EXPECT_EQ(mergedWith({L"-nosplash", L"-vmargs", L"-Xss2m"},
                         Line({L"velmora", L"-config", L"a", L"-vmargs", L"-Xmx1g"})),
              (Texts{L"velmora", L"-nosplash", L"-vmargs", L"-Xmx1g", L"-Xss2m"}));
    EXPECT_EQ(
        mergedWith({L"-1", L"-2", L"-vmargs", L"-X1", L"-X2", L"-X3"},
                   Line({L"velmora", L"-u", L"-config", L"a", L"-vmargs", L"-Xmx1g"})),
        (Texts{L"velmora", L"-u", L"-1", L"-2", L"-vmargs", L"-Xmx1g", L"-X1", L"-X2", L"-X3"}));
}

TEST(addConfigExtentionsToArg, TakesEveryVmargsOfTheExtensionForADivider)
{
    EXPECT_EQ(mergedWith({L"-1", L"-vmargs", L"-X1", L"-vmargs", L"-X2"},
                         Line({L"velmora", L"-config", L"a", L"-vmargs", L"-Xmx1g"})),
              (Texts{L"velmora", L"-1", L"-vmargs", L"-Xmx1g", L"-X1", L"-X2"}));
}

TEST(addConfigExtentionsToArg, TakesTwoOffThePlaceOfVmargsAlsoWhenConfigStandsBehindIt)
{
    // -vmargs has index 3: the words go in at 1, although neither -config nor its name precedes.
    EXPECT_EQ(mergedWith({L"-1", L"-2"},
                         Line({L"velmora", L"-u", L"-w", L"-vmargs", L"-X", L"-config", L"a"})),
              (Texts{L"velmora", L"-1", L"-2", L"-u", L"-w", L"-vmargs", L"-X"}));
}

TEST(addConfigExtentionsToArg, PutsTheSixWordsOfAnExtensionBehindVmargsTwoPlacesEarly)
{
    EXPECT_EQ(mergedWith({L"-1", L"-2", L"-3", L"-vmargs", L"-X1", L"-X2"},
                         Line({L"velmora", L"-u", L"-vmargs", L"-X", L"-config", L"a"})),
              (Texts{L"-1", L"-2", L"-3", L"velmora", L"-u", L"-vmargs", L"-X", L"-X1", L"-X2"}));
}

TEST(addConfigExtentionsToArg, VmargsAsTheFirstWordInsertsAtTheVeryFront)
{
    EXPECT_EQ(mergedWith({L"-1"}, Line({L"velmora", L"-vmargs", L"-X", L"-config", L"a"})),
              (Texts{L"-1", L"velmora", L"-vmargs", L"-X"}));
}

TEST(addConfigExtentionsToArg, TheLastVmargsGivesThePlace)
{
    // The second -vmargs has index 5; without -config and its name it has index 3.
    EXPECT_EQ(mergedWith({L"-1"}, Line({L"velmora", L"-config", L"a", L"-vmargs", L"-X", L"-vmargs",
                                        L"-Y"})),
              (Texts{L"velmora", L"-vmargs", L"-X", L"-1", L"-vmargs", L"-Y"}));
}

TEST(addConfigExtentionsToArg, CountsVmargWordsOfTheCommandLineInThePlace)
{
    // As received, -vmargs has index 4: place 2, behind the vmarg word, which goes at the end.
    Props props(extension({L"-1"}));
    const Merge merge(Line({L"velmora", L"vmarg.m=-M", L"-config", L"a", L"-vmargs", L"-X"}),
                      props);
    EXPECT_EQ(merge.words, (Texts{L"velmora", L"-1", L"-vmargs", L"-X"}));
    EXPECT_EQ(merge.map, (VmargMap{{L"vmarg.m", L"-M"}}));
}

TEST(addConfigExtentionsToArg, AGapEndsTheExtension)
{
    Props props(
        {L"config.a.1", L"-1", L"config.a.3", L"-3", L"config.a.0", L"-0", L"config.a.02", L"-02"});
    EXPECT_EQ(merged(Line({L"velmora", L"-config", L"a"}), props), (Texts{L"velmora", L"-1"}));
}

TEST(addConfigExtentionsToArg, AnEmptyWordIsSkippedAndDoesNotEndTheExtension)
{
    EXPECT_EQ(mergedWith({L"", L"-nosplash"}, Line({L"velmora", L"-config", L"a"})),
              (Texts{L"velmora", L"-nosplash"}));
    EXPECT_EQ(mergedWith({L"-1", L"", L"-2", L"-vmargs", L"", L"-X1"},
                         Line({L"velmora", L"-config", L"a", L"-vmargs", L"-X"})),
              (Texts{L"velmora", L"-1", L"-2", L"-vmargs", L"-X", L"-X1"}));
}

TEST(addConfigExtentionsToArg, FindsTheNumbersInAnyOrderAndTheFirstOfTwo)
{
    Props props({L"config.a.2", L"-2", L"config.a.1", L"-1", L"config.a.2", L"-other"});
    EXPECT_EQ(merged(Line({L"velmora", L"-config", L"a"}), props),
              (Texts{L"velmora", L"-1", L"-2"}));
}

TEST(addConfigExtentionsToArg, GoesOnBehindTheTenthWord)
{
    EXPECT_EQ(
        mergedWith({L"1", L"2", L"3", L"4", L"5", L"6", L"7", L"8", L"9", L"10", L"11"},
                   Line({L"velmora", L"-config", L"a"})),
        (Texts{L"velmora", L"1", L"2", L"3", L"4", L"5", L"6", L"7", L"8", L"9", L"10", L"11"}));
}

TEST(addConfigExtentionsToArg, VmargWordsOfTheCommandLineWinOverTheExtensions)
{
    Props props(extension({L"vmarg.Xmx=-Xmx2g", L"vmarg.Xss=-Xss1m", L"-x"}));
    const Merge merge(Line({L"velmora", L"vmarg.Xmx=-Xmx1g", L"-config", L"a"}), props);
    EXPECT_EQ(merge.words, (Texts{L"velmora", L"-x"}));
    EXPECT_EQ(merge.map, (VmargMap{{L"vmarg.Xmx", L"-Xmx1g"}, {L"vmarg.Xss", L"-Xss1m"}}));
}

TEST(addConfigExtentionsToArg, VmargWordsOnBothSidesOfVmargsGoIntoTheMap)
{
    Props props(extension({L"vmarg.c=-C", L"-vmargs", L"vmarg.d=-D", L"-Xd"}));
    const Merge merge(
        Line({L"velmora", L"-config", L"a", L"vmarg.a=-A", L"-vmargs", L"vmarg.b=-B", L"-Xb"}),
        props);
    EXPECT_EQ(merge.words, (Texts{L"velmora", L"-vmargs", L"-Xb", L"-Xd"}));
    EXPECT_EQ(
        merge.map,
        (VmargMap{
            {L"vmarg.a", L"-A"}, {L"vmarg.b", L"-B"}, {L"vmarg.c", L"-C"}, {L"vmarg.d", L"-D"}}));
}

TEST(addConfigExtentionsToArg, TheCommandLinesOptionWinsAndTheExtensionsValueStays)
{
    EXPECT_EQ(mergedWith({L"-data", L"Y"}, Line({L"velmora", L"-config", L"a", L"-data", L"X"})),
              (Texts{L"velmora", L"-data", L"X", L"Y"}));
}

TEST(addConfigExtentionsToArg, RemovesTheSecondOfEachPairOption)
{
    for (const wchar_t* option : {L"-vm", L"-data", L"-plugincustomization", L"-application",
                                  L"-product", L"-personality", L"-nl", L"-dir"})
        EXPECT_EQ(mergedWith({option, L"Y"}, Line({L"velmora", L"-config", L"a", option, L"X"})),
                  (Texts{L"velmora", option, L"X", L"Y"}));
}

TEST(addConfigExtentionsToArg, RemovesTheSecondOfEachSingleOption)
{
    for (const wchar_t* option : {L"-console", L"-debug", L"-pb4l"})
        EXPECT_EQ(mergedWith({option, L"-y"}, Line({L"velmora", L"-config", L"a", option})),
                  (Texts{L"velmora", option, L"-y"}));
}

TEST(addConfigExtentionsToArg, KeepsTheSecondOfEveryOtherOption)
{
    for (const wchar_t* option : {L"-configuration", L"-restart", L"-debugFile", L"-consoleLog"})
        EXPECT_EQ(mergedWith({option}, Line({L"velmora", L"-config", L"a", option})),
                  (Texts{L"velmora", option, option}));
}

TEST(addConfigExtentionsToArg, KeepsTheThirdOfThreeExceptForProduct)
{
    EXPECT_EQ(mergedWith({L"-nl", L"-nl"}, Line({L"velmora", L"-config", L"a", L"-nl"})),
              (Texts{L"velmora", L"-nl", L"-nl"}));
    EXPECT_EQ(
        mergedWith({L"-product", L"-product"}, Line({L"velmora", L"-config", L"a", L"-product"})),
        (Texts{L"velmora", L"-product"}));
    EXPECT_EQ(mergedWith({L"-product", L"-product", L"-product"},
                         Line({L"velmora", L"-config", L"a", L"-product"})),
              (Texts{L"velmora", L"-product", L"-product"}));
}

TEST(addConfigExtentionsToArg, PatchesTheWorkspaceOfTheProperties)
{
    Props props({L"rcp.data", L"/old", L"config.a.1", L"-data", L"config.a.2", L"/new"});
    EXPECT_EQ(merged(Line({L"velmora", L"-config", L"a"}), props),
              (Texts{L"velmora", L"-data", L"/new"}));
    EXPECT_STREQ(findProperty(L"rcp.data", props.list), L"/new");
}

TEST(addConfigExtentionsToArg, LeavesTheWorkspaceAloneWithoutAnExtension)
{
    Props props({L"rcp.data", L"/old"});
    merged(Line({L"velmora", L"-data", L"/new"}), props);
    EXPECT_STREQ(findProperty(L"rcp.data", props.list), L"/old");
}

TEST(addConfigExtentionsToArg, TheMarkerFileAddsItsWordsBehindTheProgramPath)
{
    const TempDir home;
    home.write("rcp/prov.debug/debug.txt", "");
    Props props({});
    const Merge merge(Line({L"velmora", L"-x", L"-debug", L"-pb4l", L"-console", L"-debugFile"}),
                      props, home.wdir);
    EXPECT_EQ(merge.words, (Texts{L"velmora", L"-debugFile", L"-pb4l", L"-debug", L"-console",
                                  L"-x", L"-debugFile"}));
    EXPECT_EQ(merge.vector, merge.words);
    debugFileExists(L"/nowhere");
}

TEST(addConfigExtentionsToArg, WithoutAProgramPathTheWordsOfTheMarkerFileBeginAtTheFirstPlace)
{
    const TempDir home;
    home.write("rcp/prov.debug/debug.txt", "");
    Props props({});
    const Merge merge(Line({}), props, home.wdir);
    // The second, third and fourth one each go to position 1, behind the first.
    EXPECT_EQ(merge.words, (Texts{L"-console", L"-debugFile", L"-pb4l", L"-debug"}));
    EXPECT_EQ(merge.vector, merge.words);
    debugFileExists(L"/nowhere");
}

TEST(addConfigExtentionsToArg, LooksForTheMarkerFileWhenConfigIsTheLastWord)
{
    const TempDir home;
    home.write("rcp/prov.debug/debug.txt", "");
    Props props({});
    const Merge merge(Line({L"velmora", L"-config"}), props, home.wdir);
    EXPECT_EQ(merge.words,
              (Texts{L"velmora", L"-debugFile", L"-pb4l", L"-debug", L"-console", L"-config"}));
    debugFileExists(L"/nowhere");
}

TEST(addConfigExtentionsToArg, DoesNotLookForTheMarkerFileWithAnExtension)
{
    const TempDir home;
    home.write("rcp/prov.debug/debug.txt", "");
    Props props(extension({L"-1"}));
    const Merge merge(Line({L"velmora", L"-config", L"a"}), props, home.wdir);
    EXPECT_EQ(merge.words, (Texts{L"velmora", L"-1"}));
    EXPECT_FALSE(debugFileWasFound());
}

TEST(addConfigExtentionsToArg, AsksALaterMergeWhetherTheMarkerFileWasFoundEarlier)
{
    const TempDir home;
    home.write("rcp/prov.debug/debug.txt", "");
    Props props(extension({L"-debug", L"-1", L"-console"}));
    const Merge first(Line({L"velmora"}), props, home.wdir);
    // Found once; that the file has gone since does not count.
    const Merge second(Line({L"velmora", L"-config", L"a"}), props, L"/nowhere");
    EXPECT_EQ(second.words,
              (Texts{L"velmora", L"-debugFile", L"-pb4l", L"-debug", L"-console", L"-1"}));
    debugFileExists(L"/nowhere");
}

static std::wstring restartExeOf(const Line& line, const Props& props)
{
    std::wstring exe = L"before";
    getRestartExe(exe, line.argc, line.argv, props.list, L"/opt/app");
    return exe;
}

TEST(getRestartExe, TakesTheExtensionsExecutable)
{
    const Props props({L"config.a.restartExe.win32", L"w", L"config.a.restartExe.linux", L"/x/y"});
    EXPECT_EQ(restartExeOf(Line({L"velmora", L"-config", L"a"}), props), L"/x/y");
}

TEST(getRestartExe, ReplacesTheFirstRcpHomeAndTurnsTheSeparators)
{
    const Props props({L"config.a.restartExe.linux", L"${rcp.home}\\rcp\\x${rcp.home}"});
    EXPECT_EQ(restartExeOf(Line({L"velmora", L"-config", L"a"}), props),
              L"/opt/app/rcp/x${rcp.home}");
}

TEST(getRestartExe, LeavesTheResultWhenThereIsNone)
{
    const Props props({L"config.a.restartExe.linux", L"/x"});
    EXPECT_EQ(restartExeOf(Line({L"velmora"}), props), L"before");
    EXPECT_EQ(restartExeOf(Line({L"velmora", L"-config"}), props), L"before");
    EXPECT_EQ(restartExeOf(Line({L"velmora", L"-config", L"b"}), props), L"before");
}

TEST(getRestartExe, TakesAnEmptyValueForSet)
{
    EXPECT_EQ(restartExeOf(Line({L"velmora", L"-config", L"a"}),
                           Props({L"config.a.restartExe.linux", L""})),
              L"");
}

TEST(addConfigExtentionsToArg, NamesTheWorkspaceOnceRepeatsAreRemoved)
{
    Props props({L"rcp.data", L"/old"});
    const Merge merge(Line({L"velmora", L"-config", L"a", L"-data", L"-data", L"/w"}), props);
    EXPECT_EQ(merge.words, (Texts{L"velmora", L"-data", L"/w"}));
    EXPECT_EQ(texts(props.list), (Texts{L"rcp.data", L"/w"}));
}

TEST(addConfigExtentionsToArg, NamesTheWorkspaceBeforeNamedArgumentsAreTakenOut)
{
    Props props({L"config.a.1", L"-data", L"config.a.2", L"vmarg.x=-Dq", L"rcp.data", L"/old"});
    const Merge merge(Line({L"velmora", L"-config", L"a"}), props);
    EXPECT_EQ(merge.words, (Texts{L"velmora", L"-data"}));
    EXPECT_EQ(merge.map, (VmargMap{{L"vmarg.x", L"-Dq"}}));
    EXPECT_EQ(texts(props.list), (Texts{L"config.a.1", L"-data", L"config.a.2", L"vmarg.x=-Dq",
                                        L"rcp.data", L"vmarg.x=-Dq"}));
}
