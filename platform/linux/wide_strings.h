// Raw wide strings, and the conversions between wide text and the locale's bytes.
//
// Inside the launcher all text is wide. Bytes in the locale's encoding exist at system calls, in
// files and in the child's words; what crosses that edge as a whole text goes through the four
// conversions here.
// Running out of memory ends the process with a line QVMRL0004E. The conversions may change errno.
#ifndef PLATFORM_LINUX_WIDE_STRINGS_H
#define PLATFORM_LINUX_WIDE_STRINGS_H

#include <cstddef>
#include <string>

/// A new empty string with room for `n` characters and the terminating zero. The caller owns it
/// and releases it with freeString. Fatal: "QVMRL0004E: newString malloc failed. ...".
wchar_t* newString(size_t n);

/// The same, with its own fatal line: "QVMRL0004E: mallocString malloc failed!".
wchar_t* mallocString(size_t n);

/// Releases `p`, which may be null. Returns null, so that the caller can store it.
wchar_t* freeString(void* p);

/// Appends `src` to `dst` and returns `dst`. On a fresh string this is a copy.
wchar_t* initMemString(wchar_t* dst, const wchar_t* src);

/// mbstowcs into `out`, which is not null.
size_t decode(wchar_t* out, const char* s, size_t room);

/// A new string (the caller owns it) with the text of `s`. Bytes that the locale cannot convert
/// make the whole result empty.
wchar_t* chartowcs(const char* s);

/// The same into `out`; returns the characters of `out`.
const wchar_t* chartowstr(const char* s, std::wstring& out);

/// Sets `out` to the bytes of `s`; empty when the locale cannot convert it.
/// Fatal: "QVMRL0004E: malloc failed!".
void wcstochar(std::string& out, const wchar_t* s);

/// The same; returns the number of bytes, -1 for text that the locale cannot convert.
int wstrtocs(std::string& out, const std::wstring& s);

#endif
