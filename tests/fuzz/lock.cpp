// The lock file: whatever it holds, a start becomes the main process or ends with its line.
#include "platform/linux/lock_file.h"
#include "tests/fuzz/harness.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    Bytes bytes = {data, size};
    static wchar_t program[] = L"velmora";
    static wchar_t restart[] = L"-restart";
    static wchar_t oldPid[] = L"-rcp_old_pid";
    std::wstring number = wide(bytes.line());
    wchar_t* words[] = {program, restart, oldPid, &number[0]};
    const int count = bytes.number(2) == 0 ? 1 : 4;
    const std::wstring name = wide(bytes.line());
    put("ws/.rcp.lock", bytes.rest());
    setMainProcess(false);
    const bool decided = runs([&] {
        locateLockFile(count, words, widePlace() + L"/ws", name);
        if (!isMainProcess())
            finding("a daemon process beside no platform");
        populateLockFile(4711);
        unlockLockFile();
    });
    static_cast<void>(decided);
    return 0;
}
