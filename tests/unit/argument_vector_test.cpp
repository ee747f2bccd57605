#include "platform/linux/argument_vector.h"

#include "tests/unit/support.h"

#include "platform/linux/wide_strings.h"

static std::vector<std::wstring> converted(std::vector<std::string> narrow)
{
    std::vector<char*> argv;
    for (std::string& word : narrow)
        argv.push_back(&word[0]);
    const int argc = static_cast<int>(argv.size());
    argv.push_back(nullptr);
    const ArgumentVector wide = wideArguments(argc, argv.data());
    const std::vector<std::wstring> result = texts(wide);
    for (wchar_t* word : wide)
        freeString(word);
    return result;
}

TEST(wideArguments, GivesOneWordForEachWithoutATerminatingNull)
{
    const std::vector<std::wstring> expected = {L"/opt/app/rcp/velmora", L"-data", L"", L"a b"};
    EXPECT_EQ(converted({"/opt/app/rcp/velmora", "-data", "", "a b"}), expected);
    EXPECT_EQ(converted({}), std::vector<std::wstring>());
}

TEST(wideArguments, ConvertsTheLocalesBytes)
{
    const std::vector<std::wstring> expected = {L"\u00e9\u20ac"};
    EXPECT_EQ(converted({"\xc3\xa9\xe2\x82\xac"}), expected);
}

TEST(wideArguments, KeepsThePlaceOfAWordThatCannotBeConverted)
{
    const std::vector<std::wstring> expected = {L"a", L"", L"b"};
    EXPECT_EQ(converted({"a", "x\xff", "b"}), expected);
}

// The position of `option` among the first `count` words.
static int positionOf(const wchar_t* option, std::vector<std::wstring> list, int count)
{
    ArgumentVector args;
    for (std::wstring& word : list)
        args.push_back(&word[0]);
    return findOption(option, count, args.data());
}

TEST(findOption, GivesTheFirstOfSeveral)
{
    const std::vector<std::wstring> args = {L"velmora", L"-debug", L"-data", L"A", L"-data", L"B"};
    EXPECT_EQ(positionOf(L"-data", args, 6), 2);
    EXPECT_EQ(positionOf(L"B", args, 6), 5);
}

TEST(findOption, NeverLooksAtTheProgramPath)
{
    const std::vector<std::wstring> args = {L"-data", L"A", L"-data"};
    EXPECT_EQ(positionOf(L"-data", args, 3), 2);
    EXPECT_EQ(positionOf(L"-data", args, 1), -1);
}

TEST(findOption, ComparesWholeWordsWithTheirCase)
{
    const std::vector<std::wstring> args = {L"velmora", L"-Data",  L"-dat",
                                            L"-datax",  L"--data", L" -data"};
    EXPECT_EQ(positionOf(L"-data", args, 6), -1);
}

TEST(findOption, LooksBehindVmargsToo)
{
    const std::vector<std::wstring> args = {L"velmora", L"-vmargs", L"-data"};
    EXPECT_EQ(positionOf(L"-data", args, 3), 2);
}

TEST(findOption, LooksAtSoManyWords)
{
    const std::vector<std::wstring> args = {L"velmora", L"a", L"-data"};
    EXPECT_EQ(positionOf(L"-data", args, 3), 2);
    EXPECT_EQ(positionOf(L"-data", args, 2), -1);
    EXPECT_EQ(positionOf(L"-data", args, 0), -1);
}

static bool haveAmong(const char* option, std::vector<std::string> narrow, int count)
{
    std::vector<char*> args;
    for (std::string& word : narrow)
        args.push_back(&word[0]);
    args.push_back(nullptr);
    return haveLaunchOption(option, args.data(), count);
}

TEST(haveLaunchOption, CountsTheFirstWordToo)
{
    EXPECT_TRUE(haveAmong("-restart", {"-restart", "a"}, 2));
    EXPECT_TRUE(haveAmong("-restart", {"velmora", "a", "-restart"}, 3));
}

TEST(haveLaunchOption, LooksAtSoManyWords)
{
    EXPECT_TRUE(haveAmong("-console", {"a", "-console"}, 2));
    EXPECT_FALSE(haveAmong("-console", {"a", "-console"}, 1));
    EXPECT_FALSE(haveAmong("-console", {"-console"}, 0));
    EXPECT_FALSE(haveAmong("-console", {}, 0));
}

TEST(haveLaunchOption, ComparesWholeWordsByteByByte)
{
    EXPECT_FALSE(haveAmong("-console", {"-consol", "-consoles", "-Console", ""}, 4));
    EXPECT_TRUE(haveAmong("\xff\xc3", {"\xff", "\xff\xc3"}, 2));
}
