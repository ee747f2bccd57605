#include "platform/linux/environment.h"

#include "diag/SvcDebug_linux.h"
#include "platform/linux/wide_strings.h"

#include <cstdlib>

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

bool setEnv(const wchar_t* name, const wchar_t* value, bool overwrite)
{
    std::string narrowName;
    std::string narrowValue;
    wcstochar(narrowName, name);
    wcstochar(narrowValue, value);
    return setenv(narrowName.c_str(), narrowValue.c_str(), overwrite ? 1 : 0) != 0;
}

bool unsetEnv(const wchar_t* name)
{
    std::string narrowName;
    wcstochar(narrowName, name);
    return unsetenv(narrowName.c_str()) != 0;
}
