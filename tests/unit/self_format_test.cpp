#include "diag/self_format.h"

#include <gtest/gtest.h>

TEST(formatOfItself, TwoPerCentSignsGiveOne)
{
    EXPECT_EQ(formatOfItself(std::wstring(L"50%%")), L"50%");
    EXPECT_EQ(formatOfItself(std::wstring(L"%%d")), L"%d");
    EXPECT_EQ(formatOfItself(std::wstring(L"%%%%")), L"%%");
}

TEST(formatOfItself, CompleteConversionGivesNothing)
{
    EXPECT_EQ(formatOfItself(std::wstring(L"a%20n%s%nb")), L"ab");
    EXPECT_EQ(formatOfItself(std::wstring(L"%d%i%o%u%x%X%e%E%f%F%g%G%a%A%c%s%C%S%p%n%m")), L"");
    EXPECT_EQ(formatOfItself(std::wstring(L"<%-+ #05.3lld>")), L"<>");
    EXPECT_EQ(formatOfItself(std::wstring(L"<%*.*hhn>")), L"<>");
    EXPECT_EQ(formatOfItself(std::wstring(L"<%Lf%zu%jd%td%qd%hd>")), L"<>");
}

TEST(formatOfItself, EverythingElseStays)
{
    EXPECT_EQ(formatOfItself(std::wstring(L"100%")), L"100%");
    EXPECT_EQ(formatOfItself(std::wstring(L"%y%!")), L"%y%!");
    EXPECT_EQ(formatOfItself(std::wstring(L"%5")), L"%5");
    EXPECT_EQ(formatOfItself(std::wstring(L"%5.")), L"%5.");
    EXPECT_EQ(formatOfItself(std::wstring(L"%ll")), L"%ll");
    EXPECT_EQ(formatOfItself(std::wstring(L"plain")), L"plain");
    EXPECT_EQ(formatOfItself(std::wstring()), L"");
}

TEST(formatOfItself, PassesBytesOnOneByOne)
{
    EXPECT_EQ(formatOfItself(std::string("\xc3\xa9%s\xff%%")), "\xc3\xa9\xff%");
    EXPECT_EQ(formatOfItself(std::string("\xc3\xa9")), "\xc3\xa9");
}

TEST(formatOfItself, DecisionAnIncompleteConversionLosesNothingAndTheWalkGoesOnBehindItsSign)
{
    EXPECT_EQ(formatOfItself(std::wstring(L"%5%d|")), L"%5|");
    EXPECT_EQ(formatOfItself(std::wstring(L"%-%s%n|")), L"%-|");
    EXPECT_EQ(formatOfItself(std::wstring(L"% %%d")), L"% %d");
    EXPECT_EQ(formatOfItself(std::wstring(L"%.%%")), L"%.%");
    EXPECT_EQ(formatOfItself(std::wstring(L"%l%")), L"%l%");
}

TEST(formatOfItself, TwoSignsAreTakenFromTheLeft)
{
    EXPECT_EQ(formatOfItself(std::wstring(L"%%%")), L"%%");
    EXPECT_EQ(formatOfItself(std::wstring(L"%%%d|")), L"%|");
    EXPECT_EQ(formatOfItself(std::wstring(L"%%%%%s")), L"%%");
}

TEST(formatOfItself, KnowsTheLengthsAndNoOthers)
{
    EXPECT_EQ(formatOfItself(std::wstring(L"<%hhd%lld%ld%'d>")), L"<>");
    EXPECT_EQ(formatOfItself(std::wstring(L"%hld %LLd %lx")), L"%hld %LLd ");
    EXPECT_EQ(formatOfItself(std::wstring(L"%1$d %Id %k")), L"%1$d %Id %k");
}

TEST(formatOfItself, TakesAZeroAsAnyOtherCharacter)
{
    EXPECT_EQ(formatOfItself(std::wstring(L"a%\0d", 4)), std::wstring(L"a%\0d", 4));
    EXPECT_EQ(formatOfItself(std::wstring(L"a\0%d", 4)), std::wstring(L"a\0", 2));
}

TEST(formatOfItself, TwoStarsAreNoWidth)
{
    EXPECT_EQ(formatOfItself(std::wstring(L"%**d")), L"%**d");
    EXPECT_EQ(formatOfItself(std::wstring(L"%5*d")), L"%5*d");
    EXPECT_EQ(formatOfItself(std::wstring(L"%.*5d")), L"%.*5d");
}
