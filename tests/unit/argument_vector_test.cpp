#include "platform/linux/argument_vector.h"

#include "tests/unit/support.h"

static std::vector<std::wstring> converted(std::vector<std::string> narrow)
{
    std::vector<char*> argv;
    for (std::string& word : narrow)
        argv.push_back(&word[0]);
    const int argc = static_cast<int>(argv.size());
    argv.push_back(nullptr);
    return texts(wideArguments(argc, argv.data()));
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

TEST(findOption, GivesTheFirstOfSeveral)
{
    ArgumentVector args = words({L"velmora", L"-debug", L"-data", L"A", L"-data", L"B"});
    EXPECT_EQ(findOption(L"-data", 6, args.data()), 2);
    EXPECT_EQ(findOption(L"B", 6, args.data()), 5);
}

TEST(findOption, NeverLooksAtTheProgramPath)
{
    ArgumentVector args = words({L"-data", L"A", L"-data"});
    EXPECT_EQ(findOption(L"-data", 3, args.data()), 2);
    EXPECT_EQ(findOption(L"-data", 1, args.data()), -1);
}

TEST(findOption, ComparesWholeWordsWithTheirCase)
{
    ArgumentVector args = words({L"velmora", L"-Data", L"-dat", L"-datax", L"--data", L" -data"});
    EXPECT_EQ(findOption(L"-data", 6, args.data()), -1);
}

TEST(findOption, LooksBehindVmargsToo)
{
    ArgumentVector args = words({L"velmora", L"-vmargs", L"-data"});
    EXPECT_EQ(findOption(L"-data", 3, args.data()), 2);
}

TEST(findOption, LooksAtSoManyWords)
{
    ArgumentVector args = words({L"velmora", L"a", L"-data"});
    EXPECT_EQ(findOption(L"-data", 3, args.data()), 2);
    EXPECT_EQ(findOption(L"-data", 2, args.data()), -1);
    EXPECT_EQ(findOption(L"-data", 0, args.data()), -1);
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
