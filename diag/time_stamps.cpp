#include "diag/time_stamps.h"

#include <cstdio>
#include <cstring>
#include <ctime>
#include <cwchar>
#include <sys/time.h>

void getTimeString(std::wstring& out)
{
    struct timeval now = {};
    gettimeofday(&now, nullptr);
    const time_t seconds = now.tv_sec;
    struct tm local = {};
    localtime_r(&seconds, &local);
    char text[30] = "";
    if (snprintf(text, sizeof text, "%.4d%.2d%.2d_%.2d%.2d%.2d_%.3hd", local.tm_year + 1900,
                 local.tm_mon + 1, local.tm_mday, local.tm_hour, local.tm_min, local.tm_sec,
                 static_cast<short>(now.tv_usec / 1000)) >= static_cast<int>(sizeof text))
        text[0] = '\0';
    out.assign(text, text + strlen(text));
}

wchar_t* getTickString(wchar_t* buf, int n)
{
    if (n < 1)
        return buf;
    struct timeval now = {};
    gettimeofday(&now, nullptr);
    const auto seconds = static_cast<unsigned long>(now.tv_sec);
    if (swprintf(buf, static_cast<size_t>(n), L"%lu", seconds) < 0)
        buf[0] = L'\0';
    return buf;
}
