// What the tests of launcher/ share beyond support.h: words and lists that own their texts,
// children whose log and result can be read, a /tmp of one's own, and the test executable standing
// where an installed launcher stands.
#ifndef TESTS_UNIT_FIXTURES_H
#define TESTS_UNIT_FIXTURES_H

#include "tests/unit/support.h"

/// The words of a command line, with argc and argv; released with it.
struct Line {
    Line(std::initializer_list<const wchar_t*> words);
    explicit Line(const std::vector<std::wstring>& words);
    Line(const Line&) = delete;
    Line& operator=(const Line&) = delete;

    std::vector<std::wstring> owned;
    std::vector<wchar_t*> pointers;
    int argc;
    wchar_t** argv;
};

/// A list that owns its keys and values: {L"key", L"value", ...}.
struct Props {
    Props(std::initializer_list<const wchar_t*> keysAndValues);
    explicit Props(const std::vector<std::wstring>& keysAndValues);
    ~Props();
    Props(const Props&) = delete;
    Props& operator=(const Props&) = delete;

    PropertyList list;
};

typedef std::vector<std::wstring> Texts;

/// The words that `builder` appends to an empty command.
Texts commandOf(const std::function<void()>& builder);

/// How a child ended, what its action returned, and its log behind the empty line at its head.
struct Ended {
    int status;
    std::string result;
    std::string log;
};

/// Runs `action` in a child whose log lies below `dir`. A child that did not end by itself has
/// status 0 and the result of the action.
Ended runAside(const TempDir& dir, bool tracing, const std::function<std::string()>& action);

/// The same with an empty /tmp of the child's own, in which `dir` alone stands at its place.
Ended runInPrivateTmp(const TempDir& dir, bool tracing, const std::function<std::string()>& action);

/// Why runInPrivateTmp cannot work here; empty when it can.
std::string privateTmpRefusal();
#define SKIP_WITHOUT_PRIVATE_TMP()                                                                 \
    do {                                                                                           \
        const std::string refusal = privateTmpRefusal();                                           \
        if (!refusal.empty())                                                                      \
            GTEST_SKIP() << refusal;                                                               \
    } while (false)

/// Something that the test executable does instead of running tests, as a copy of itself.
struct InstalledJob {
    InstalledJob(const char* name, std::string (*job)(const std::string& worldDir));
};

/// Copies the test executable to "<world>/<place>" and runs its job `name` there, in a private
/// /tmp. The result is what the job returned; the log is empty.
Ended runInstalled(const TempDir& world, const std::string& place, const std::string& name);

/// From now on no file of this process may become longer: writing there fails (EFBIG), as on a
/// full disk. For children alone.
void limitFileSize(long bytes);

#endif
