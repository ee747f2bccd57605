#include "launcher/command/child_environment.h"

#include "tests/unit/fixtures.h"
#include "tests/unit/separate_process.h"

#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sys/syscall.h>
#include <unistd.h>

namespace fs = std::filesystem;

static std::string variable(const char* name)
{
    const char* value = getenv(name);
    return value == nullptr ? "(unset)" : value;
}

namespace {
// One of the three properties: absent, empty, or present.
enum State { ABSENT, EMPTY, PRESENT };

struct LibraryPathRow {
    State prepend;
    State recorded;
    State append;
    const char* expected; // null: as inherited
};
} // namespace

static const LibraryPathRow LIBRARY_PATH_ROWS[] = {
    {ABSENT, ABSENT, ABSENT, nullptr},       {ABSENT, ABSENT, EMPTY, nullptr},
    {ABSENT, ABSENT, PRESENT, "/b"},         {ABSENT, EMPTY, ABSENT, nullptr},
    {ABSENT, EMPTY, EMPTY, nullptr},         {ABSENT, EMPTY, PRESENT, "/b"},
    {ABSENT, PRESENT, ABSENT, nullptr},      {ABSENT, PRESENT, EMPTY, nullptr},
    {ABSENT, PRESENT, PRESENT, "/c:/b"},     {EMPTY, ABSENT, ABSENT, nullptr},
    {EMPTY, ABSENT, EMPTY, nullptr},         {EMPTY, ABSENT, PRESENT, "/b"},
    {EMPTY, EMPTY, ABSENT, nullptr},         {EMPTY, EMPTY, EMPTY, nullptr},
    {EMPTY, EMPTY, PRESENT, "/b"},           {EMPTY, PRESENT, ABSENT, nullptr},
    {EMPTY, PRESENT, EMPTY, nullptr},        {EMPTY, PRESENT, PRESENT, "/c:/b"},
    {PRESENT, ABSENT, ABSENT, "/a"},         {PRESENT, ABSENT, EMPTY, "/a"},
    {PRESENT, ABSENT, PRESENT, "/a:/b"},     {PRESENT, EMPTY, ABSENT, "/a"},
    {PRESENT, EMPTY, EMPTY, "/a"},           {PRESENT, EMPTY, PRESENT, "/a:/b"},
    {PRESENT, PRESENT, ABSENT, "/a:/c"},     {PRESENT, PRESENT, EMPTY, "/a:/c"},
    {PRESENT, PRESENT, PRESENT, "/a:/c:/b"},
};

static void addState(std::vector<std::wstring>& list, const wchar_t* key, State state,
                     const wchar_t* value)
{
    if (state == ABSENT)
        return;
    list.push_back(key);
    list.push_back(state == EMPTY ? L"" : value);
}

static std::string libraryPathAfter(const LibraryPathRow& row, const char* inherited)
{
    std::vector<std::wstring> list;
    addState(list, L"library.path.append", row.append, L"/b");
    addState(list, L"com.vantor.rcp.core.internal.librarypath", row.recorded, L"/c");
    addState(list, L"library.path.prepend", row.prepend, L"/a");
    const Props props(list);
    if (inherited == nullptr)
        unsetenv("LD_LIBRARY_PATH");
    else
        setenv("LD_LIBRARY_PATH", inherited, 1);
    addLibpathToCommandLine(props.list);
    const std::string after = variable("LD_LIBRARY_PATH");
    unsetenv("LD_LIBRARY_PATH");
    return after;
}

TEST(addLibpathToCommandLine, JoinsEveryCombinationOfItsProperties)
{
    for (const LibraryPathRow& row : LIBRARY_PATH_ROWS) {
        SCOPED_TRACE(testing::Message() << row.prepend << " " << row.recorded << " " << row.append);
        EXPECT_EQ(libraryPathAfter(row, nullptr),
                  row.expected == nullptr ? "(unset)" : row.expected);
        EXPECT_EQ(libraryPathAfter(row, "/inherited"),
                  row.expected == nullptr ? "/inherited" : row.expected);
        EXPECT_EQ(libraryPathAfter(row, ""), row.expected == nullptr ? "" : row.expected);
    }
}

TEST(addLibpathToCommandLine, AnEmptyValueCountsAsAbsent)
{
    EXPECT_EQ(libraryPathAfter({EMPTY, PRESENT, PRESENT, nullptr}, "/i"), "/c:/b");
    EXPECT_EQ(libraryPathAfter({PRESENT, EMPTY, EMPTY, nullptr}, "/i"), "/a");
    EXPECT_EQ(libraryPathAfter({EMPTY, PRESENT, EMPTY, nullptr}, "/i"), "/i");
}

TEST(addLibpathToCommandLine, TheRecordedPathAloneSetsNothingAndTheInheritedOneIsReplaced)
{
    EXPECT_EQ(libraryPathAfter({ABSENT, PRESENT, ABSENT, nullptr}, "/i"), "/i");
    EXPECT_EQ(libraryPathAfter({PRESENT, ABSENT, ABSENT, nullptr}, "/i"), "/a");
}

static void setEnvironment(std::initializer_list<const wchar_t*> keysAndValues)
{
    const Props props(keysAndValues);
    addEnvSetToCommandLine(props.list);
}

TEST(addEnvSetToCommandLine, SetsVariablesAndOverwrites)
{
    setenv("VELMORA_A", "old", 1);
    setEnvironment(
        {L"env.set.VELMORA_A", L"1", L"env.set.VELMORA_B", L"b c", L"env.set.VELMORA_C", L""});
    EXPECT_EQ(variable("VELMORA_A"), "1");
    EXPECT_EQ(variable("VELMORA_B"), "b c");
    EXPECT_EQ(variable("VELMORA_C"), "");
}

TEST(addEnvSetToCommandLine, RemovesVariables)
{
    setenv("VELMORA_PATH2", "x", 1);
    setEnvironment({L"env.unset.VELMORA_PATH2", L"whatever", L"env.unset.VELMORA_NONE", L""});
    EXPECT_EQ(variable("VELMORA_PATH2"), "(unset)");
}

TEST(addEnvSetToCommandLine, RemovesBeforeItSetsWhateverTheirOrder)
{
    setenv("VELMORA_A", "old", 1);
    setEnvironment({L"env.set.VELMORA_A", L"1", L"env.unset.VELMORA_A", L""});
    EXPECT_EQ(variable("VELMORA_A"), "1");
}

TEST(addEnvSetToCommandLine, TheLastOfTwoSettingsStays)
{
    setEnvironment({L"env.set.VELMORA_A", L"1", L"env.set.VELMORA_A", L"2"});
    EXPECT_EQ(variable("VELMORA_A"), "2");
}

TEST(addEnvSetToCommandLine, TheNameBeginsAtAFixedPlace)
{
    setenv("VELMORA_B", "x", 1);
    setEnvironment({L"env.set_VELMORA_A", L"1", L"env.unset_VELMORA_B", L""});
    EXPECT_EQ(variable("VELMORA_A"), "1");
    EXPECT_EQ(variable("VELMORA_B"), "(unset)");
}

TEST(addEnvSetToCommandLine, AKeyWithoutANameHasNoEffect)
{
    char** const before = environ;
    int count = 0;
    for (char** entry = before; *entry != nullptr; ++entry)
        ++count;
    setEnvironment({L"env.set", L"1", L"env.set.", L"2", L"env.unset", L"", L"env.unset.", L""});
    int after = 0;
    for (char** entry = environ; *entry != nullptr; ++entry)
        ++after;
    EXPECT_EQ(after, count);
}

TEST(addEnvSetToCommandLine, AFailureIsPassedOverWithoutAWord)
{
    setenv("VELMORA_B", "b", 1);
    unsetenv("VELMORA_A");
    // No name may hold an equals sign, so neither call does anything.
    EXPECT_EQ(logOf(true,
                    [] {
                        setEnvironment({L"env.unset.VELMORA_B=C", L"", L"env.set.VELMORA_A=B", L"1",
                                        L"env.set.VELMORA_D", L"4"});
                    }),
              "");
    EXPECT_EQ(variable("VELMORA_A"), "(unset)");
    EXPECT_EQ(variable("VELMORA_B"), "b");
    EXPECT_EQ(variable("VELMORA_D"), "4");
}

TEST(addEnvJavaHighZipfds, IsThePropertyOr500)
{
    setenv("JAVA_HIGH_ZIPFDS", "7", 1);
    addEnvJavaHighZipfds(Props({}).list);
    EXPECT_EQ(variable("JAVA_HIGH_ZIPFDS"), "500");
    addEnvJavaHighZipfds(Props({L"env.JAVA_HIGH_ZIPFDS", L"1000"}).list);
    EXPECT_EQ(variable("JAVA_HIGH_ZIPFDS"), "1000");
    addEnvJavaHighZipfds(Props({L"env.JAVA_HIGH_ZIPFDS", L""}).list);
    EXPECT_EQ(variable("JAVA_HIGH_ZIPFDS"), "");
    unsetenv("JAVA_HIGH_ZIPFDS");
}

// LD_PRELOAD stays in children, so that nothing that the tests run is preloaded with anything.
static Ended preloadAfter(std::initializer_list<const wchar_t*> keysAndValues)
{
    const TempDir dir;
    return runAside(dir, true, [&] {
        unsetenv("LD_PRELOAD");
        addLdPreloadToCommandLine(Props(keysAndValues).list);
        return variable("LD_PRELOAD");
    });
}

TEST(addLdPreloadToCommandLine, DoesNothingWithoutItsProperty)
{
    const Ended ended = preloadAfter({L"rcp.install.id", L"1234"});
    EXPECT_EQ(ended.result, "(unset)");
    EXPECT_EQ(ended.log, "");
}

TEST(addLdPreloadToCommandLine, PreloadsTheLibraryOfItsProperty)
{
    EXPECT_EQ(
        preloadAfter({L"library.preload", L"/opt/lib/libx.so", L"rcp.install.id", L"1"}).result,
        "/opt/lib/libx.so");
}

TEST(addLdPreloadToCommandLine, EndsWithoutAnInstallId)
{
    EXPECT_TRUE(endsWith(
        [] {
            const Props props({L"library.preload", L"/opt/lib/libx.so"});
            errno = EACCES;
            addLdPreloadToCommandLine(props.list);
        },
        "QVMRL0034E: Couldn't find the rcp.install.id property!", EACCES));
}

namespace {
// setPreload in a private /tmp, as user "alice" of installation "1234"; result: LD_PRELOAD, then
// what the link leads to.
struct Preload {
    TempDir dir;
    std::string library = dir.path("my lib/libx.so");
    std::string link = "/tmp/vantor.rcp.alice.1234.libx.so";

    void makeLibrary() const
    {
        dir.write("my lib/libx.so", "");
    }

    Ended after(const std::function<void()>& before, const char* user = "alice") const
    {
        return runInPrivateTmp(dir, true, [&] {
            unsetenv("LD_PRELOAD");
            unsetenv("USER");
            if (user != nullptr)
                setenv("USER", user, 1);
            before();
            setPreload(std::wstring(library.begin(), library.end()), L"1234");
            std::error_code none;
            return variable("LD_PRELOAD") + " -> " + fs::read_symlink(link, none).string();
        });
    }

    std::string found() const
    {
        return "setPreload():found property: library.preload=" + library + "\n";
    }

    std::string names() const
    {
        return found() + "setPreload():library name = libx.so\nsetPreload():linkPath=" + link +
               "\n";
    }

    std::string existing(const std::string& target) const
    {
        return "setPreload(): link path already exists.\n"
               "setPreload(): existing link is to: " +
               target + "\n";
    }

    std::string created() const
    {
        return "setPreload(): creating new link ...\n"
               "setPreload(): symlink() result = 0\n";
    }

    std::string set() const
    {
        return "setPreload():setting LD_PRELOAD=" + link + "\n" +
               "setPreload():getenv LD_PRELOAD=" + link + "\n";
    }
};
} // namespace

TEST(setPreload, SetsAPathWithoutABlankDirectly)
{
    const TempDir dir;
    const Ended ended = runAside(dir, true, [] {
        setenv("LD_PRELOAD", "/old", 1);
        setPreload(L"/opt/lib/libx.so", L"1234");
        return variable("LD_PRELOAD");
    });
    EXPECT_EQ(ended.result, "/opt/lib/libx.so");
    EXPECT_EQ(ended.log, "setPreload():setting LD_PRELOAD=/opt/lib/libx.so\n");
}

TEST(setPreload, TakesATabForNoBlank)
{
    const TempDir dir;
    const Ended ended = runAside(dir, true, [] {
        setPreload(L"/opt/my\tlib/libx.so", L"1234");
        return variable("LD_PRELOAD");
    });
    EXPECT_EQ(ended.result, "/opt/my\tlib/libx.so");
    EXPECT_EQ(ended.log, "setPreload():setting LD_PRELOAD=/opt/my\tlib/libx.so\n");
}

TEST(setPreload, ReachesAPathWithABlankThroughANewLink)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const Preload preload;
    preload.makeLibrary();
    const Ended ended = preload.after([] {});
    EXPECT_EQ(ended.result, preload.link + " -> " + preload.library);
    EXPECT_EQ(ended.log, preload.names() + preload.created() + preload.set());
}

TEST(setPreload, TurnsTheBackslashesOfAPathWithABlank)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    Preload preload;
    preload.makeLibrary();
    preload.library = preload.dir.path("my lib\\libx.so");
    const Ended ended = preload.after([] {});
    EXPECT_EQ(ended.result, preload.link + " -> " + preload.dir.path("my lib/libx.so"));
    EXPECT_EQ(ended.log, preload.names() + preload.created() + preload.set());
}

TEST(setPreload, HandsAPathWithoutABlankOnAsItIs)
{
    const TempDir dir;
    const Ended ended = runAside(dir, true, [] {
        setPreload(L"\\opt\\libx.so", L"1234");
        return variable("LD_PRELOAD");
    });
    EXPECT_EQ(ended.result, "\\opt\\libx.so");
}

TEST(setPreload, KeepsALinkThatLeadsToTheLibrary)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const Preload preload;
    preload.makeLibrary();
    const Ended ended = preload.after([&] { fs::create_symlink(preload.library, preload.link); });
    EXPECT_EQ(ended.result, preload.link + " -> " + preload.library);
    EXPECT_EQ(ended.log, preload.names() + preload.existing(preload.library) + preload.set());
}

TEST(setPreload, ReplacesALinkThatLeadsElsewhere)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const Preload preload;
    preload.makeLibrary();
    preload.dir.write("other.so", "");
    const std::string other = preload.dir.path("other.so");
    const Ended ended = preload.after([&] { fs::create_symlink(other, preload.link); });
    EXPECT_EQ(ended.result, preload.link + " -> " + preload.library);
    EXPECT_EQ(ended.log, preload.names() + preload.existing(other) +
                             "setPreload(): removing existing link ...\n" + preload.created() +
                             preload.set());
}

TEST(setPreload, DecisionALinkThatCannotBeRemovedIsNamed)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const Preload preload;
    preload.makeLibrary();
    preload.dir.write("other.so", "");
    const std::string other = preload.dir.path("other.so");
    const Ended ended = preload.after([&] {
        fs::create_symlink(other, preload.link);
        // What the sticky bit of /tmp does to somebody else's link.
        ASSERT_TRUE(makeFail(SYS_unlink, EPERM));
    });
    EXPECT_EQ(ended.result, preload.link + " -> " + other);
    EXPECT_EQ(ended.log, preload.names() + preload.existing(other) +
                             "setPreload(): removing existing link ...\n" + preload.set());
}

TEST(setPreload, ALinkThatLeadsNowhereStaysAndIsNamedAllTheSame)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const Preload preload;
    preload.makeLibrary();
    const Ended ended = preload.after([&] { fs::create_symlink("/nowhere", preload.link); });
    EXPECT_EQ(ended.result, preload.link + " -> /nowhere");
    EXPECT_EQ(ended.log, preload.names() + preload.created() + preload.set());
}

TEST(setPreload, LogsTheResultZeroWhenTheLinkCannotBeMade)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const Preload preload;
    preload.makeLibrary();
    // A link that leads nowhere is in the way: symlink fails with EEXIST.
    const Ended ended = preload.after([&] { fs::create_symlink("/nowhere", preload.link); });
    EXPECT_NE(ended.log.find("setPreload(): symlink() result = 0\n"), std::string::npos);
}

TEST(setPreload, EndsForAFileInTheLinksPlace)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const Preload preload;
    preload.makeLibrary();
    for (bool directory : {true, false}) {
        const Ended ended = preload.after([&] {
            if (directory)
                fs::create_directory(preload.link);
            else
                std::ofstream(preload.link) << "somebody's";
        });
        EXPECT_EQ(ended.status, 255);
        EXPECT_EQ(ended.log, preload.names() +
                                 "setPreload(): link path already exists.\n"
                                 "QVMRL0184E: Getting command path failed! errno = 22 : "
                                 "Invalid argument\n");
    }
}

TEST(setPreload, SetsNothingForALibraryThatDoesNotExist)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const Preload preload;
    const Ended ended = preload.after([] { setenv("LD_PRELOAD", "/inherited", 1); });
    EXPECT_EQ(ended.result, "/inherited -> ");
    EXPECT_EQ(ended.log, preload.found() + "setPreload():getenv LD_PRELOAD=/inherited\n");
}

TEST(setPreload, TellsOfAVariableThatIsNotSetWhenTheLibraryDoesNotExist)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const Preload preload;
    const Ended ended = preload.after([] {});
    EXPECT_EQ(ended.result, "(unset) -> ");
    EXPECT_EQ(ended.log, preload.found() +
                             "QVMRL0081I:  Environmental variable 'LD_PRELOAD' is not set\n\n"
                             "setPreload():getenv LD_PRELOAD=\n");
}

TEST(setPreload, EndsWithoutAUserName)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const Preload preload;
    preload.makeLibrary();
    const Ended ended = preload.after([] { errno = EACCES; }, nullptr);
    EXPECT_EQ(ended.status, 255);
    EXPECT_EQ(ended.log, preload.found() +
                             "setPreload():library name = libx.so\n"
                             "QVMRL0081I:  Environmental variable 'USER' is not set\n\n"
                             "QVMRL0006E: Couldn't find the user name! : Permission denied\n");
}

TEST(setPreload, TakesAnEmptyUserNameAsItIs)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    Preload preload;
    preload.link = "/tmp/vantor.rcp..1234.libx.so";
    preload.makeLibrary();
    EXPECT_EQ(preload.after([] {}, "").result, preload.link + " -> " + preload.library);
}

TEST(setPreload, EndsForALibraryWithoutADirectory)
{
    const TempDir dir;
    dir.write("a b.so", "");
    EXPECT_TRUE(endsWith(
        [&] {
            fs::current_path(dir.dir);
            unsetenv("USER");
            errno = EACCES;
            setPreload(L"a b.so", L"1234");
        },
        "QVMRL0189E: Couldn't find filename for library.preload property", EACCES));
}
