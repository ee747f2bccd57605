#include "launcher/command/child_environment.h"

#include "diag/SvcDebug_linux.h"
#include "platform/linux/environment.h"
#include "platform/linux/files.h"
#include "platform/linux/paths.h"
#include "platform/linux/process.h"
#include "platform/linux/wide_strings.h"

#include <cwchar>

static const bool OVERWRITE = true;

// Decision: an empty value counts as absent. An empty element would make the loader search the
// current directory.
static bool isSet(const wchar_t* value)
{
    return value != nullptr && value[0] != L'\0';
}

void addLibpathToCommandLine(const PropertyList& props)
{
    const wchar_t* prepend = findProperty(L"library.path.prepend", props);
    const wchar_t* recorded = findProperty(L"com.vantor.rcp.core.internal.librarypath", props);
    const wchar_t* append = findProperty(L"library.path.append", props);
    // Deliberate: the recorded path alone sets nothing, and what was inherited is replaced.
    if (!isSet(prepend) && !isSet(append))
        return;
    std::wstring path;
    for (const wchar_t* part : {prepend, recorded, append}) {
        if (!isSet(part))
            continue;
        if (!path.empty())
            path += L':';
        path += part;
    }
    setEnv(L"LD_LIBRARY_PATH", path.c_str(), OVERWRITE);
}

// Decision: a key that ends before the name begins has none, and no effect.
static const wchar_t* nameBehind(const wchar_t* key, size_t cut)
{
    return wcslen(key) > cut ? key + cut : nullptr;
}

void addEnvSetToCommandLine(const PropertyList& props)
{
    // Deliberate: the name begins at a fixed place, whatever stands before it.
    const FoundProperties removed(L"env.unset", props);
    for (wchar_t** pair = removed.pairs; pair[0][0] != L'\0'; pair += 2) {
        const wchar_t* name = nameBehind(pair[0], 10);
        if (name != nullptr)
            unsetEnv(name);
    }
    const FoundProperties set(L"env.set", props);
    for (wchar_t** pair = set.pairs; pair[0][0] != L'\0'; pair += 2) {
        const wchar_t* name = nameBehind(pair[0], 8);
        if (name != nullptr)
            setEnv(name, pair[1], OVERWRITE);
    }
}

void addLdPreloadToCommandLine(const PropertyList& props)
{
    const wchar_t* preload = findProperty(L"library.preload", props);
    if (preload == nullptr)
        return;
    const wchar_t* id = findProperty(L"rcp.install.id", props);
    if (id == nullptr) {
        fatalErrorA("QVMRL0034E: Couldn't find the rcp.install.id property!", EXIT_PROCESS,
                    WITH_ERRNO);
        return;
    }
    setPreload(preload, id);
}

void addEnvJavaHighZipfds(const PropertyList& props)
{
    const wchar_t* limit = findProperty(L"env.JAVA_HIGH_ZIPFDS", props);
    setEnv(L"JAVA_HIGH_ZIPFDS", limit == nullptr ? L"500" : limit, OVERWRITE);
}

static void setPreloadVariable(const std::wstring& value)
{
    setEnv(L"LD_PRELOAD", value.c_str(), OVERWRITE);
    SvcDebugOutW(L"setPreload():setting LD_PRELOAD=%s", value.c_str());
}

static std::wstring preloadLinkPath(const std::wstring& libraryName, const std::wstring& installId)
{
    std::wstring user;
    if (!getEnv(L"USER", user))
        fatalErrorA("QVMRL0006E: Couldn't find the user name!", EXIT_PROCESS, WITH_ERRNO);
    // Decision: its backslashes stay: with separators instead of them it would be nowhere, for a
    // user whose name brings its domain along.
    return L"/tmp/vantor.rcp." + user + L"." + installId + L"." + libraryName;
}

// Takes a link that leads elsewhere out of the way.
static void clearPreloadLink(const std::wstring& linkPath, const std::wstring& library)
{
    if (!exists(linkPath.c_str()))
        return;
    SvcDebugOutA("setPreload(): link path already exists.");
    std::string narrowLink;
    std::string narrowTarget;
    std::wstring target;
    wcstochar(narrowLink, linkPath.c_str());
    readsymln(narrowTarget, narrowLink.c_str());
    chartowstr(narrowTarget.c_str(), target);
    SvcDebugOutW(L"setPreload(): existing link is to: %s", target.c_str());
    if (target == library)
        return;
    SvcDebugOutA("setPreload(): removing existing link ...");
    // Decision: one that cannot be removed, being another user's, stays and is named.
    deleteFile(linkPath.c_str());
}

static void preloadThroughLink(const std::wstring& library, const std::wstring& installId)
{
    const std::wstring::size_type slash = library.rfind(L'/');
    if (slash == std::wstring::npos) {
        fatalErrorA("QVMRL0189E: Couldn't find filename for library.preload property", EXIT_PROCESS,
                    WITH_ERRNO);
        return;
    }
    const std::wstring libraryName = library.substr(slash + 1);
    SvcDebugOutW(L"setPreload():library name = %s", libraryName.c_str());
    const std::wstring linkPath = preloadLinkPath(libraryName, installId);
    SvcDebugOutW(L"setPreload():linkPath=%s", linkPath.c_str());
    clearPreloadLink(linkPath, library);
    // Decision: a link that leads nowhere counts as absent and stays in the way; LD_PRELOAD names
    // it all the same.
    if (!exists(linkPath.c_str())) {
        SvcDebugOutA("setPreload(): creating new link ...");
        symlink(library.c_str(), linkPath.c_str());
        // Deliberate: the status is not that of the call, so the line always shows 0.
        const int status = 0;
        SvcDebugOutA("setPreload(): symlink() result = %d", status);
    }
    setPreloadVariable(linkPath);
}

void setPreload(const std::wstring& preloadPath, const std::wstring& installId)
{
    if (preloadPath.find(L' ') == std::wstring::npos) {
        setPreloadVariable(preloadPath);
        return;
    }
    SvcDebugOutW(L"setPreload():found property: library.preload=%s", preloadPath.c_str());
    // Decision: here it is used as a path, so backslashes are separators; above it was handed on.
    std::wstring library = preloadPath;
    convertToOsSeparator(library);
    if (exists(library.c_str()))
        preloadThroughLink(library, installId);
    std::wstring inForce;
    getEnv(L"LD_PRELOAD", inForce);
    SvcDebugOutW(L"setPreload():getenv LD_PRELOAD=%s", inForce.c_str());
}
