#include "launcher/user_area/locations.h"

#include "diag/SvcDebug_linux.h"
#include "launcher/properties/placeholders.h"
#include "launcher/user_area/installation.h"
#include "platform/linux/environment.h"
#include "platform/linux/files.h"
#include "platform/linux/process.h"
#include "platform/linux/wide_strings.h"

#include <cwchar>

wchar_t* getRCPDirectory(int /*argc*/, wchar_t** /*argv*/)
{
    wchar_t* dir = nullptr;
    findCommand(dir, nullptr);
    if (!isDirectory(dir))
        return freeString(dir);
    return dir;
}

void getInstallDir(std::wstring& out, int argc, wchar_t** argv)
{
    out.clear();
    wchar_t* dir = getRCPDirectory(argc, argv);
    if (dir == nullptr) {
        fatalErrorA("QVMRL0049E: Unable to locate the platform's installation directory",
                    EXIT_PROCESS, WITH_ERRNO);
        return;
    }
    wchar_t* slash = wcsrchr(dir, L'/');
    if (slash != nullptr && wcscmp(slash + 1, L"rcp") == 0) {
        *slash = L'\0';
        if (isDirectory(dir))
            out = dir;
    }
    freeString(dir);
}

void getServiceInstallDir(std::wstring& nearDir, std::wstring& farDir, int /*argc*/, wchar_t** argv)
{
    wchar_t* found = nullptr;
    findCommand(found, nullptr);
    std::wstring dir = found;
    freeString(found);
    for (int pass = 0; pass <= 5; ++pass) {
        const std::wstring::size_type slash = dir.rfind(L'/');
        if (slash == std::wstring::npos)
            continue;
        dir.resize(slash);
        if (pass == 1 && isDirectory(dir.c_str()))
            nearDir = dir;
        if (pass == 5 && isDirectory(dir.c_str())) {
            farDir = dir;
            return;
        }
    }
    fatalErrorA("QVMRL0048E: Unable to locate the directory containing %ls", argv[0], EXIT_PROCESS,
                WITH_ERRNO);
}

void replaceFirstRcpHome(std::wstring& s, const std::wstring& rcpHome)
{
    const std::wstring placeholder = L"${rcp.home}";
    const std::wstring::size_type found = s.find(placeholder);
    if (found != std::wstring::npos)
        s.replace(found, placeholder.size(), rcpHome);
}

static void dropOneSeparator(std::wstring& path)
{
    if (!path.empty() && (path.back() == L'/' || path.back() == L'\\'))
        path.pop_back();
}

static std::wstring workspaceOfData(const wchar_t* data, const PropertyList& props,
                                    const std::wstring& rcpHome)
{
    std::wstring value = data;
    dropOneSeparator(value);
    replaceFirstRcpHome(value, rcpHome);
    replaceUserPlaceholders(value, props);
    std::wstring out;
    convert_from_relative_location(value.c_str(), out);
    return out;
}

// Decision: user placeholders come first, and rcp.home is none of them, so "${rcp.home}" in
// rcp.data ends the start. With "-data" it works.
static std::wstring workspaceOfProperty(const wchar_t* data, const PropertyList& props,
                                        const std::wstring& rcpHome)
{
    std::wstring value = data;
    if (!replaceUserPlaceholders(value, props))
        fatalErrorA("QVMRL0099E: rcp.data property is invalid (%ls)", value.c_str(), EXIT_PROCESS,
                    WITH_ERRNO);
    dropOneSeparator(value);
    replaceFirstRcpHome(value, rcpHome);
    replaceUserPlaceholders(value, props);
    return value;
}

static std::wstring defaultWorkspace(const PropertyList& props)
{
    const wchar_t* id = findProperty(L"rcp.install.id", props);
    if (id == nullptr) {
        fatalErrorA("QVMRL0035E: Couldn't find the rcp.install.id property!", EXIT_PROCESS,
                    WITH_ERRNO);
        return L"";
    }
    std::wstring user;
    if (!startsJvmDirectly() && !getEnv(L"USER", user))
        fatalErrorA("QVMRL0037E: Couldn't find the user name!", EXIT_PROCESS, WITH_ERRNO);
    std::wstring home;
    getUserHome(home);
    return home + L"/VANTOR/RCP/" + id + L"/" + user;
}

int getWorkspaceLocation(std::wstring& out, const PropertyList& props, int argc, wchar_t** argv,
                         const std::wstring& rcpHome)
{
    if (eConfig == CONFIG_SERVICE) {
        out = rcpHome + L"/eclipse/.workspace";
        return 1;
    }
    if (eConfig == CONFIG_MU_SERVICE) {
        out = rcpHome + L"/eclipse/.muservice";
        return 1;
    }
    const int option = findOption(L"-data", argc, argv);
    if (option >= 0 && option + 1 < argc) {
        out = workspaceOfData(argv[option + 1], props, rcpHome);
        return 1;
    }
    const wchar_t* data = findProperty(L"rcp.data", props);
    if (data != nullptr) {
        out = workspaceOfProperty(data, props, rcpHome);
        return 1;
    }
    out = defaultWorkspace(props);
    return 0;
}

int getConfigurationLocation(std::wstring& out, const PropertyList& props, int argc, wchar_t** argv,
                             const std::wstring& rcpHome)
{
    std::wstring workspace;
    const int result = getWorkspaceLocation(workspace, props, argc, argv, rcpHome);
    if (eConfig == CONFIG_SERVICE) {
        // Deliberate: beside the service workspace, not in it.
        out = rcpHome + L"/eclipse/.config";
        return 1;
    }
    if (eConfig == CONFIG_MU_SERVICE) {
        out = rcpHome + L"/eclipse/.muservice/.config";
        return 1;
    }
    out = workspace + L"/.config";
    return result;
}

void patchWorkspace(const ArgumentVector& args, PropertyList& props)
{
    for (ArgumentVector::size_type i = 0; i + 1 < args.size(); ++i) {
        if (wcscmp(args[i], L"-data") != 0)
            continue;
        // Deliberate: replaceValue looks at values, too. Behind a value "rcp.data" it is the next
        // key that is overwritten.
        replaceValue(L"rcp.data", args[i + 1], props);
        return;
    }
}
