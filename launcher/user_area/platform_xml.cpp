#include "launcher/user_area/platform_xml.h"

#include "diag/SvcDebug_linux.h"
#include "launcher/properties/replacement.h"
#include "launcher/user_area/first_launch.h"
#include "launcher/user_area/installation.h"
#include "platform/linux/files.h"
#include "platform/linux/paths.h"
#include "platform/linux/wide_output.h"

#include <cstdio>
#include <cwchar>

// A feature that template lines name, and the line that is logged when a value is missing.
struct Feature {
    const wchar_t* idKey;
    const wchar_t* versionKey;
    const char* missing;
};

static const Feature JVM_FEATURE = {L"jvm.feature.id", L"jvm.feature.version",
                                    "QVMRL0101E: Error while copying platform.xml to user specific "
                                    "platform.xml file."};
static const Feature PARENT_FEATURE = {
    L"jvm.parent.feature.id", L"jvm.parent.feature.version",
    "QVMRL0102E: Error while copying platform.xml to user specific platform.xml file."};

static std::wstring placeholderOf(const wchar_t* key)
{
    return std::wstring(L"${") + key + L"}";
}

// Puts the feature into a line that names it. False when a value is missing.
static bool fillIn(std::wstring& line, const Feature& feature, const PropertyList& props,
                   bool replaceFeatureLines)
{
    // Deliberate: a version goes only on a line that carries the id as well.
    if (line.find(placeholderOf(feature.idKey)) == std::wstring::npos)
        return true;
    if (replaceFeatureLines) {
        line = L"<feature>";
        return true;
    }
    const wchar_t* id = findProperty(feature.idKey, props);
    const wchar_t* version = findProperty(feature.versionKey, props);
    // Decision: a value that holds its own placeholder would be put in for ever; it counts as
    // missing.
    if (id != nullptr && version != nullptr &&
        replaceEvery(placeholderOf(feature.idKey), id, line) &&
        replaceEvery(placeholderOf(feature.versionKey), version, line))
        return true;
    const ForcedTrace forced;
    SvcDebugOutA(feature.missing);
    return false;
}

static void logFailedWrite()
{
    const ForcedTrace forced;
    SvcDebugOutA(
        "QVMRL0103E: Error while copying platform.xml to user specific platform.xml file.");
}

// Deliberate: after a missing value the lines so far stay, and are believed by later starts.
static void copyTemplate(FILE* from, FILE* to, const PropertyList& props, bool replaceFeatureLines)
{
    wchar_t text[LINE_ROOM];
    bool written = true;
    while (written && readCopiedLine(from, text)) {
        std::wstring line = text;
        if (!fillIn(line, JVM_FEATURE, props, replaceFeatureLines) ||
            !fillIn(line, PARENT_FEATURE, props, replaceFeatureLines))
            break;
        written = putWide(to, line + L"\n");
    }
    // A write that failed fails again here, and is one failure.
    if (!flushToDisk(to) || !written)
        logFailedWrite();
}

static FILE* openTemplate(const std::wstring& path)
{
    FILE* file = nullptr;
    open_file(file, path.c_str(), L"r");
    if (file == nullptr) {
        const ForcedTrace forced;
        SvcDebugOutW(L"QVMRL0104E: Unable to open platform.xml.\"%s\"", path.c_str());
    }
    return file;
}

int createPlatformXML(const std::wstring& configDir, const std::wstring& baseLocation,
                      PropertyList props, bool replaceFeatureLines)
{
    if (eConfig == CONFIG_USERPB)
        return 0;
    const std::wstring directory = configDir + L"/org.eclipse.update";
    makeUserDirectory(directory, "QVMRL0039E: Unable to create %ls directory.");
    std::wstring target = directory + L"/platform.xml";
    convertToOsSeparator(target);
    if (exists(target.c_str()))
        return 0;
    const wchar_t* managed = findProperty(L"update.policy.managed", props);
    if (managed != nullptr && wcscmp(managed, L"false") == 0)
        return 0;

    FILE* from = openTemplate(getCoreFileLocation(baseLocation, L"platform.xml"));
    if (from == nullptr)
        return -1;
    std::wstring place = placeForNewFile(target);
    FILE* to = openNewFile(place, target.c_str(), L"w");
    if (to == nullptr) {
        const ForcedTrace forced;
        SvcDebugOutW(L"QVMRL0139E: Unable to open platform.xml for writing.\"%s\"", target.c_str());
        fclose(from);
        return -1;
    }
    rewind(from);
    copyTemplate(from, to, props, replaceFeatureLines);
    fclose(from);
    fclose(to);
    if (!publishNewFile(place, target))
        logFailedWrite();
    userFirstLaunch = true;
    return 0;
}
