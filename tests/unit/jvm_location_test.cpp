#include "launcher/command/jvm_location.h"

#include "tests/unit/fixtures.h"

#include <cerrno>

TEST(jvmPropExists, LooksForTheFileInTheRoot)
{
    const TempDir dir;
    dir.write("a/jvm.properties", "");
    EXPECT_TRUE(jvmPropExists(dir.wide("a/")));
    EXPECT_TRUE(jvmPropExists(dir.wdir + L"\\a\\"));
    EXPECT_FALSE(jvmPropExists(dir.wide("b/")));
    EXPECT_FALSE(jvmPropExists(dir.wide("a")));
}

// The root relative to `dir`, or "(none)", and the flag.
static std::wstring standardRoot(const TempDir& dir, const std::wstring& vm)
{
    std::wstring root = dir.wdir + L"(none)";
    bool notPluginJvm = false;
    const bool found = getStandardJvmPropertyRoot(vm, root, notPluginJvm);
    EXPECT_EQ(found, !notPluginJvm);
    return root.substr(dir.wdir.size());
}

TEST(getStandardJvmPropertyRoot, IsThePluginsOwnDirectory)
{
    const TempDir dir;
    dir.write("eclipse/plugins/jre.x/jvm.properties", "");
    EXPECT_EQ(standardRoot(dir, dir.wide("eclipse/plugins/jre.x/jre/bin/java")),
              L"/eclipse/plugins/jre.x/");
    EXPECT_EQ(standardRoot(dir, dir.wide("eclipse/plugins/jre.x/")), L"/eclipse/plugins/jre.x/");
}

TEST(getStandardJvmPropertyRoot, FailsElsewhere)
{
    const TempDir dir;
    dir.write("eclipse/plugins/jre.x/jvm.properties", "");
    dir.write("eclipse/plugins/jvm.properties", "");
    EXPECT_EQ(standardRoot(dir, dir.wide("eclipse/plugins/java")), L"(none)");
    EXPECT_EQ(standardRoot(dir, dir.wide("eclipse/plugins/jre.y/java")), L"(none)");
    EXPECT_EQ(standardRoot(dir, dir.wide("Eclipse/plugins/jre.x/java")), L"(none)");
    EXPECT_EQ(standardRoot(dir, L"java"), L"(none)");
    EXPECT_EQ(standardRoot(dir, L""), L"(none)");
}

TEST(getStandardJvmPropertyRoot, TakesTheFirstPluginsDirectory)
{
    const TempDir dir;
    dir.write("eclipse/plugins/a/eclipse/plugins/b/jvm.properties", "");
    EXPECT_EQ(standardRoot(dir, dir.wide("eclipse/plugins/a/eclipse/plugins/b/java")), L"(none)");
}

TEST(getStandardJvmPropertyRoot, TakesAnEmptyNameForThePlugins)
{
    const TempDir dir;
    dir.write("eclipse/plugins/jvm.properties", "");
    EXPECT_EQ(standardRoot(dir, dir.wide("eclipse/plugins//x/java")), L"/eclipse/plugins//");
}

static std::wstring installRoot(const TempDir& dir, const std::wstring& vm)
{
    std::wstring root = dir.wdir + L"(none)";
    getInstallJvmPropertyRoot(vm, root);
    return root.substr(dir.wdir.size());
}

TEST(getInstallJvmPropertyRoot, LooksTwoThreeAndFourLevelsUp)
{
    for (const char* place : {"1/2/3/", "1/2/", "1/"}) {
        const TempDir dir;
        dir.write(std::string(place) + "jvm.properties", "");
        EXPECT_EQ(installRoot(dir, dir.wide("1/2/3/bin/java")),
                  L"/" + std::wstring(place, place + std::string(place).size()));
    }
}

TEST(getInstallJvmPropertyRoot, LooksNoNearerAndNoFarther)
{
    const TempDir dir;
    dir.write("1/2/3/bin/jvm.properties", "");
    dir.write("jvm.properties", "");
    EXPECT_EQ(installRoot(dir, dir.wide("1/2/3/bin/java")), L"(none)");
    EXPECT_EQ(installRoot(dir, dir.wide("2/3/bin/java")), L"/");
}

TEST(getInstallJvmPropertyRoot, TakesTheNearestOfSeveral)
{
    const TempDir dir;
    dir.write("1/2/3/jvm.properties", "");
    dir.write("1/2/jvm.properties", "");
    EXPECT_EQ(installRoot(dir, dir.wide("1/2/3/bin/java")), L"/1/2/3/");
}

TEST(getInstallJvmPropertyRoot, FailsForTooFewSlashes)
{
    std::wstring root = L"kept";
    for (const wchar_t* vm : {L"", L"java", L"/java", L"bin/java", L"a/bin/java"}) {
        EXPECT_FALSE(getInstallJvmPropertyRoot(vm, root)) << vm;
        EXPECT_EQ(root, L"kept");
    }
}

static std::wstring jvmHome(const wchar_t* vm)
{
    std::wstring home = L"before";
    getJvmHome(vm, home, L"/fallback");
    return home;
}

TEST(getJvmHome, CutsOneCharacterMoreThanJvmBin)
{
    EXPECT_EQ(jvmHome(L"/opt/x/jvm/bin/java"), L"/opt/x");
    EXPECT_EQ(jvmHome(L"/opt/myjvm/bin/java"), L"/opt/m");
    EXPECT_EQ(jvmHome(L"/jvm/bin"), L"");
    EXPECT_EQ(jvmHome(L"/a/jvm/bin/jvm/bin/java"), L"/a");
}

TEST(getJvmHome, IsTheFallbackElsewhere)
{
    EXPECT_EQ(jvmHome(L"/opt/x/bin/java"), L"/fallback");
    EXPECT_EQ(jvmHome(L"/opt/jvm/BIN/java"), L"/fallback");
    EXPECT_EQ(jvmHome(L""), L"/fallback");
}

TEST(getJvmHome, APathThatBeginsWithJvmBinLeavesNothingToCut)
{
    EXPECT_EQ(jvmHome(L"jvm/bin/java"), L"");
}

namespace {
// What getJvmPropertyLocation answers, with its log.
struct Answer {
    Answer(const Line& line, Props& props, const std::wstring& rcpHome)
    {
        log = logOf(false, [&] {
            EXPECT_TRUE(getJvmPropertyLocation(props.list, line.argc, line.argv, rcpHome, path,
                                               notPluginJvm, vm));
        });
        root = findProperty(L"jvm.root", props.list);
    }

    std::wstring path;
    std::wstring vm = L"before";
    std::wstring root;
    bool notPluginJvm = false;
    std::string log;
};
} // namespace

TEST(getJvmPropertyLocation, TakesTheDefaultForAnExternalJvm)
{
    Props props({L"other", L"/vm"});
    const Answer answer(Line({L"velmora"}), props, L"/opt\\app");
    EXPECT_EQ(answer.path, L"/opt/app/rcp/deploy/jvm.properties");
    EXPECT_EQ(answer.root, L"/opt/app/rcp/deploy/");
    EXPECT_EQ(answer.vm, L"");
    EXPECT_TRUE(answer.notPluginJvm);
    EXPECT_EQ(answer.log, "QVMRL0119I: VM specified is \"external JVM\"\n");
}

TEST(getJvmPropertyLocation, TakesAnEmptyPropertyForNone)
{
    Props props({L"vm", L""});
    const Answer answer(Line({L"velmora"}), props, L"/opt/app");
    EXPECT_EQ(answer.log, "QVMRL0119I: VM specified is \"external JVM\"\n");
    EXPECT_EQ(answer.vm, L"");
}

TEST(getJvmPropertyLocation, GivesAPathWhetherOrNotAFileStandsThere)
{
    Props props({L"vm", L"java"});
    const Answer answer(Line({L"velmora"}), props, L"/nowhere");
    EXPECT_EQ(answer.path, L"/nowhere/rcp/deploy/jvm.properties");
    EXPECT_TRUE(answer.notPluginJvm);
    EXPECT_EQ(answer.log, "QVMRL0021I: VM specified is \"java\"\n");
}

TEST(getJvmPropertyLocation, FindsTheJvmOfAPlugin)
{
    const TempDir home;
    home.write("eclipse/plugins/jre.x/jvm.properties", "");
    Props props({L"vm", L"${rcp.home}\\eclipse\\plugins\\jre.x\\jre\\bin\\java${rcp.home}"});
    const Answer answer(Line({L"velmora"}), props, home.wdir);
    EXPECT_EQ(answer.path, home.wide("eclipse/plugins/jre.x/jvm.properties"));
    EXPECT_EQ(answer.root, home.wide("eclipse/plugins/jre.x/"));
    EXPECT_FALSE(answer.notPluginJvm);
    EXPECT_EQ(answer.vm, home.wide("eclipse/plugins/jre.x/jre/bin/java${rcp.home}"));
    EXPECT_EQ(answer.log, "QVMRL0021I: VM specified is \"" +
                              home.path("eclipse/plugins/jre.x/jre/bin/java${rcp.home}") + "\"\n");
}

TEST(getJvmPropertyLocation, FindsAJvmInADirectoryOfItsOwn)
{
    const TempDir opt;
    opt.write("myjvm/jvm/jvm.properties", "");
    const std::wstring vm = opt.wide("myjvm/jvm/bin/java");
    Props props({L"vm", L"/unused"});
    const Answer answer(Line({L"velmora", L"-vm", vm.c_str(), L"-vm", L"/other"}), props, L"/h");
    EXPECT_EQ(answer.path, opt.wide("myjvm/jvm/jvm.properties"));
    EXPECT_EQ(answer.root, opt.wide("myjvm/jvm/"));
    EXPECT_TRUE(answer.notPluginJvm);
    EXPECT_EQ(answer.vm, vm);
}

TEST(getJvmPropertyLocation, AppendsTheRootBehindAnEarlierOne)
{
    Props props({L"jvm.root", L"/earlier/"});
    const Answer answer(Line({L"velmora"}), props, L"/h");
    EXPECT_EQ(texts(props.list),
              (Texts{L"jvm.root", L"/earlier/", L"jvm.root", L"/h/rcp/deploy/"}));
    EXPECT_EQ(answer.path, L"/h/rcp/deploy/jvm.properties");
}

TEST(getJvmPropertyLocation, EndsForAVmOptionWithoutAPath)
{
    for (const Texts& given : {Texts{L"velmora", L"-vm"}, Texts{L"velmora", L"-vm", L""}})
        EXPECT_TRUE(endsWith(
            [&] {
                const Line line(given);
                Props props({L"vm", L"/vm"});
                std::wstring path;
                std::wstring vm;
                bool flag = false;
                errno = EACCES;
                getJvmPropertyLocation(props.list, line.argc, line.argv, L"/h", path, flag, vm);
            },
            "QVMRL0079E: -vm on command line must be followed by a valid jvm path.", EACCES));
}
