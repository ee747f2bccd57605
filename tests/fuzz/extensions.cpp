// The merge of an extension: every word of the result is one of the words that went in.
#include "launcher/command/config_extensions.h"
#include "tests/fuzz/harness.h"

#include <cwchar>
#include <list>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    Bytes bytes = {data, size};
    std::list<std::wstring> kept;
    ArgumentVector argv;
    const unsigned count = 1 + bytes.number(12);
    for (unsigned i = 0; i < count; ++i) {
        kept.push_back(wide(bytes.line()));
        argv.push_back(&kept.back()[0]);
    }
    PropertyList props;
    for (int n = 1; bytes.left > 0 && n < 12; ++n)
        appendProperty(props, L"config.x." + std::to_wstring(n), wide(bytes.line()));
    appendProperty(props, L"rcp.data", L"/d");
    appendProperty(props, L"config.x.restartExe.linux", L"${rcp.home}\\x");
    int newArgc = 0;
    wchar_t** newArgv = nullptr;
    ArgumentVector args;
    VmargMap vmargs;
    runs([&] {
        addConfigExtentionsToArg(newArgc, newArgv, static_cast<int>(argv.size()), argv.data(),
                                 props, args, vmargs, L"/nowhere");
        if (newArgc != static_cast<int>(args.size()))
            finding("a count that is not the vector's");
        for (int i = 0; i < newArgc; ++i) {
            if (newArgv[i] != args[static_cast<size_t>(i)] ||
                wcsncmp(newArgv[i], L"vmarg.", 6) == 0)
                finding("a word that does not belong there");
        }
        if (args.size() > argv.size() + props.size() / 2)
            finding("more words than went in");
        std::wstring restartExe;
        getRestartExe(restartExe, static_cast<int>(argv.size()), argv.data(), props, L"/h");
    });
    delete[] newArgv;
    freeProperties(props);
    return 0;
}
