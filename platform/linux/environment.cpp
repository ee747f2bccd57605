#include "platform/linux/environment.h"

#include "diag/SvcDebug_linux.h"
#include "platform/linux/wide_strings.h"

#include <cstdlib>
#include <ctime>

bool getEnv(const wchar_t* name, std::wstring& out)
{
    std::string narrowName;
    wcstochar(narrowName, name);
    const char* value = getenv(narrowName.c_str());
    if (value == nullptr) {
        out.clear();
        SvcDebugOutW(L"QVMRL0081I:  Environmental variable '%s' is not set\n", name);
        return false;
    }
    chartowstr(value, out);
    return true;
}

const wchar_t* getUserHome(std::wstring& out)
{
    getEnv(L"HOME", out);
    return out.c_str();
}

// The log's times are local: in the zone that the environment names now, not at the start.
static void followTimeZone(const std::string& name)
{
    if (name == "TZ")
        tzset();
}

bool setEnv(const wchar_t* name, const wchar_t* value, bool overwrite)
{
    std::string narrowName;
    std::string narrowValue;
    wcstochar(narrowName, name);
    wcstochar(narrowValue, value);
    const bool failed = setenv(narrowName.c_str(), narrowValue.c_str(), overwrite ? 1 : 0) != 0;
    followTimeZone(narrowName);
    return failed;
}

bool unsetEnv(const wchar_t* name)
{
    std::string narrowName;
    wcstochar(narrowName, name);
    const bool failed = unsetenv(narrowName.c_str()) != 0;
    followTimeZone(narrowName);
    return failed;
}
