#include "launcher/command/jvm_location.h"

#include "diag/SvcDebug_linux.h"
#include "launcher/user_area/locations.h"
#include "platform/linux/argument_vector.h"
#include "platform/linux/files.h"
#include "platform/linux/paths.h"

// The VM path as given; empty when there is none.
static std::wstring givenVmPath(const PropertyList& props, int argc, wchar_t** argv)
{
    const int option = findOption(L"-vm", argc, argv);
    if (option >= 0) {
        if (option + 1 >= argc || argv[option + 1][0] == L'\0') {
            fatalErrorA("QVMRL0079E: -vm on command line must be followed by a valid jvm path.",
                        EXIT_PROCESS, WITH_ERRNO);
            return std::wstring();
        }
        return argv[option + 1];
    }
    const wchar_t* vm = findProperty(L"vm", props);
    return vm == nullptr ? std::wstring() : std::wstring(vm);
}

bool getJvmPropertyLocation(PropertyList& props, int argc, wchar_t** argv,
                            const std::wstring& rcpHome, std::wstring& jvmPropertiesPath,
                            bool& notPluginJvm, std::wstring& vmPath)
{
    std::wstring root;
    bool found = false;
    vmPath = givenVmPath(props, argc, argv);
    if (vmPath.empty()) {
        const ForcedTrace forced;
        SvcDebugOutW(L"QVMRL0119I: VM specified is \"%s\"", L"external JVM");
    } else {
        replaceFirstRcpHome(vmPath, rcpHome);
        convertBS2S(vmPath);
        {
            const ForcedTrace forced;
            SvcDebugOutW(L"QVMRL0021I: VM specified is \"%s\"", vmPath.c_str());
        }
        found = getStandardJvmPropertyRoot(vmPath, root, notPluginJvm) ||
                getInstallJvmPropertyRoot(vmPath, root);
    }
    if (!found) {
        root = rcpHome + L"/rcp/deploy/";
        convertBS2S(root);
        notPluginJvm = true;
    }
    std::wstring key = L"jvm.root";
    std::wstring value = root;
    pushBackProperty(props, key, value);
    // Decision: a path is handed out in any case; whether a file stands there is the caller's
    // question.
    jvmPropertiesPath = root + L"jvm.properties";
    return true;
}

bool getStandardJvmPropertyRoot(const std::wstring& vmPath, std::wstring& root, bool& notPluginJvm)
{
    const std::wstring plugins = L"/eclipse/plugins/";
    notPluginJvm = true;
    const std::wstring::size_type found = vmPath.find(plugins);
    if (found == std::wstring::npos)
        return false;
    const std::wstring::size_type slash = vmPath.find(L'/', found + plugins.size());
    if (slash == std::wstring::npos)
        return false;
    const std::wstring candidate = vmPath.substr(0, slash + 1);
    if (!jvmPropExists(candidate))
        return false;
    root = candidate;
    notPluginJvm = false;
    return true;
}

bool getInstallJvmPropertyRoot(const std::wstring& vmPath, std::wstring& root)
{
    std::wstring::size_type slash = vmPath.rfind(L'/');
    for (int depth = 1; depth <= 3; ++depth) {
        if (slash == std::wstring::npos || slash == 0)
            return false;
        slash = vmPath.rfind(L'/', slash - 1);
        if (slash == std::wstring::npos)
            return false;
        const std::wstring candidate = vmPath.substr(0, slash + 1);
        if (jvmPropExists(candidate)) {
            root = candidate;
            return true;
        }
    }
    return false;
}

bool jvmPropExists(const std::wstring& root)
{
    std::wstring path = root + L"jvm.properties";
    convertToOsSeparator(path);
    return exists(path.c_str());
}

void getJvmHome(const std::wstring& vmPath, std::wstring& javaHome, const std::wstring& fallback)
{
    const std::wstring::size_type found = vmPath.find(L"jvm/bin");
    if (found == std::wstring::npos)
        javaHome = fallback;
    else if (found == 0)
        // Decision: the cut has nothing to stand on.
        javaHome.clear();
    else
        // Deliberate: one character more than "jvm/bin" is cut, the "/" before it.
        javaHome = vmPath.substr(0, found - 1);
}
