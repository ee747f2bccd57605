// The properties reader: any file gives the pairs that the same steps give when they are done
// literally; each key and value is a text of its own.
#include "launcher/properties/property_file.h"
#include "tests/fuzz/harness.h"
#include "tests/fuzz/literal.h"

#include <cwchar>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    const std::string bytes(reinterpret_cast<const char*>(data), size);
    put("a.properties", bytes);
    PropertyList list;
    if (!runs([&] { getProperties(widePlace() + L"/a.properties", list); }))
        finding("a file that is there ends the start");
    if (list.size() % 2 != 0)
        finding("a key without a value");
    for (PropertyList::size_type i = 0; i < list.size(); ++i) {
        const size_t length = wcslen(list[i]);
        if (i % 2 == 0 && wcspbrk(list[i], L" :=\t\n") != nullptr)
            finding("a separator in a key");
        // A pair may be continued over many lines, but never grows beyond what the file holds.
        if (length > size)
            finding("more text than the file has");
    }
    if (size < 10000 && literalProperties(place() + "/a.properties") !=
                            std::vector<std::wstring>(list.begin(), list.end()))
        finding("other pairs");
    freeProperties(list);
    return 0;
}
