// The reader and the unescaping once more, each step as it is prescribed and nothing in one go: what
// the launcher's own, which are made to be fast, are compared with.
#ifndef TESTS_FUZZ_LITERAL_H
#define TESTS_FUZZ_LITERAL_H

#include <string>
#include <vector>

/// The keys and values of a properties file, in turn. Each ends at its first NUL.
std::vector<std::wstring> literalProperties(const std::string& path);

/// A value without its escapes, and trimmed.
std::wstring literalValue(std::wstring value);

#endif
