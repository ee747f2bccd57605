#include "platform/linux/environment.h"

#include "tests/unit/support.h"

#include <cstdlib>

TEST(getEnv, GivesTheValueOfASetVariable)
{
    setenv("VELMORA_TEST", "caf\xc3\xa9 = x", 1);
    std::wstring out = L"before";
    bool set = false;
    EXPECT_EQ(logOf(true, [&] { set = getEnv(L"VELMORA_TEST", out); }), "");
    EXPECT_TRUE(set);
    EXPECT_EQ(out, L"caf\u00e9 = x");
}

TEST(getEnv, IsTrueForAVariableThatIsSetToNothing)
{
    setenv("VELMORA_TEST", "", 1);
    std::wstring out = L"before";
    bool set = false;
    EXPECT_EQ(logOf(true, [&] { set = getEnv(L"VELMORA_TEST", out); }), "");
    EXPECT_TRUE(set);
    EXPECT_EQ(out, L"");
}

TEST(getEnv, NamesAnUnsetVariableInTheTraceWithAnEmptyLineBehindIt)
{
    unsetenv("VELMORA_TEST");
    std::wstring out = L"before";
    bool set = true;
    EXPECT_EQ(logOf(true, [&] { set = getEnv(L"VELMORA_TEST", out); }),
              "QVMRL0081I:  Environmental variable 'VELMORA_TEST' is not set\n\n");
    EXPECT_FALSE(set);
    EXPECT_EQ(out, L"");
}

TEST(getEnv, WritesNothingWhileTracingIsOff)
{
    unsetenv("VELMORA_TEST");
    std::wstring out = L"before";
    EXPECT_EQ(logOf(false, [&] { EXPECT_FALSE(getEnv(L"VELMORA_TEST", out)); }), "");
    EXPECT_EQ(out, L"");
}

TEST(getEnv, ConvertsTheName)
{
    setenv("VELMORA_\xc3\xa9", "x", 1);
    std::wstring out;
    EXPECT_TRUE(getEnv(L"VELMORA_\u00e9", out));
    EXPECT_EQ(out, L"x");
    EXPECT_EQ(logOf(true, [&] { getEnv(L"VELMORA_\u00e8", out); }),
              "QVMRL0081I:  Environmental variable 'VELMORA_\xc3\xa8' is not set\n\n");
}

TEST(getEnv, IsTrueAndEmptyForAValueThatCannotBeConverted)
{
    setenv("VELMORA_TEST", "a\xff", 1);
    std::wstring out = L"before";
    EXPECT_TRUE(getEnv(L"VELMORA_TEST", out));
    EXPECT_EQ(out, L"");
}

TEST(getUserHome, IsTheValueOfHOME)
{
    setenv("HOME", "/home/anna", 1);
    std::wstring out;
    EXPECT_STREQ(getUserHome(out), L"/home/anna");
    EXPECT_EQ(out, L"/home/anna");
    const wchar_t* characters = getUserHome(out);
    EXPECT_EQ(characters, out.c_str());
}

TEST(getUserHome, IsEmptyWithoutHOME)
{
    unsetenv("HOME");
    std::wstring out = L"before";
    EXPECT_EQ(logOf(true, [&] { EXPECT_STREQ(getUserHome(out), L""); }),
              "QVMRL0081I:  Environmental variable 'HOME' is not set\n\n");
    EXPECT_EQ(out, L"");
}

TEST(setEnv, IsFalseWhenTheVariableWasSet)
{
    unsetenv("VELMORA_TEST");
    EXPECT_FALSE(setEnv(L"VELMORA_TEST", L"caf\u00e9", false));
    EXPECT_STREQ(getenv("VELMORA_TEST"), "caf\xc3\xa9");
}

TEST(setEnv, OverwritesOnlyWhenTold)
{
    setenv("VELMORA_TEST", "old", 1);
    EXPECT_FALSE(setEnv(L"VELMORA_TEST", L"new", false));
    EXPECT_STREQ(getenv("VELMORA_TEST"), "old");
    EXPECT_FALSE(setEnv(L"VELMORA_TEST", L"new", true));
    EXPECT_STREQ(getenv("VELMORA_TEST"), "new");
}

TEST(setEnv, IsTrueWhenItFailed)
{
    EXPECT_TRUE(setEnv(L"", L"x", true));
    EXPECT_TRUE(setEnv(L"VELMORA=TEST", L"x", true));
}

TEST(unsetEnv, IsFalseWhenTheVariableIsGone)
{
    setenv("VELMORA_\xc3\xa9", "x", 1);
    EXPECT_FALSE(unsetEnv(L"VELMORA_\u00e9"));
    EXPECT_EQ(getenv("VELMORA_\xc3\xa9"), nullptr);
    EXPECT_FALSE(unsetEnv(L"VELMORA_\u00e9"));
}

TEST(unsetEnv, IsTrueWhenItFailed)
{
    EXPECT_TRUE(unsetEnv(L""));
    EXPECT_TRUE(unsetEnv(L"VELMORA=TEST"));
}
