// Files by their wide paths. Each call converts its path to the locale's bytes first; nothing
// stands between the system call and its result, so errno tells the reason of a failure.
// Whatever is opened here is closed when the platform is executed.
#ifndef PLATFORM_LINUX_FILES_H
#define PLATFORM_LINUX_FILES_H

#include <cstdio>
#include <string>

// ---- Questions: false for a null path ----------------------------------------------------------

/// True when the file can be opened for reading: one that may not be read counts as absent, a
/// directory as present. Never waits for the other end of a FIFO.
bool exists(const wchar_t* path);
bool existsA(const char* path);

/// True for a directory itself; a symbolic link to one is none.
bool isDirectory(const wchar_t* path);

/// True when the owner may execute it; links are followed.
bool isExecutable(const wchar_t* path);

// ---- Single operations: true on success, no message --------------------------------------------

bool deleteFile(const wchar_t* path);
bool moveFile(const wchar_t* from, const wchar_t* to);

/// Makes `link` a symbolic link to `target`.
bool symlink(const wchar_t* target, const wchar_t* link);

// ---- Copying -----------------------------------------------------------------------------------

/// Copies `from` to `to` as text of the locale, in pieces of at most 1000 characters; what stood
/// at `to` is overwritten. Always returns true. Fatal, with the system's reason:
/// QVMRL0190E (the source cannot be opened), QVMRL0191E (the destination cannot be opened),
/// QVMRL0192E (a write failed), QVMRL0193E (the source cannot be read to its end, or decoded).
bool copyFile(const wchar_t* from, const wchar_t* to);

// ---- Files that are made once and believed for ever --------------------------------------------

/// Where `target` is to be written: beside it when nothing at all stands there, so that it appears
/// whole or not at all; `target` itself when something does.
std::wstring placeForNewFile(const std::wstring& target);

/// Opens `place`, or `target` when that cannot be had, for output; `place` becomes the one
/// that was opened. Null on failure, with the errno of the target.
FILE* openNewFile(std::wstring& place, const wchar_t* target, const wchar_t* mode);

/// Puts what was written, flushed and closed at `place` to `target`. On failure nothing is left,
/// and errno tells why.
bool publishNewFile(const std::wstring& place, const std::wstring& target);

/// copyFile to `place`; messages name `to`. Always returns true. What lies aside is not flushed to
/// the disk: it is to be read again and deleted, and not to be believed.
bool copyFileAside(const wchar_t* from, std::wstring& place, const wchar_t* to);

/// copyFile for such a file. Fatal: as copyFile, with nothing left behind. False when the whole
/// copy could not be given its name.
bool copyNewFile(const wchar_t* from, const wchar_t* to);

// ---- Opening and reading -----------------------------------------------------------------------

/// Opens a stream of bytes. `fp` is null on failure. This stream and the next must be closed again
/// before four more are opened, open or closed as those may be: they take turns with four buffers.
void open_file(FILE*& fp, const wchar_t* path, const wchar_t* mode);

/// Opens a stream for the C library's wide output. `fp` is null on failure.
void open_wfile(FILE*& fp, const wchar_t* path, const wchar_t* mode);

/// Opens a path of bytes. `fp` is null on failure.
void open_prop_file(FILE*& fp, const char* path, const char* mode);

/// One fscanf with `format`, which holds at most one conversion, "%...[" of at most 2024 bytes.
/// `out` receives the text, and needs room for 2025 characters; it is empty when nothing matched,
/// or when the locale cannot convert the bytes. A NUL byte ends the text. Returns what fscanf
/// returned: 1, 0 when the conversion did not match, -1 at the end of the file.
int readFile(FILE* fp, const wchar_t* format, wchar_t* out);

/// The room that readFile needs.
const int LINE_ROOM = 2025;

/// Reads the next line for a copy line by line: at most 2024 bytes of it. The line end takes all
/// white space behind it along, so blank lines vanish, at the head of the file too, and a line
/// after the first loses its indentation. False at the end of the file.
bool readCopiedLine(FILE* fp, wchar_t* out);

/// Flushes what was written to `fp` and waits until it is on the disk. False when it is not.
bool flushToDisk(FILE* fp);

#endif
