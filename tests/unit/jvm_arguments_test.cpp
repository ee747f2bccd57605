#include "launcher/command/jvm_arguments.h"

#include "launcher/user_area/installation.h"
#include "tests/unit/fixtures.h"

static Texts vmargsOf(int configuration, const Line& line, const Props& props,
                      const VmargMap& vmargs, bool vmIsLibrary = false)
{
    eConfig = configuration;
    return commandOf([&] {
        addVmargsToCommandLine(L"/ws", props.list, line.argc, line.argv, vmIsLibrary, vmargs);
    });
}

TEST(addVmargsToCommandLine, BeginsWithItsWordInTheNativeKindOnly)
{
    const Line line({L"velmora"});
    const Props none({});
    for (int configuration : {CONFIG_LOCKDOWN, CONFIG_USER, CONFIG_SERIAL_MULTIUSER, CONFIG_OTHER,
                              CONFIG_MULTIUSER, CONFIG_USERPB})
        EXPECT_EQ(vmargsOf(configuration, line, none, {}), (Texts{L"-vmargs"})) << configuration;
    EXPECT_EQ(vmargsOf(CONFIG_SERVICE, line, none, {}), Texts());
    EXPECT_EQ(vmargsOf(CONFIG_MU_SERVICE, line, none, {}), Texts());
}

TEST(addVmargsToCommandLine, EmitsTheLaunchersOwnThenTheFixThenTheMapInKeyOrder)
{
    const Line line({L"velmora", L"-x", L"-vmargs", L"-Xfoo", L"-Dbar=1"});
    const Props props({L"vmfix.noconsole", L"-Dfix"});
    const VmargMap map = {{L"vmarg.b", L"-Xb"}, {L"vmarg.a", L"-Xa"}, {L"vmarg.B", L"-XB"}};
    EXPECT_EQ(vmargsOf(CONFIG_USER, line, props, map),
              (Texts{L"-vmargs", L"-Xfoo", L"-Dbar=1", L"-Dfix", L"-XB", L"-Xa", L"-Xb"}));
}

TEST(addVmargsToCommandLine, PassesEveryWordBehindTheFirstVmargsUnchanged)
{
    const Line line({L"velmora", L"-vmargs", L"", L"-data", L"-vmargs", L"${workspace.location}"});
    EXPECT_EQ(vmargsOf(CONFIG_SERVICE, line, Props({}), {}),
              (Texts{L"", L"-data", L"-vmargs", L"${workspace.location}"}));
}

TEST(addVmargsToCommandLine, SkipsEmptyValuesOfTheMap)
{
    const VmargMap map = {{L"vmarg.a", L""}, {L"vmarg.b", L"-Xb"}, {L"vmarg.c", L""}};
    EXPECT_EQ(vmargsOf(CONFIG_USER, Line({L"velmora"}), Props({}), map),
              (Texts{L"-vmargs", L"-Xb"}));
}

TEST(addVmargsToCommandLine, LeavesTheNoConsoleFixOutForAConsole)
{
    const Props props({L"vmfix.noconsole", L"-Dfix"});
    EXPECT_EQ(vmargsOf(CONFIG_USER, Line({L"velmora", L"-console"}), props, {}),
              (Texts{L"-vmargs"}));
    EXPECT_EQ(vmargsOf(CONFIG_USER, Line({L"velmora", L"-console", L"-restart"}), props, {}),
              (Texts{L"-vmargs", L"-Dfix"}));
    EXPECT_EQ(vmargsOf(CONFIG_USER, Line({L"velmora", L"-restart"}), props, {}),
              (Texts{L"-vmargs", L"-Dfix"}));
    EXPECT_EQ(vmargsOf(CONFIG_USER, Line({L"velmora", L"-consoleLog"}), props, {}),
              (Texts{L"-vmargs", L"-Dfix"}));
}

TEST(addVmargsToCommandLine, LeavesTheNoConsoleFixOutForALibrary)
{
    const Props props({L"vmfix.noconsole", L"-Dfix"});
    EXPECT_EQ(vmargsOf(CONFIG_USER, Line({L"velmora"}), props, {}, true), (Texts{L"-vmargs"}));
    EXPECT_EQ(vmargsOf(CONFIG_USER, Line({L"velmora", L"-console", L"-restart"}), props, {}, true),
              (Texts{L"-vmargs"}));
}

TEST(addVmargsToCommandLine, TakesTheFirstPropertyThatBeginsLikeTheFix)
{
    const Props props(
        {L"vmfix.noconsol", L"-D0", L"vmfix.noconsole.linux", L"-D1", L"vmfix.noconsole", L"-D2"});
    EXPECT_EQ(vmargsOf(CONFIG_USER, Line({L"velmora"}), props, {}), (Texts{L"-vmargs", L"-D1"}));
}

TEST(addVmargsToCommandLine, ReplacesTheFirstWorkspaceOfTheFixAndTurnsItsSeparators)
{
    const Props props({L"vmfix.noconsole", L"-Dlog=${workspace.location}\\a${workspace.location}"});
    EXPECT_EQ(vmargsOf(CONFIG_USER, Line({L"velmora"}), props, {}),
              (Texts{L"-vmargs", L"-Dlog=/ws/a${workspace.location}"}));
}

TEST(addVmargsToCommandLine, TurnsTheSeparatorsOfTheWorkspaceInTheFix)
{
    const Line line({L"velmora"});
    const Props props({L"vmfix.noconsole", L"-Dl=${workspace.location}"});
    eConfig = CONFIG_USER;
    EXPECT_EQ(commandOf([&] {
                  addVmargsToCommandLine(L"/w\\x", props.list, line.argc, line.argv, false, {});
              }),
              (Texts{L"-vmargs", L"-Dl=/w/x"}));
}

TEST(addVmargsToCommandLine, EmitsAnEmptyFixAsAnEmptyWord)
{
    EXPECT_EQ(vmargsOf(CONFIG_USER, Line({L"velmora"}), Props({L"vmfix.noconsole", L""}), {}),
              (Texts{L"-vmargs", L""}));
}

static Texts xargsOf(const Props& props)
{
    return commandOf([&] { addXargsToCommandLine(props.list); });
}

TEST(addXargsToCommandLine, JoinsKeyAndValueInListOrder)
{
    EXPECT_EQ(xargsOf(Props({L"-Xss", L"", L"x-Xno", L"1", L"-Xmx", L"1g", L"-Xshare", L":auto",
                             L"-x", L"2", L"-Xmx", L"2g"})),
              (Texts{L"-Xss", L"-Xmx1g", L"-Xshare:auto", L"-Xmx2g"}));
}

TEST(addXargsToCommandLine, EmitsTheBootClassPathBehindTheOptions)
{
    EXPECT_EQ(xargsOf(Props({L"Xbootclasspath.append", L"/a.jar", L"Xbootclasspath.prepend",
                             L"/p.jar", L"-Xa", L""})),
              (Texts{L"-Xa", L"-Xbootclasspath/p:/p.jar", L"-Xbootclasspath/a:/a.jar"}));
}

TEST(addXargsToCommandLine, TakesAnEmptyBootClassPathForSet)
{
    EXPECT_EQ(xargsOf(Props({L"Xbootclasspath.append", L"", L"Xbootclasspath.prepend", L""})),
              (Texts{L"-Xbootclasspath/p:", L"-Xbootclasspath/a:"}));
    EXPECT_EQ(xargsOf(Props({L"Xbootclasspath.prepend", L"/p"})), (Texts{L"-Xbootclasspath/p:/p"}));
    EXPECT_EQ(xargsOf(Props({})), Texts());
}

static Texts classpathOf(int configuration, const Props& props)
{
    eConfig = configuration;
    return commandOf([&] { addClasspathToCommandLine(props.list); });
}

TEST(addClasspathToCommandLine, EmitsThePropertyWhenItIsSet)
{
    const Props props({L"rcp.base.location", L"/base", L"cp", L"/a.jar:/b.jar"});
    for (int configuration : {CONFIG_SERVICE, CONFIG_LOCKDOWN, CONFIG_USER, CONFIG_SERIAL_MULTIUSER,
                              CONFIG_OTHER, CONFIG_MULTIUSER, CONFIG_USERPB})
        EXPECT_EQ(classpathOf(configuration, props), (Texts{L"-cp", L"/a.jar:/b.jar"}))
            << configuration;
    EXPECT_EQ(classpathOf(CONFIG_USER, Props({L"cp", L""})), (Texts{L"-cp", L""}));
    EXPECT_EQ(classpathOf(CONFIG_SERVICE, Props({L"rcp.base.location", L"/base"})), Texts());
}

TEST(addClasspathToCommandLine, NamesTheStartUpArchiveInTheForcedConfiguration)
{
    EXPECT_EQ(classpathOf(CONFIG_MU_SERVICE, Props({L"rcp.base.location", L"/base", L"cp", L"/a"})),
              (Texts{L"-cp", L"/base/startup.jar"}));
    EXPECT_EQ(classpathOf(CONFIG_MU_SERVICE, Props({L"rcp.base.location", L"/b\\c"})),
              (Texts{L"-cp", L"/b\\c/startup.jar"}));
}

TEST(addMainClassToCommandLine, NamesThePlatformsMainClass)
{
    EXPECT_EQ(commandOf(addMainClassToCommandLine), (Texts{L"org.eclipse.core.launcher.Main"}));
}
