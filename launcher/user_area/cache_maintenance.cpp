#include "launcher/user_area/cache_maintenance.h"

#include "launcher/properties/property_text.h"
#include "platform/linux/directories.h"
#include "platform/linux/paths.h"
#include "platform/linux/shutdown_log.h"

// Sets `value` to the sub-option `name` of `options`. False when the name does not occur in it.
static bool subOption(const std::wstring& options, const wchar_t* name, std::wstring& value)
{
    const std::wstring::size_type found = options.find(name);
    if (found == std::wstring::npos)
        return false;
    // Deliberate: the name may be a part of a longer word, the "=" may be another sub-option's, and
    // without one the value begins at the start of the text.
    const std::wstring::size_type equals = options.find(L'=', found);
    const std::wstring::size_type start = equals == std::wstring::npos ? 0 : equals + 1;
    value = options.substr(start, options.find(L',', start) - start);
    trimString(value);
    return true;
}

static bool removeCacheFiles(const std::wstring& workspaceDir, const std::wstring& options)
{
    std::wstring name;
    std::wstring controlDir;
    if (!subOption(options, L"name", name) || !subOption(options, L"controlDir", controlDir))
        return false;
    // A name made with a substitution is known by what stands before it.
    name = name.substr(0, name.find(L'%'));
    // Deliberate: a test of the text alone. A cache that others share lies elsewhere.
    if (controlDir.compare(0, workspaceDir.size(), workspaceDir) != 0)
        return false;
    convertToOsSeparator(controlDir);
    std::wstring problems;
    // Decision: a name of "*" means everything, and an empty one is a part of every name.
    return removeFileWithPatternFromDirectory(controlDir, name, problems);
}

void doCacheMaintenance(const std::wstring& workspaceDir, const VmargMap& vmargs,
                        bool dirtyShutdown, bool& removed)
{
    removed = false;
    // Only the presence counts: the value "false" enables it, too.
    if (vmargs.count(L"vmarg.CacheMaintenance.enable") != 0 && dirtyShutdown) {
        const VmargMap::const_iterator share = vmargs.find(L"vmarg.Dshare");
        removed = removeCacheFiles(workspaceDir, share == vmargs.end() ? L"" : share->second);
    }
    doShutdownLogUpdate(workspaceDir);
}
