#include "diag/time_stamps.h"

#include "tests/unit/support.h"

#include <cstdlib>
#include <ctime>
#include <cwchar>
#include <regex>
#include <sys/time.h>

static long long millisecondsNow()
{
    struct timeval now = {};
    gettimeofday(&now, nullptr);
    return now.tv_sec * 1000LL + now.tv_usec / 1000;
}

// What the text says in milliseconds since the epoch, in a zone that is `ahead` seconds ahead.
static long long milliseconds(const std::wstring& text, long ahead)
{
    static const std::wregex shape(LR"((\d{4})(\d\d)(\d\d)_(\d\d)(\d\d)(\d\d)_(\d\d\d))");
    std::wsmatch found;
    if (!std::regex_match(text, found, shape))
        return -1;
    struct tm utc = {};
    utc.tm_year = std::stoi(found[1]) - 1900;
    utc.tm_mon = std::stoi(found[2]) - 1;
    utc.tm_mday = std::stoi(found[3]);
    utc.tm_hour = std::stoi(found[4]);
    utc.tm_min = std::stoi(found[5]);
    utc.tm_sec = std::stoi(found[6]);
    return (timegm(&utc) - ahead) * 1000LL + std::stoi(found[7]);
}

static void useZone(const char* zone)
{
    setenv("TZ", zone, 1);
    tzset();
}

TEST(getTimeString, IsNowInDigits)
{
    useZone("UTC");
    const long long before = millisecondsNow();
    std::wstring text = L"before";
    getTimeString(text);
    const long long after = millisecondsNow();
    EXPECT_LE(before, milliseconds(text, 0)) << std::string(text.begin(), text.end());
    EXPECT_GE(after, milliseconds(text, 0)) << std::string(text.begin(), text.end());
}

TEST(getTimeString, IsLocalTime)
{
    useZone("AHEAD-5:30");
    const long long before = millisecondsNow();
    std::wstring text;
    getTimeString(text);
    const long long after = millisecondsNow();
    EXPECT_LE(before, milliseconds(text, 5 * 3600 + 30 * 60));
    EXPECT_GE(after, milliseconds(text, 5 * 3600 + 30 * 60));
}

// The zone puts the hour between 0 and 9; a millisecond below 100 comes within the next second.
TEST(getTimeString, PadsWithZeros)
{
    const time_t now = time(nullptr);
    const int hour = gmtime(&now)->tm_hour;
    useZone(("WEST" + std::to_string((hour + 20) % 24)).c_str());
    std::wstring text;
    const long long end = millisecondsNow() + 3000;
    do {
        getTimeString(text);
        ASSERT_EQ(text.size(), 19u);
        ASSERT_LT(millisecondsNow(), end);
    } while (text[16] != L'0');
    EXPECT_EQ(text[8], L'_');
    EXPECT_EQ(text[9], L'0');
    EXPECT_EQ(text[15], L'_');
}

TEST(getTickString, IsTheSecondsSinceTheEpoch)
{
    wchar_t text[30];
    const time_t before = time(nullptr);
    EXPECT_EQ(getTickString(text, 30), text);
    const time_t tick = wcstoll(text, nullptr, 10);
    EXPECT_LE(before, tick + 1);
    EXPECT_GE(time(nullptr) + 1, tick);
    EXPECT_EQ(std::to_wstring(tick), text);
}

// Ten digits from the year 2001 to the year 2286.
TEST(getTickString, FitsWithItsZero)
{
    wchar_t text[12] = L"xxxxxxxxxxx";
    EXPECT_EQ(getTickString(text, 11), text);
    EXPECT_EQ(wcslen(text), 10u);
    EXPECT_EQ(text[11], L'\0');
}

TEST(getTickString, IsEmptyWhenItDoesNotFit)
{
    wchar_t text[12] = L"xxxxxxxxxxx";
    EXPECT_EQ(getTickString(text, 10), text);
    EXPECT_STREQ(text, L"");
    EXPECT_EQ(text[10], L'x');
}

TEST(getTickString, TouchesNothingWithoutRoom)
{
    wchar_t text[] = L"x";
    EXPECT_EQ(getTickString(text, 0), text);
    EXPECT_EQ(getTickString(text, -1), text);
    EXPECT_STREQ(text, L"x");
}
