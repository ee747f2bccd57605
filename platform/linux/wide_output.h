// Wide text to a file.
//
// The C library's own wide output writes sixteen bytes at a time; this writes the same bytes to a
// stream of bytes, through its buffer.
#ifndef PLATFORM_LINUX_WIDE_OUTPUT_H
#define PLATFORM_LINUX_WIDE_OUTPUT_H

#include <cstdio>
#include <string>

/// Writes `text`, up to its first NUL, to a stream of bytes in the locale's encoding. As in the C
/// library's wide output, a character that the locale lacks becomes what its transliteration says
/// ("?" at the least, where the locale has such a rule). False when a character cannot be written
/// at all (what stands before it is), or when the write fails.
bool putWide(FILE* fp, const std::wstring& text);

#endif
