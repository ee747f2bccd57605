#include "launcher/user_area/startup_arguments.h"

#include "diag/SvcDebug_linux.h"
#include "launcher/properties/placeholders.h"
#include "launcher/properties/property_escape.h"
#include "launcher/user_area/locations.h"
#include "platform/linux/argument_vector.h"
#include "platform/linux/environment.h"
#include "platform/linux/files.h"
#include "platform/linux/paths.h"
#include "platform/linux/process.h"
#include "platform/linux/wide_output.h"

#include <cstdio>
#include <cwchar>

// The file that is being written, and the path that its messages name.
struct Record {
    FILE* file;
    std::wstring path;

    // Ends the process with `message` when the entry cannot be written.
    void write(const std::wstring& key, const std::wstring& value, const char* message) const
    {
        std::wstring line;
        convWcharTo8859_1(key, value, line);
        if (!putWide(file, line + L"\n"))
            fatalErrorA(message, path.c_str(), EXIT_PROCESS, WITH_ERRNO);
    }
};

// The index of the word behind the first "-data", -1 when there is none. argv[0] counts here.
static int dataValueIndex(int argc, wchar_t** argv)
{
    for (int i = 0; i < argc; ++i) {
        if (wcscmp(argv[i], L"-data") == 0)
            return i + 1;
    }
    return -1;
}

static std::wstring executableWord(const wchar_t* restartExe)
{
    if (restartExe != nullptr && restartExe[0] != L'\0')
        return restartExe;
    std::wstring path;
    getLauncherPath(path, nullptr);
    return path;
}

// Deliberate: a separator at the end stays here, which the workspace itself loses.
static std::wstring dataWord(const wchar_t* word, const PropertyList& props,
                             const std::wstring& rcpHome)
{
    std::wstring value = word;
    replaceFirstRcpHome(value, rcpHome);
    replaceUserPlaceholders(value, props);
    std::wstring out;
    convert_from_relative_location(value.c_str(), out);
    return out;
}

// Not by the wide printf of the C library, as std::to_wstring would: nothing else of a usual start
// needs that.
static std::wstring decimal(int n)
{
    const std::string digits = std::to_string(n);
    return std::wstring(digits.begin(), digits.end());
}

void writeStartupArgs(int argc, wchar_t** argv, const std::wstring& configDir,
                      const wchar_t* restartExe, const PropertyList& props,
                      const std::wstring& rcpHome)
{
    Record record = {nullptr, configDir + L"/args.properties"};
    convertToOsSeparator(record.path);
    open_file(record.file, record.path.c_str(), L"w+");
    if (record.file == nullptr) {
        fatalErrorA("QVMRL0097E: Could not open %ls for writing!", record.path.c_str(),
                    EXIT_PROCESS, WITH_ERRNO);
        return;
    }
    // Only the first of each is left out; a second one is recorded.
    const int restart = findOption(L"-restart", argc, argv);
    const int reset = findOption(L"-resetconfig", argc, argv);
    const int oldPid = findOption(L"-rcp_old_pid", argc, argv);
    const int data = dataValueIndex(argc, argv);
    int recorded = 0;
    for (int i = 0; i < argc; ++i) {
        if (i > 0 && (i == restart || i == reset))
            continue;
        if (i > 0 && i == oldPid) {
            ++i;
            continue;
        }
        std::wstring word = argv[i];
        if (i == 0)
            word = executableWord(restartExe);
        else if (i == data)
            word = dataWord(argv[i], props, rcpHome);
        record.write(L"arg" + decimal(recorded++), word, "QVMRL0020E: Error writing to %ls file.");
    }
    record.write(L"argc", decimal(recorded), "QVMRL0116E: Error writing to %ls file.");
    std::wstring libraryPath;
    getEnv(L"LD_LIBRARY_PATH", libraryPath);
    record.write(L"com.vantor.rcp.core.internal.librarypath", libraryPath,
                 "QVMRL0117E: Error writing to %ls file.");
    // Decision: what is still in the stream's buffer counts as the last entry.
    if (fflush(record.file) != 0)
        fatalErrorA("QVMRL0117E: Error writing to %ls file.", record.path.c_str(), EXIT_PROCESS,
                    WITH_ERRNO);
    fclose(record.file);
}
