#include "launcher/user_area/provisioning_rules.h"

#include "diag/SvcDebug_linux.h"
#include "launcher/user_area/installation.h"
#include "platform/linux/argument_vector.h"
#include "platform/linux/lock_file.h"

#include <cwchar>
#include <string>
#include <vector>

bool isNewProvisioningLevel(const wchar_t* userLevel, const wchar_t* launcherLevel)
{
    if (userLevel == nullptr || launcherLevel == nullptr)
        return userLevel == nullptr || launcherLevel != userLevel;
    return wcscmp(userLevel, launcherLevel) != 0;
}

// The values of the group in the order of their numbers.
static std::vector<const wchar_t*> orderedValues(wchar_t** pairs)
{
    // Decision: every key of the group counts, that of a restart executable too.
    int count = 0;
    for (wchar_t** pair = pairs; pair[0][0] != L'\0'; pair += 2)
        ++count;
    std::vector<const wchar_t*> values;
    for (int n = 1; n <= count; ++n) {
        const std::wstring prefix = L"config.initial." + std::to_wstring(n);
        // Deliberate: a prefix test, so the key for 10 stands for 1 when it comes first.
        wchar_t** pair = pairs;
        while (pair[0][0] != L'\0' && wcsncmp(pair[0], prefix.c_str(), prefix.size()) != 0)
            pair += 2;
        if (pair[0][0] == L'\0') {
            fatalErrorA("QVMRL0114E: Invalid config.initial arguments. %ls not found",
                        prefix.c_str(), EXIT_PROCESS, WITH_ERRNO);
            return values;
        }
        values.push_back(pair[1]);
    }
    return values;
}

// The name of the property that says that the configuration run is complete.
static const wchar_t* completionFlag(const std::vector<const wchar_t*>& values)
{
    for (std::vector<const wchar_t*>::size_type i = 0; i + 1 < values.size(); ++i) {
        if (wcsncmp(values[i], L"-initialCompleteFlag", 20) == 0)
            return values[i + 1];
    }
    fatalErrorA("QVMRL0115E: Invalid config.initial arguments. -initialCompleteFlag not found",
                EXIT_PROCESS, WITH_ERRNO);
    return L"";
}

bool isInitialRequired(PropertyList launcherProps, PropertyList userProps)
{
    if (eConfig != CONFIG_USER && eConfig != CONFIG_USERPB && eConfig != CONFIG_MULTIUSER)
        return false;
    const FoundProperties found(L"config.initial.", launcherProps);
    if (found.pairs[0][0] == L'\0')
        return false;
    const wchar_t* flag = findProperty(completionFlag(orderedValues(found.pairs)), userProps);
    return flag == nullptr || wcsncmp(flag, L"true", 4) != 0;
}

void defeateSharedClassesInProvisioning(VmargMap& vmargs)
{
    if (vmargs.erase(L"vmarg.Dshare") == 0) {
        SvcDebugOutA("QVMRL0121I: \"vmarg.Dshare\" shared classes property was not detected. "
                     "No special action needed while provisioning");
        return;
    }
    vmargs[L"vmarg.Dshare"] = L"-Xshareclasses=none";
    // Deliberate: the line spells the option differently from the value.
    SvcDebugOutA("QVMRL0120I: \"vmarg.Dshare\" shared classes property found. "
                 "Setting -Xsharedclasses=none while provisioning");
}

void validateInstallerState(int argc, wchar_t** argv)
{
    if (findOption(L"-provManifest", argc, argv) < 0 || isMainProcess())
        return;
    const std::wstring pid = std::to_wstring(getPlatformPid());
    fatalErrorA("QVMRL0122E: Attempting to install while process %ls is running.", pid.c_str(),
                EXIT_PROCESS, WITH_ERRNO);
}
