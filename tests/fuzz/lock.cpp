// The lock file: whatever it holds, a start becomes the main process or ends with its line; where
// the shell finds a platform it becomes a daemon process, but only when there is a number. The next
// start finds the number that a main process has written, whatever stood there before.
#include "platform/linux/lock_file.h"
#include "platform/linux/wide_strings.h"
#include "tests/fuzz/harness.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    Bytes bytes = {data, size};
    static wchar_t program[] = L"velmora";
    static wchar_t restart[] = L"-restart";
    static wchar_t oldPid[] = L"-rcp_old_pid";
    std::wstring number = wide(bytes.line());
    wchar_t* words[] = {program, restart, oldPid, &number[0]};
    const unsigned flags = bytes.number(4);
    const int count = (flags & 1) == 0 ? 1 : 4;
    const bool lives = (flags & 2) != 0;
    platformLooks = lives ? 50 : 0;
    const std::wstring name = wide(bytes.line());
    put("ws/.rcp.lock", bytes.rest());
    setMainProcess(false);
    std::string narrow;
    const bool named = wstrtocs(narrow, name) > 0;
    runs([&] {
        locateLockFile(count, words, widePlace() + L"/ws", name);
        if (!isMainProcess() && (!lives || getPlatformPid() == 0))
            finding("a daemon process beside no platform");
        populateLockFile(4711);
        unlockLockFile();
        if (!isMainProcess() || !named)
            return;
        platformLooks = 1;
        setMainProcess(false);
        locateLockFile(1, words, widePlace() + L"/ws", name);
        if (isMainProcess() || getPlatformPid() != 4711)
            finding("a platform that the next start does not see");
    });
    return 0;
}
