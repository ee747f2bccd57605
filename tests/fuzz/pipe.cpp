// The pipe file: at most 2024 bytes of its first line that is not blank.
#include "platform/linux/files.h"
#include "platform/linux/lock_file.h"
#include "tests/fuzz/harness.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    put("pipe", std::string(reinterpret_cast<const char*>(data), size));
    runs([&] {
        // getPipeName remembers its answer for the process; this is the read that it makes.
        FILE* file = nullptr;
        open_file(file, (widePlace() + L"/pipe").c_str(), L"r");
        wchar_t line[LINE_ROOM];
        const int result = readFile(file, L" %2024[^\n]\n", line);
        if (result < -1 || result > 1)
            finding("a result that a read does not have");
        if (std::wstring(line).find(L'\n') != std::wstring::npos)
            finding("a line end in a line");
        rewind(file);
        int lines = 0;
        while (readCopiedLine(file, line)) {
            if (static_cast<size_t>(++lines) > size + 1)
                finding("a copy without an end");
        }
        fclose(file);
    });
    return 0;
}
