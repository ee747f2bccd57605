// Escaping, read back by a reader of Java's properties format: the key and value come back, cut to
// sixteen bits a character.
#include "launcher/properties/property_escape.h"
#include "tests/fuzz/harness.h"

#include <string>

typedef std::wstring Text;

static bool isBlank(wchar_t c)
{
    return c == L' ' || c == L'\t' || c == L'\f';
}

// One character of a logical line, as java.util.Properties describes it.
static wchar_t unescapeOne(const Text& line, Text::size_type& at)
{
    wchar_t c = line[at++];
    if (c != L'\\' || at >= line.size())
        return c;
    c = line[at++];
    if (c == L'u') {
        const wchar_t code = static_cast<wchar_t>(std::stoul(line.substr(at, 4), nullptr, 16));
        at += 4;
        return code;
    }
    return c == L't' ? L'\t' : c == L'n' ? L'\n' : c == L'r' ? L'\r' : c == L'f' ? L'\f' : c;
}

static void readJava(const Text& line, Text& key, Text& value)
{
    Text::size_type at = 0;
    while (at < line.size() && line[at] != L'=' && line[at] != L':' && !isBlank(line[at]))
        key += unescapeOne(line, at);
    while (at < line.size() && isBlank(line[at]))
        ++at;
    if (at < line.size() && (line[at] == L'=' || line[at] == L':'))
        ++at;
    while (at < line.size() && isBlank(line[at]))
        ++at;
    while (at < line.size())
        value += unescapeOne(line, at);
}

static Text sixteenBits(const Text& text)
{
    Text out;
    for (const wchar_t c : text)
        out += static_cast<wchar_t>(c & 0xffff);
    return out;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    Bytes bytes = {data, size};
    const Text key = wide(bytes.line());
    Text value = wide(bytes.rest());
    Text line;
    convWcharTo8859_1(key, value, line);
    for (const wchar_t c : line) {
        if (c < 0x20 || c >= 0x7f)
            finding("a character that is not printable ASCII");
    }
    Text readKey;
    Text readValue;
    readJava(line, readKey, readValue);
    if (readKey != sixteenBits(key))
        finding("a key that does not come back");
    // Leading blanks of a value are the reader's; they are written as they stand.
    value.erase(0, value.find_first_not_of(L' '));
    if (readValue != sixteenBits(value))
        finding("a value that does not come back");
    return 0;
}
