#include "launcher/command/launch_command.h"

#include "tests/unit/fixtures.h"

#include <cstring>

TEST(addPathToCommandLine, DropsTheWordsBeforeIt)
{
    EXPECT_EQ(commandOf([] {
                  addArgToCommandLine(L"-vm", true);
                  addArgToCommandLine(L"/x", true);
                  addPathToCommandLine(L"/opt/jvm/java");
              }),
              (Texts{L"/opt/jvm/java"}));
}

TEST(addArgToCommandLine, AppendsEachWordAsItStands)
{
    EXPECT_EQ(commandOf([] {
                  addPathToCommandLine(L"/p");
                  addArgToCommandLine(L"", true);
                  addArgToCommandLine(L"a b", false);
                  addArgToCommandLine(L"-debug", true);
                  addArgToCommandLine(L"-console", true);
              }),
              (Texts{L"/p", L"", L"a b", L"-debug", L"-console"}));
    EXPECT_FALSE(bDaemon);
}

TEST(addArgToCommandLine, LeavesDebugAndConsoleOutOnARestart)
{
    bRestart = true;
    EXPECT_EQ(commandOf([] {
                  addArgToCommandLine(L"-debug", true);
                  addArgToCommandLine(L"-console", true);
                  addArgToCommandLine(L"-consoleLog", true);
                  addArgToCommandLine(L"-debugFile", true);
              }),
              (Texts{L"-consoleLog", L"-debugFile"}));
    bRestart = false;
}

TEST(addArgToCommandLine, UseDaemonMarksADaemonCommand)
{
    bDaemon = false;
    commandOf([] { addArgToCommandLine(L"-useDaemonx", true); });
    EXPECT_FALSE(bDaemon);
    EXPECT_EQ(commandOf([] { addArgToCommandLine(L"-useDaemon", true); }), (Texts{L"-useDaemon"}));
    EXPECT_TRUE(bDaemon);
    bDaemon = false;
}

TEST(setSemVersion, DoesNothing)
{
    EXPECT_EQ(logOf(true, [] { setSemVersion(nullptr); }), "");
}

TEST(newExecArguments, CopiesTheWordsAsBytesWithANullAtTheEnd)
{
    char** args = nullptr;
    logOf(false, [&] { args = newExecArguments({L"/p", L"\x00e9", L""}, "B", "E"); });
    EXPECT_STREQ(args[0], "/p");
    EXPECT_STREQ(args[1], "\xc3\xa9");
    EXPECT_STREQ(args[2], "");
    EXPECT_EQ(args[3], nullptr);
    freeExecArguments(args);
}

TEST(newExecArguments, LogsEachWordWhateverTheUserAskedFor)
{
    const std::wstring longWord(1500, L'x');
    EXPECT_EQ(
        logOf(
            false,
            [&] {
                freeExecArguments(newExecArguments({L"/p", L"100%s%n", longWord}, "Begin", "End"));
            }),
        "Begin\n/p\n100%s%n\n" + std::string(1500, 'x') + "\nEnd\n");
}
