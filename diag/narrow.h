// The log's own conversion to bytes, and its own look at files: they must work when everything
// above does not.
#ifndef DIAG_NARROW_H
#define DIAG_NARROW_H

#include <string>

/// True in the encodings that nearly every session has: ASCII stands for itself there, and is
/// converted without the C library, which takes ten times as long for it.
bool asciiIsItself();

/// The text in the locale's encoding; empty when the locale cannot convert it.
std::string narrow(const wchar_t* text);

/// The path with every backslash turned into a slash.
std::wstring withSlashes(std::wstring path);

/// The path as this system takes it, with slashes, in bytes.
std::string narrowPath(const std::wstring& path);

/// True when the file can be opened for reading. Never waits for the other end of a FIFO.
bool fileExists(const char* path);

#endif
