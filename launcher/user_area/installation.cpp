#include "launcher/user_area/installation.h"

#include "diag/SvcDebug_linux.h"
#include "diag/time_stamps.h"
#include "launcher/properties/property_file.h"
#include "platform/linux/files.h"
#include "platform/linux/paths.h"
#include "platform/linux/wide_output.h"

#include <cstdio>
#include <cwchar>

int eConfig = CONFIG_OTHER;
bool IS_LOCKDOWN = false;

int SetInstallConfiguration(const PropertyList& props, bool muService)
{
    static const struct {
        const wchar_t* word;
        InstallConfiguration configuration;
    } WORDS[] = {
        {L"service", CONFIG_SERVICE},   {L"user", CONFIG_USER},
        {L"lockdown", CONFIG_LOCKDOWN}, {L"serial.multiuser", CONFIG_SERIAL_MULTIUSER},
        {L"userpb", CONFIG_USERPB},     {L"multiuser", CONFIG_MULTIUSER},
    };
    IS_LOCKDOWN = false;
    const wchar_t* value = findProperty(L"install.configuration", props);
    if (value == nullptr) {
        SvcDebugOutA("QVMRL0041I: Missed install configuration in property file. "
                     "Using default setting!");
        eConfig = CONFIG_USER;
    } else {
        eConfig = CONFIG_OTHER;
        for (const auto& known : WORDS) {
            if (wcscmp(value, known.word) == 0)
                eConfig = known.configuration;
        }
        IS_LOCKDOWN = eConfig == CONFIG_LOCKDOWN;
    }
    if (muService)
        eConfig = CONFIG_MU_SERVICE;
    return 1;
}

bool isLockdownConfig()
{
    return IS_LOCKDOWN;
}

bool startsJvmDirectly()
{
    return eConfig == CONFIG_SERVICE || eConfig == CONFIG_MU_SERVICE;
}

static void appendInstallID(const std::wstring& path, const wchar_t* id)
{
    FILE* file = nullptr;
    open_file(file, path.c_str(), L"a+");
    if (file == nullptr) {
        fatalErrorA("QVMRL0017E: Could not open %ls to append rcp.install.id!", path.c_str(),
                    EXIT_PROCESS, WITH_ERRNO);
        return;
    }
    // Deliberate: nothing is written before it. Behind a last line without a line end it becomes a
    // part of that line, and the next start makes up another id.
    // Decision: what the system does not take is not written, though it fits the stream's buffer.
    if (!putWide(file, std::wstring(L"rcp.install.id=") + id + L"\n") || fflush(file) != 0)
        fatalErrorA("QVMRL0018E: Error while writing to %ls file.", path.c_str(), EXIT_PROCESS,
                    WITH_ERRNO);
    fclose(file);
}

const wchar_t* getInstallID(const std::wstring& installPropsPath, PropertyList& props)
{
    const wchar_t* id = findProperty(L"rcp.install.id", props);
    if (id != nullptr)
        return id;
    if (eConfig != CONFIG_USERPB) {
        fatalErrorA("QVMRL0016E: rcp.install.id is required for this configuration!", EXIT_PROCESS,
                    WITH_ERRNO);
        return L"";
    }
    wchar_t ticks[100];
    appendProperty(props, L"rcp.install.id", getTickString(ticks, 100));
    appendInstallID(installPropsPath, ticks);
    return findProperty(L"rcp.install.id", props);
}

bool isOldRcpInstallId(const std::wstring& installId, const std::wstring& configDir,
                       PropertyList& userProps)
{
    std::wstring path = configDir + L"/rcpinstall.properties";
    convertToOsSeparator(path);
    if (!getPropertiesIfPresent(path, userProps))
        return false;
    const wchar_t* id = findProperty(L"rcp.install.id", userProps);
    return id != nullptr && id[0] != L'\0' && installId != id;
}

static const wchar_t* variantDirectory()
{
    switch (eConfig) {
    case CONFIG_MU_SERVICE:
        return L"muservice";
    case CONFIG_USER:
    case CONFIG_MULTIUSER:
    case CONFIG_LOCKDOWN:
        return L"user";
    case CONFIG_USERPB:
        return L"pbuilder";
    default:
        // Deliberate: the path holds "config//" then.
        return L"";
    }
}

std::wstring getCoreFileLocation(const std::wstring& base, const wchar_t* fileName)
{
    std::wstring path = base + L"/config/" + variantDirectory() + L"/" + fileName;
    convertToOsSeparator(path);
    if (exists(path.c_str()))
        return path;
    path = base + L"/" + fileName;
    convertToOsSeparator(path);
    return path;
}
