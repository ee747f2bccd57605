// What the fuzz targets share: a place for files, and the launcher's ends as exceptions.
//
// A fatal end is a defined end: it becomes an Ended exception here, and the next input follows in
// the same process. Shell commands, children and sleeps are taken over, so that an input decides
// nothing outside the target's own directory.
#ifndef TESTS_FUZZ_HARNESS_H
#define TESTS_FUZZ_HARNESS_H

#include <cstddef>
#include <cstdint>
#include <functional>
#include <string>

/// The launcher ended the process.
struct Ended {};

/// Set by a target whose ends must not unwind: exit promises to throw nothing, and a caller with
/// something to clean up relies on that. What those callers hold is lost.
extern bool endsByJump;

/// How often the shell still finds a platform, whatever number is looked up; never unless a target
/// says otherwise. One that lived for ever would have a restart wait for ever, where its number
/// stands so far behind in the lock file that invalidating does not reach it.
extern int platformLooks;

/// Runs `action`; true when it came to its end, false when the launcher ended the process with a
/// status that it may have (0, 1, 255). Any other status, and any byte on standard output, is a
/// finding. Streams that the action left open are closed.
bool runs(const std::function<void()>& action);

/// The directory for files: in memory, of this process alone.
const std::string& place();
std::wstring widePlace();

/// Writes a file there, making the directories on its way.
void put(const std::string& name, const std::string& bytes);

/// The bytes of an input, taken off piece by piece.
struct Bytes {
    const uint8_t* data;
    size_t left;

    unsigned number(unsigned below);
    /// Up to the next line end, or all that is left.
    std::string line();
    /// So many parts of what is left, with a byte 0x1e between them.
    std::string part();
    std::string rest();
};

/// The text in the locale of this process; empty when it cannot be converted.
std::wstring wide(const std::string& bytes);

/// Ends the process as a finding.
[[noreturn]] void finding(const char* what);

#endif
