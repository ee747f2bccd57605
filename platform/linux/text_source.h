// A text file that is copied: its characters in pieces.
//
// Decoded here, one byte after the other: the C library's wide input takes a character that is cut
// off by the end of the file for that end, and a copy would lose it without a word.
#ifndef PLATFORM_LINUX_TEXT_SOURCE_H
#define PLATFORM_LINUX_TEXT_SOURCE_H

#include <cstdio>
#include <cwchar>
#include <string>

/// Reads from a stream of bytes that somebody else opened and closes.
struct TextSource {
    explicit TextSource(FILE* stream) : file(stream) {}

    /// Sets `piece` to the next at most 1000 characters, no further than to their line's end.
    /// False at the end of the file, and where it cannot be read or decoded.
    bool readPiece(std::wstring& piece);

    /// After the last piece: true at the end of the file, with its last character whole. False
    /// otherwise, with the reason in errno.
    bool isAtItsEnd();

private:
    FILE* file;
    mbstate_t state = {};
    bool inCharacter = false;
    bool undecodable = false;
};

#endif
