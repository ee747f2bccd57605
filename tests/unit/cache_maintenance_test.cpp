#include "launcher/user_area/cache_maintenance.h"

#include "tests/unit/fixtures.h"

#include <algorithm>
#include <clocale>
#include <filesystem>

namespace fs = std::filesystem;

namespace {
// A workspace with a cache directory in it and one beside it. The paths hold no comma.
struct Workspace {
    Workspace()
    {
        dir.makeDir("ws/logs");
        for (const char* file : {"app_1", "xapp", "ap", "other"}) {
            dir.write(std::string("ws/cache/") + file, "");
            dir.write(std::string("shared/") + file, "");
        }
        dir.write("ws/cache/app_dir/app_file", "");
    }

    // The map; "cache" and "shared" stand for the two directories.
    VmargMap vmargs(const std::wstring& name, const wchar_t* place) const
    {
        return {{L"vmarg.CacheMaintenance.enable", L"true"},
                {L"vmarg.Dshare",
                 L"-Xshareclasses:name=" + name + L",controlDir=" + dir.wdir + L"/" + place}};
    }

    // Whether files were removed, as reported.
    bool maintain(const VmargMap& vmargs, bool dirty = true, bool before = true) const
    {
        bool removed = before;
        doCacheMaintenance(dir.wide("ws"), vmargs, dirty, removed);
        return removed;
    }

    // The names below a directory, sorted.
    std::vector<std::string> names(const char* place) const
    {
        std::vector<std::string> found;
        for (const fs::directory_entry& entry : fs::directory_iterator(dir.path(place)))
            found.push_back(entry.path().filename());
        std::sort(found.begin(), found.end());
        return found;
    }

    // How many starts the shutdown log has recorded.
    int starts() const
    {
        const std::string log = dir.read("ws/logs/shutdown.log");
        return static_cast<int>(std::count(log.begin(), log.end(), '\n'));
    }

    TempDir dir;
};
} // namespace

typedef std::vector<std::string> Names;
static const Names ALL = {"ap", "app_1", "app_dir", "other", "xapp"};
static const Names WITHOUT_APP = {"ap", "app_dir", "other"};

TEST(doCacheMaintenance, RemovesTheFilesOfTheCacheAfterADirtyShutdown)
{
    const Workspace ws;
    EXPECT_TRUE(ws.maintain(ws.vmargs(L"app", L"ws/cache"), true, false));
    EXPECT_EQ(ws.names("ws/cache"), WITHOUT_APP);
    EXPECT_TRUE(ws.dir.has("ws/cache/app_dir/app_file"));
    EXPECT_EQ(ws.starts(), 1);
}

TEST(doCacheMaintenance, RemovesNothingAfterACleanShutdownAndRecordsTheStart)
{
    const Workspace ws;
    EXPECT_FALSE(ws.maintain(ws.vmargs(L"app", L"ws/cache"), false));
    EXPECT_EQ(ws.names("ws/cache"), ALL);
    EXPECT_EQ(ws.starts(), 1);
}

TEST(doCacheMaintenance, RemovesNothingWithoutTheEnablingName)
{
    const Workspace ws;
    VmargMap map = ws.vmargs(L"app", L"ws/cache");
    map.erase(L"vmarg.CacheMaintenance.enable");
    map[L"vmarg.CacheMaintenance.enabled"] = L"true";
    map[L"vmarg.cacheMaintenance.enable"] = L"true";
    EXPECT_FALSE(ws.maintain(map));
    EXPECT_EQ(ws.names("ws/cache"), ALL);
    EXPECT_EQ(ws.starts(), 1);
}

TEST(doCacheMaintenance, OnlyThePresenceOfTheEnablingNameCounts)
{
    for (const wchar_t* value : {L"false", L""}) {
        const Workspace ws;
        VmargMap map = ws.vmargs(L"app", L"ws/cache");
        map[L"vmarg.CacheMaintenance.enable"] = value;
        EXPECT_TRUE(ws.maintain(map));
        EXPECT_EQ(ws.names("ws/cache"), WITHOUT_APP);
    }
}

TEST(doCacheMaintenance, CutsTheNameBeforeItsFirstPerCentSign)
{
    const Workspace ws;
    EXPECT_TRUE(ws.maintain(ws.vmargs(L"app%u_%g", L"ws/cache")));
    EXPECT_EQ(ws.names("ws/cache"), WITHOUT_APP);
}

TEST(doCacheMaintenance, DoesNotCutTheControlDirectory)
{
    const Workspace ws;
    ws.dir.write("ws/c%u/app_2", "");
    EXPECT_TRUE(ws.maintain(ws.vmargs(L"app", L"ws/c%u")));
    EXPECT_FALSE(ws.dir.has("ws/c%u/app_2"));
    EXPECT_EQ(ws.names("ws/cache"), ALL);
}

TEST(doCacheMaintenance, TrimsBothValues)
{
    const Workspace ws;
    EXPECT_TRUE(ws.maintain(
        {{L"vmarg.CacheMaintenance.enable", L""},
         {L"vmarg.Dshare", L"controlDir=  " + ws.dir.wide("ws/cache") + L"  ,name=  app  "}}));
    EXPECT_EQ(ws.names("ws/cache"), WITHOUT_APP);
}

TEST(doCacheMaintenance, LeavesACacheOutsideOfTheWorkspaceAlone)
{
    const Workspace ws;
    EXPECT_FALSE(ws.maintain(ws.vmargs(L"app", L"shared")));
    EXPECT_EQ(ws.names("shared"), (Names{"ap", "app_1", "other", "xapp"}));
    EXPECT_EQ(ws.starts(), 1);
}

TEST(doCacheMaintenance, ComparesTheWorkspaceAsTextAlone)
{
    const Workspace ws;
    // Beside the workspace, and through it: both begin with its text.
    ws.dir.write("ws-shared/app_1", "");
    EXPECT_TRUE(ws.maintain(ws.vmargs(L"app", L"ws-shared")));
    EXPECT_FALSE(ws.dir.has("ws-shared/app_1"));
    EXPECT_TRUE(ws.maintain(ws.vmargs(L"app", L"ws/../shared")));
    EXPECT_EQ(ws.names("shared"), (Names{"ap", "other"}));
    // In the workspace, but its text begins otherwise.
    EXPECT_FALSE(ws.maintain(ws.vmargs(L"app", L"./ws/cache")));
    EXPECT_EQ(ws.names("ws/cache"), ALL);
}

TEST(doCacheMaintenance, RemovesNothingWhenASubOptionIsMissing)
{
    const Workspace ws;
    const std::wstring place = ws.dir.wide("ws/cache");
    for (const std::wstring& options : {L"controlDir=" + place, std::wstring(L"name=app"),
                                        std::wstring(), L"Name=app,controlDir=" + place})
        EXPECT_FALSE(
            ws.maintain({{L"vmarg.CacheMaintenance.enable", L""}, {L"vmarg.Dshare", options}}));
    EXPECT_FALSE(ws.maintain({{L"vmarg.CacheMaintenance.enable", L""}}));
    EXPECT_EQ(ws.names("ws/cache"), ALL);
    EXPECT_EQ(ws.starts(), 5);
}

TEST(doCacheMaintenance, FindsASubOptionWithinALongerWord)
{
    const Workspace ws;
    // "name" is found in "rename", whose value is "other".
    EXPECT_TRUE(ws.maintain({{L"vmarg.CacheMaintenance.enable", L""},
                             {L"vmarg.Dshare", L"rename=other,name=app,mycontrolDirectory=" +
                                                   ws.dir.wide("ws/cache")}}));
    EXPECT_EQ(ws.names("ws/cache"), (Names{"ap", "app_1", "app_dir", "xapp"}));
}

TEST(doCacheMaintenance, TakesTheEqualsSignOfAnotherSubOption)
{
    const Workspace ws;
    // "name" has no "=" of its own: the next one is that of "size", whose value is "other".
    EXPECT_TRUE(
        ws.maintain({{L"vmarg.CacheMaintenance.enable", L""},
                     {L"vmarg.Dshare", L"name,size=other,controlDir=" + ws.dir.wide("ws/cache")}}));
    EXPECT_EQ(ws.names("ws/cache"), (Names{"ap", "app_1", "app_dir", "xapp"}));
}

TEST(doCacheMaintenance, WithoutAnEqualsSignTheValueBeginsAtTheStartOfTheText)
{
    const Workspace ws;
    // No "=" follows "controlDir": the directory is the text up to the first comma. The name has
    // its own.
    const std::wstring place = ws.dir.wide("ws/cache");
    EXPECT_TRUE(ws.maintain({{L"vmarg.CacheMaintenance.enable", L""},
                             {L"vmarg.Dshare", place + L",name=app,controlDir"}}));
    EXPECT_EQ(ws.names("ws/cache"), WITHOUT_APP);
    // No "=" at all: the name is that text too, and a part of no file's name.
    EXPECT_TRUE(ws.maintain(
        {{L"vmarg.CacheMaintenance.enable", L""}, {L"vmarg.Dshare", place + L",name,controlDir"}}));
    EXPECT_EQ(ws.names("ws/cache"), WITHOUT_APP);
}

TEST(doCacheMaintenance, ANameOfAStarMeansEverythingSubDirectoriesIncluded)
{
    const Workspace ws;
    EXPECT_TRUE(ws.maintain(ws.vmargs(L"*", L"ws/cache")));
    EXPECT_EQ(ws.names("ws/cache"), Names());
}

TEST(doCacheMaintenance, AnEmptyNameIsAPartOfEveryName)
{
    for (const wchar_t* name : {L"", L"%u"}) {
        const Workspace ws;
        EXPECT_TRUE(ws.maintain(ws.vmargs(name, L"ws/cache")));
        EXPECT_EQ(ws.names("ws/cache"), (Names{"app_dir"}));
    }
}

TEST(doCacheMaintenance, ConvertsTheControlDirectoryForUse)
{
    const Workspace ws;
    EXPECT_TRUE(ws.maintain(ws.vmargs(L"app", L"ws\\cache")));
    EXPECT_EQ(ws.names("ws/cache"), WITHOUT_APP);
}

TEST(doCacheMaintenance, AFailureLeavesRemovedFalseWithoutAMessage)
{
    const Workspace ws;
    EXPECT_EQ(logOf(true, [&] { EXPECT_FALSE(ws.maintain(ws.vmargs(L"app", L"ws/missing"))); }),
              "");
    // A link that leads nowhere cannot be looked at; everything else goes.
    fs::create_symlink("/nowhere", ws.dir.path("ws/cache/link"));
    EXPECT_FALSE(ws.maintain(ws.vmargs(L"app", L"ws/cache")));
    EXPECT_EQ(ws.names("ws/cache"), (Names{"ap", "app_dir", "link", "other"}));
    EXPECT_EQ(ws.starts(), 2);
}

TEST(doCacheMaintenance, LeavesADirectoryAloneWhoseTextHoldsTheWorkspaceFurtherOn)
{
    const Workspace ws;
    // "<dir>/x<dir>/ws/cache" holds the workspace's whole text, and does not begin with it.
    const std::string foreign = "x" + ws.dir.path("ws/cache");
    ws.dir.write(foreign + "/app_1", "");
    VmargMap map = ws.vmargs(L"app", L"ws/cache");
    const std::wstring place = ws.dir.wide(foreign);
    map[L"vmarg.Dshare"] = L"name=app,controlDir=" + place;
    EXPECT_FALSE(ws.maintain(map));
    EXPECT_TRUE(ws.dir.has(foreign + "/app_1"));
    EXPECT_EQ(ws.starts(), 1);
}

TEST(doCacheMaintenance, TrimsTheNameBeforeItIsCutAtThePerCentSign)
{
    const Workspace ws;
    ws.dir.write("ws/cache/app 1", "");
    EXPECT_TRUE(ws.maintain(ws.vmargs(L" app %u ", L"ws/cache")));
    EXPECT_FALSE(ws.dir.has("ws/cache/app 1"));
    EXPECT_TRUE(ws.dir.has("ws/cache/app_1"));
}

TEST(doCacheMaintenance, DecisionANameThatTheLocaleCannotConvertMatchesNothing)
{
    const Workspace ws;
    ASSERT_NE(setlocale(LC_CTYPE, "C"), nullptr);
    EXPECT_FALSE(ws.maintain(ws.vmargs(L"\u00e9cole", L"ws/cache")));
    EXPECT_EQ(ws.names("ws/cache"), ALL);
    EXPECT_EQ(ws.starts(), 1);
}
