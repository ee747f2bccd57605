#include "launcher/user_area/user_properties.h"

#include "diag/SvcDebug_linux.h"
#include "diag/self_format.h"
#include "launcher/properties/property_escape.h"
#include "launcher/properties/property_text.h"
#include "launcher/user_area/first_launch.h"
#include "launcher/user_area/installation.h"
#include "platform/linux/files.h"
#include "platform/linux/paths.h"
#include "platform/linux/wide_output.h"

#include <cstdio>
#include <cwchar>

// What every user copy must know of the installation it was made for.
static const wchar_t* const REQUIRED[] = {L"rcp.install.id", L"rcp.base.location",
                                          L"install.configuration"};

void createConfigIni(const std::wstring& configDir, const std::wstring& baseLocation)
{
    std::wstring target = configDir + L"/config.ini";
    convertToOsSeparator(target);
    if (exists(target.c_str()))
        return;
    const std::wstring source = getCoreFileLocation(baseLocation, L"config.ini");
    if (!copyNewFile(source.c_str(), target.c_str()))
        fatalErrorA("QVMRL0009E: Unable to copy config.ini to the user directory.", EXIT_PROCESS,
                    WITH_ERRNO);
    userFirstLaunch = true;
}

static bool hasRequiredValues(const PropertyList& props)
{
    for (const wchar_t* key : REQUIRED) {
        if (findProperty(key, props) == nullptr)
            return false;
    }
    return true;
}

std::wstring createRCPInstallProps(const std::wstring& workspaceDir, const std::wstring& configDir,
                                   const std::wstring& baseLocation, const std::wstring& rcpHome,
                                   PropertyList props)
{
    std::wstring userPath = configDir + L"/rcpinstall.properties";
    convertToOsSeparator(userPath);
    if (exists(userPath.c_str()))
        return userPath;
    // Decision: the plain copy is made aside, so that a launcher killed before the rewriting is
    // done leaves no copy that a later start believes. Without the required values the rewriting
    // ends the process and leaves the plain copy in place, so then it gets its name before, whole.
    const std::wstring source = getCoreFileLocation(baseLocation, L"rcpinstall.properties");
    const bool complete = hasRequiredValues(props);
    std::wstring copy = complete ? placeForNewFile(userPath) : userPath;
    const bool copied = complete ? copyFileAside(source.c_str(), copy, userPath.c_str())
                                 : copyNewFile(source.c_str(), userPath.c_str());
    if (!copied)
        fatalErrorA("QVMRL0022E: Unable to copy rcpinstall.properties to the user directory.",
                    EXIT_PROCESS, WITH_ERRNO);
    std::wstring newPath = userPath + L".new";
    fixUserRCPInstallProperties(workspaceDir, copy, newPath, rcpHome, props);
    deleteFile(copy.c_str());
    moveFile(newPath.c_str(), userPath.c_str());
    userFirstLaunch = true;
    return userPath;
}

// Which lines of the installation's file go into the user's copy, one line after the other.
struct LineFilter {
    bool skipping = false;
    bool inContinuation = false;

    // True when the line is to be written; it may lose a suffix of its key.
    bool takes(std::wstring& line)
    {
        const bool continues = isContinuationLine(line);
        if (skipping) {
            skipping = continues;
            inContinuation = false;
            return false;
        }
        if (inContinuation) {
            inContinuation = continues;
            return true;
        }
        if (isComment(line))
            return true;
        if (processFilterKey(line)) {
            skipping = continues;
            return false;
        }
        inContinuation = continues;
        return true;
    }
};

static void copyLines(FILE* from, FILE* to)
{
    LineFilter filter;
    wchar_t text[LINE_ROOM];
    while (readCopiedLine(from, text)) {
        std::wstring line = text;
        if (!filter.takes(line) || putWide(to, line + L"\n"))
            continue;
        const ForcedTrace forced;
        SvcDebugOutA("QVMRL0001E: Error while copying base rcpinstall.properties to user specific "
                     "rcpinstall.properties file.");
    }
}

static std::wstring escapedPath(std::wstring path)
{
    convertBS2S(path);
    std::wstring escaped;
    convWcharTo8859_1_Value(path, escaped);
    return escaped;
}

// The block; empty when a required value is missing.
static std::wstring installationBlock(const PropertyList& props)
{
    if (!hasRequiredValues(props))
        return std::wstring();
    std::wstring block = L"rcp.install.id=";
    block += findProperty(L"rcp.install.id", props);
    // The key differs from the installation's: the platform reads "vm".
    const wchar_t* jvm = findProperty(L"jvm.location", props);
    if (jvm != nullptr && jvm[0] != L'\0')
        block += L"\nvm=" + escapedPath(jvm);
    block += L"\nrcp.base.location=" + escapedPath(findProperty(L"rcp.base.location", props));
    block += L"\ninstall.configuration=";
    block += findProperty(L"install.configuration", props);
    block += L'\n';
    for (const wchar_t* key : {L"com.vantor.rcp.core.locale", L"com.vantor.rcp.core.bidi"}) {
        const wchar_t* value = findProperty(key, props);
        if (value != nullptr)
            block += std::wstring(key) + L"=" + value + L"\n";
    }
    return block;
}

static void appendBlock(const std::wstring& block, FILE* to)
{
    // Deliberate: the block is its own format, so two per-cent signs in a value come out as one.
    if (putWide(to, formatOfItself(block)) && flushToDisk(to))
        return;
    const ForcedTrace forced;
    SvcDebugOutA(
        "QVMRL0015E: Unable to append values to user specific rcpinstall.properties file.");
}

int fixUserRCPInstallProperties(const std::wstring& /*workspaceDir*/, std::wstring& userPath,
                                std::wstring& newPath, const std::wstring& /*rcpHome*/,
                                const PropertyList& props)
{
    convertToOsSeparator(userPath);
    convertToOsSeparator(newPath);
    FILE* from = nullptr;
    FILE* to = nullptr;
    // Both are opened before either is looked at, so a new file comes to be in any case.
    open_file(from, userPath.c_str(), L"r");
    open_file(to, newPath.c_str(), L"w");
    if (from == nullptr || to == nullptr) {
        const ForcedTrace forced;
        SvcDebugOutA("QVMRL0074E: Unable to open user specific rcpinstall.properties and temporary "
                     "rcpinstall.properties files.");
        if (from != nullptr)
            fclose(from);
        if (to != nullptr)
            fclose(to);
        return -1;
    }
    rewind(from);
    rewind(to);
    copyLines(from, to);
    fclose(from);
    const std::wstring block = installationBlock(props);
    if (block.empty()) {
        fclose(to);
        fatalErrorA("QVMRL0008E: Unable to calculate necessary values for user specific "
                    "rcpinstall.properties file.",
                    EXIT_PROCESS, WITH_ERRNO);
        return -1;
    }
    appendBlock(block, to);
    fclose(to);
    return 0;
}
