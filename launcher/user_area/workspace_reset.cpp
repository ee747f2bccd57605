#include "launcher/user_area/workspace_reset.h"

#include "diag/SvcDebug_linux.h"
#include "launcher/properties/property_escape.h"
#include "launcher/properties/property_file.h"
#include "launcher/user_area/installation.h"
#include "platform/linux/directories.h"
#include "platform/linux/files.h"
#include "platform/linux/paths.h"

#include <cerrno>

static const bool MUST_EXIST = true;
static const bool OPTIONAL = false;
static const bool MOVE = true;
static const bool COPY = false;

static std::wstring joinPath(const std::wstring& dir, const std::wstring& name)
{
    std::wstring path = name.empty() ? dir : dir + L"/" + name;
    convertToOsSeparator(path);
    return path;
}

static std::wstring updateDirectory(const std::wstring& configDir)
{
    return configDir + L"/org.eclipse.update";
}

static void endWith(const char* message, const std::wstring& path)
{
    fatalErrorA(message, path.c_str(), EXIT_PROCESS, WITH_ERRNO);
}

static std::wstring clearingName(const std::wstring& path, unsigned number)
{
    std::wstring name = path + L"deleteme";
    addHexDigits(name, number);
    return name;
}

// Moves the directory that is in the way to the lowest clearing name that was free when it was
// looked at, and removes it there. What cannot be removed is cleared by a later run.
static void clearDirectory(const std::wstring& path)
{
    std::wstring ignored;
    unsigned keep = 1;
    for (unsigned k = 5; k >= 1; --k) {
        const std::wstring leftover = clearingName(path, k);
        if (exists(leftover.c_str()))
            removeDirectoryAndContents(leftover, ignored);
        else
            keep = k;
    }
    const std::wstring aside = clearingName(path, keep);
    if (!moveFile(path.c_str(), aside.c_str()))
        endWith("QVMRL0112E: Can't move file/dir  '%ls'", path);
    removeDirectoryAndContents(aside, ignored);
}

static void clearDestination(const std::wstring& path)
{
    if (!exists(path.c_str()))
        return;
    if (isDirectory(path.c_str()))
        clearDirectory(path);
    else if (!deleteFile(path.c_str()))
        endWith("QVMRL0111E: Can't delete old copy of file '%ls'", path);
}

bool handleCopy(const std::wstring& dstDir, const std::wstring& dstName, const std::wstring& srcDir,
                const std::wstring& srcName, bool mustExist, bool move)
{
    const std::wstring destination = joinPath(dstDir, dstName);
    const std::wstring source = joinPath(srcDir, srcName);
    if (!exists(source.c_str())) {
        if (mustExist)
            endWith("QVMRL0109E: Unable to locate '%ls' for copying", source);
        SvcDebugOutW(L"QVMRL0110I: '%s' not found", source.c_str());
        return false;
    }
    clearDestination(destination);
    if (move) {
        if (!moveFile(source.c_str(), destination.c_str()))
            endWith("QVMRL0141E: Can't move file/dir  '%ls'", source);
    } else if (!copyNewFile(source.c_str(), destination.c_str())) {
        // Decision: written aside, too. A copy cut short by a kill would be carried over by a later
        // renewal that finds no registry to copy again.
        endWith("QVMRL0113E: Can't copy file  '%ls'", source);
    }
    return true;
}

bool handleFileMove(const std::wstring& dstDir, const std::wstring& dstName,
                    const std::wstring& srcDir, const std::wstring& srcName, bool mustExist)
{
    return handleCopy(dstDir, dstName, srcDir, srcName, mustExist, MOVE);
}

bool handleDirMove(const std::wstring& dst, const std::wstring& src, bool mustExist)
{
    return handleCopy(dst, L"", src, L"", mustExist, MOVE);
}

static void saveRegistryAndBookmarks(const std::wstring& workspaceDir,
                                     const std::wstring& updateDir)
{
    handleCopy(workspaceDir, L"registry.old", updateDir, L"registry", OPTIONAL, COPY);
    handleCopy(workspaceDir, L"bookmarks.xml.old", updateDir, L"bookmarks.xml", OPTIONAL, COPY);
}

// Puts the configuration aside and begins a new one with what was saved.
static void renewConfiguration(const std::wstring& workspaceDir, const std::wstring& configDir,
                               const char* mkdirsMessage)
{
    std::wstring updateDir = updateDirectory(configDir);
    handleDirMove(configDir + L"bak", configDir, MUST_EXIST);
    convertToOsSeparator(updateDir);
    if (!mkdirs(updateDir.c_str()))
        endWith(mkdirsMessage, updateDir);
    handleFileMove(updateDir, L"registry", workspaceDir, L"registry.old", OPTIONAL);
    handleFileMove(updateDir, L"bookmarks.xml", workspaceDir, L"bookmarks.xml.old", OPTIONAL);
}

void createReusableWorkspace(const std::wstring& workspaceDir, const std::wstring& configDir)
{
    const std::wstring updateDir = updateDirectory(configDir);
    // Deliberate: this copy is not moved back. It stays as a record; platform.xml is made anew.
    handleCopy(workspaceDir, L"platform.xml.old", updateDir, L"platform.xml", OPTIONAL, COPY);
    saveRegistryAndBookmarks(workspaceDir, updateDir);
    renewConfiguration(workspaceDir, configDir, "QVMRL0044E: Unable to create %ls directory.");
}

void resetWorkspace(const std::wstring& workspaceDir, const std::wstring& configDir,
                    const std::wstring& baseLocation)
{
    saveRegistryAndBookmarks(workspaceDir, updateDirectory(configDir));
    resetMetaDataDirs(workspaceDir, configDir, baseLocation);
    renewConfiguration(workspaceDir, configDir, "QVMRL0045E: Unable to create %ls directory.");
}

static std::wstring resetPropertiesPath(const std::wstring& configDir,
                                        const std::wstring& baseLocation)
{
    std::wstring path = joinPath(configDir, L"rcpinstall.properties");
    if (exists(path.c_str()))
        return path;
    path = getCoreFileLocation(baseLocation, L"rcpinstall.properties");
    if (!exists(path.c_str()))
        endWith("QVMRL0106E: Unable to locate %ls file.", path);
    return path;
}

void resetMetaDataDirs(const std::wstring& workspaceDir, const std::wstring& configDir,
                       const std::wstring& baseLocation)
{
    PropertyList props;
    getProperties(resetPropertiesPath(configDir, baseLocation), props);
    const std::wstring pluginState = workspaceDir + L"/.metadata/.plugins/";
    {
        const FoundProperties found(L"resetDir.", props);
        for (wchar_t** pair = found.pairs; pair[0][0] != L'\0'; pair += 2) {
            // Decision: an empty value is passed over; it would name the whole plug-in area.
            if (pair[1][0] == L'\0')
                continue;
            // Decision: the whole path is converted, a backslash of the value included.
            std::wstring directory = pluginState + pair[1];
            convertToOsSeparator(directory);
            std::wstring problems;
            if (exists(directory.c_str()) && !removeDirectoryAndContents(directory, problems))
                fatalErrorA("\nQVMRL0107E begin: Error removing metadata plugin directory\n%ls\n"
                            "QVMRL0108E end: Unable to remove all files in the metadata plugin "
                            "directory. Please correct the problems listed above",
                            problems.c_str(), EXIT_PROCESS, WITH_ERRNO);
        }
    }
    freeProperties(props);
}
