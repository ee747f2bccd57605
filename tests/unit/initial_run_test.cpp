#include "launcher/command/initial_run.h"

#include "tests/unit/fixtures.h"

static Texts wordsOf(const std::vector<std::wstring>& words)
{
    const Line line(words);
    return texts(initialRunWords(line.argc, line.argv));
}

TEST(initialRunWords, DropsWhatDoesNotSurvive)
{
    EXPECT_EQ(wordsOf({L"velmora", L"-a", L"-vmargs", L"-restart"}),
              (Texts{L"velmora", L"-config", L"initial"}));
}

TEST(initialRunWords, KeepsTheFirstOfEachInTheirOrder)
{
    EXPECT_EQ(wordsOf({L"velmora", L"-noExit", L"-console", L"-data", L"/w", L"-debug", L"-noExit",
                       L"-console", L"-data", L"/x", L"-debug"}),
              (Texts{L"velmora", L"-config", L"initial", L"-noExit", L"-console", L"-data", L"/w",
                     L"-debug"}));
}

TEST(initialRunWords, ComparesBeginnings)
{
    EXPECT_EQ(wordsOf({L"velmora", L"-database", L"x", L"-debugFile", L"-consoleLog", L"-noExitX"}),
              (Texts{L"velmora", L"-config", L"initial", L"-database", L"x", L"-debugFile",
                     L"-consoleLog", L"-noExitX"}));
    EXPECT_EQ(wordsOf({L"velmora", L"-dat", L"-debu", L"-consol", L"-noExi", L"-Data"}),
              (Texts{L"velmora", L"-config", L"initial"}));
}

TEST(initialRunWords, TakesDataAsTheLastWordAlone)
{
    EXPECT_EQ(wordsOf({L"velmora", L"-data"}),
              (Texts{L"velmora", L"-config", L"initial", L"-data"}));
}

TEST(initialRunWords, StandsACommandLineWithoutAProgram)
{
    EXPECT_EQ(texts(initialRunWords(0, nullptr)), (Texts{L"", L"-config", L"initial"}));
}
