// What the unit tests share: small worlds on disk, words and properties, the lines of the log, and
// the end of the process.
//
// CTest runs each test in a process of its own, so globals start fresh. No test leaves anything in
// /tmp: a log that is expected goes to a directory of the test's own.
#ifndef TESTS_UNIT_SUPPORT_H
#define TESTS_UNIT_SUPPORT_H

#include "launcher/properties/property_list.h"
#include "platform/linux/argument_vector.h"

#include <gtest/gtest.h>

#include <functional>
#include <initializer_list>
#include <string>
#include <vector>

/// A directory of the test's own, removed with everything in it.
struct TempDir {
    TempDir();
    ~TempDir();
    TempDir(const TempDir&) = delete;
    TempDir& operator=(const TempDir&) = delete;

    /// "<dir>/<name>", as bytes and as wide text.
    std::string path(const std::string& name) const;
    std::wstring wide(const std::string& name) const;

    /// Writes a file (making directories on the way), makes a directory, reads a file.
    void write(const std::string& name, const std::string& bytes) const;
    void makeDir(const std::string& name) const;
    std::string read(const std::string& name) const;
    bool has(const std::string& name) const;

    std::string dir;
    std::wstring wdir;

private:
    // A forked child that ends by exit leaves its parent's directories alone.
    int owner;
};

/// Modifiable words that live as long as the process.
ArgumentVector words(std::initializer_list<const wchar_t*> texts);

/// The texts of words or of a property list, for comparing and printing.
std::vector<std::wstring> texts(const std::vector<wchar_t*>& list);

/// A list that holds just these keys and values: {L"key", L"value", ...}.
PropertyList pairs(std::initializer_list<const wchar_t*> keysAndValues);

/// The list that the reader makes of a file with these bytes.
PropertyList properties(const std::string& fileBytes);

/// What `action` writes to the log, with tracing on or off: the lines behind the empty line that
/// every log file begins with. The log stays open, in a directory of its own, until the process ends.
std::string logOf(bool tracing, const std::function<void()>& action);

/// True when `action` ends the process with status 255 and the last line of its log is exactly
/// `line`; with `reason` the line goes on with " : " and strerror of that number. Otherwise says
/// what happened instead.
testing::AssertionResult endsWith(const std::function<void()>& action, const std::string& line,
                                  int reason = -1);

/// The statement ends the process with status 255, and the log, which it begins, holds `text`: a
/// whole identifier, or the whole text of one that has several lines. endsWith compares all of it.
#define EXPECT_FATAL(statement, text) EXPECT_TRUE(fatalLineHolds([&] { statement; }, text))
testing::AssertionResult fatalLineHolds(const std::function<void()>& action,
                                        const std::string& text);

#endif
