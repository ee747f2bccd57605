#include "platform/linux/directories.h"

#include "diag/SvcDebug_linux.h"
#include "platform/linux/files.h"
#include "platform/linux/wide_strings.h"

#include <cerrno>
#include <dirent.h>
#include <sys/stat.h>
#include <unistd.h>
#include <vector>

bool createDirectory(const wchar_t* path)
{
    std::string narrowPath;
    wcstochar(narrowPath, path);
    return mkdir(narrowPath.c_str(), 0775) == 0;
}

// The path from the root, with one separator before each of its parts, and where each part ends.
struct Levels {
    std::wstring path;
    std::vector<std::wstring::size_type> ends;
};

static Levels levelsOf(const std::wstring& path)
{
    Levels levels;
    levels.path.reserve(path.size() + 1);
    bool inPart = false;
    for (const wchar_t c : path) {
        const bool separator = c == L'/' || c == L'\\';
        if (inPart && separator)
            levels.ends.push_back(levels.path.size());
        if (!inPart && !separator)
            levels.path += L'/';
        if (!separator)
            levels.path += c;
        inPart = !separator;
    }
    if (inPart)
        levels.ends.push_back(levels.path.size());
    return levels;
}

static bool createLevel(const Levels& levels, std::vector<std::wstring::size_type>::size_type level)
{
    return createDirectory(levels.path.substr(0, levels.ends[level]).c_str());
}

bool mkdirs(const wchar_t* path)
{
    const int before = errno;
    const Levels levels = levelsOf(path);
    bool made = true;
    // From the last level back to one that stands: most levels of a path do, and what stands above
    // that one needs no look.
    std::vector<std::wstring::size_type>::size_type missing = levels.ends.size();
    while (missing > 0) {
        made = createLevel(levels, missing - 1);
        if (made || errno == EEXIST)
            break;
        --missing;
    }
    // A later line may tell errno as it stands: as if every level had been tried from the root on.
    if (made)
        errno = missing > 1 ? EEXIST : before;
    for (; missing < levels.ends.size(); ++missing)
        made = createLevel(levels, missing);
    return made;
}

// Decision: asked again after a failure. Of several first starts at once another may have made the
// directory meanwhile; each of them comes to the lock that orders them.
bool ensureDirectory(const wchar_t* path)
{
    if (mkdirs(path))
        return true;
    const int reason = errno;
    const bool stands = isDirectory(path);
    errno = reason;
    return stands;
}

// Adds "<what><path>  - <reason>" to the report.
static void reportFailure(std::string& report, const char* what, const std::string& path)
{
    std::string reason;
    GetLastErrorMsg(reason);
    report += what + path + "  - " + reason + "\n";
}

// Decision: a removal enters at most so many directories through links, so that it comes to an
// end. A link behind them is only tried itself, like one whose directory has been emptied. One link
// that leads back up is followed until the system refuses, forty levels deep; of two, each level
// would follow both.
static const int MOST_LINKS_ENTERED = 10000;

struct Removal {
    const std::string& pattern;
    std::string& report;
    int linksEntered = 0;
};

static bool removeContents(Removal& removal, const std::string& dir, const std::string& indent);

// The directory itself, and no link to it.
static bool isItself(const std::string& dir)
{
    struct stat entry = {};
    return lstat(dir.c_str(), &entry) == 0 && S_ISDIR(entry.st_mode);
}

static bool removeEntry(Removal& removal, const std::string& full, const char* name,
                        const std::string& indent)
{
    const bool everything = removal.pattern == "*";
    struct stat entry = {};
    if (stat(full.c_str(), &entry) != 0) {
        reportFailure(removal.report, "Can't stat ", full);
        return false;
    }
    if (!S_ISDIR(entry.st_mode)) {
        if (!everything && std::string(name).find(removal.pattern) == std::string::npos)
            return true;
        if (unlink(full.c_str()) == 0)
            return true;
        reportFailure(removal.report, "Can't delete file ", full);
        return false;
    }
    if (!everything)
        return true;
    bool ok = true;
    if (isItself(full) || removal.linksEntered++ < MOST_LINKS_ENTERED)
        ok = removeContents(removal, full, indent + "  ");
    // A directory that could not be emptied is tried as well, and is in the report twice over.
    if (rmdir(full.c_str()) != 0) {
        reportFailure(removal.report, "Can't delete dir ", full);
        ok = false;
    }
    return ok;
}

static bool removeContents(Removal& removal, const std::string& dir, const std::string& indent)
{
    DIR* entries = opendir(dir.c_str());
    if (entries == nullptr) {
        reportFailure(removal.report, "Error in ", dir);
        return false;
    }
    bool ok = true;
    errno = 0;
    while (const struct dirent* entry = readdir(entries)) {
        const std::string name = entry->d_name;
        if (name != "." && name != ".." &&
            !removeEntry(removal, dir + "/" + name, name.c_str(), indent))
            ok = false;
        errno = 0;
    }
    if (errno != 0) {
        reportFailure(removal.report, "readdir error ", "");
        ok = false;
    }
    closedir(entries);
    return ok;
}

bool removeDirectoryContents(const std::string& dir, const std::string& pattern,
                             const std::string& indent, std::string& report)
{
    Removal removal{pattern, report};
    return removeContents(removal, dir, indent);
}

bool removeDirectoryContents(const std::string& dir, const std::string& indent, std::string& report)
{
    return removeDirectoryContents(dir, "*", indent, report);
}

bool removeDirectoryContents(const std::wstring& dir, std::wstring& errorText)
{
    std::string narrowDir;
    wcstochar(narrowDir, dir.c_str());
    std::string report;
    const bool ok = removeDirectoryContents(narrowDir, "", report);
    if (!ok)
        chartowstr(report.c_str(), errorText);
    return ok;
}

bool removeDirectoryAndContents(const std::wstring& dir, std::wstring& errorText)
{
    std::string narrowDir;
    wcstochar(narrowDir, dir.c_str());
    std::string report;
    bool ok = removeDirectoryContents(narrowDir, "", report);
    if (ok && rmdir(narrowDir.c_str()) != 0) {
        reportFailure(report, "Can't delete dir ", narrowDir);
        ok = false;
    }
    if (!ok)
        chartowstr(report.c_str(), errorText);
    return ok;
}

bool removeFileWithPatternFromDirectory(const std::wstring& dir, const std::wstring& pattern,
                                        std::wstring& errorText)
{
    std::string narrowDir;
    std::string narrowPattern;
    wcstochar(narrowDir, dir.c_str());
    // Decision: a pattern that the locale cannot convert matches nothing. As an empty text it would
    // be a part of every name.
    if (wstrtocs(narrowPattern, pattern) < 0) {
        errorText.clear();
        return false;
    }
    std::string report;
    const bool ok = removeDirectoryContents(narrowDir, narrowPattern, "", report);
    if (!ok)
        chartowstr(report.c_str(), errorText);
    return ok;
}
