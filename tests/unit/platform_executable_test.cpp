#include "launcher/command/platform_executable.h"

#include "launcher/command/launch_command.h"
#include "platform/linux/lock_file.h"
#include "tests/unit/fixtures.h"

#include <cerrno>
#include <sys/stat.h>

TEST(getEclipseExeName, IsThePropertyOrEclipse)
{
    std::wstring name = L"before";
    getEclipseExeName(name, Props({L"eclipse.name", L"rich"}).list);
    EXPECT_EQ(name, L"rich");
    getEclipseExeName(name, Props({}).list);
    EXPECT_EQ(name, L"eclipse");
    getEclipseExeName(name, Props({L"eclipse.name", L""}).list);
    EXPECT_EQ(name, L"");
}

static void writeExecutable(const TempDir& dir, const std::string& name, mode_t mode)
{
    dir.write(name, "");
    chmod(dir.path(name).c_str(), mode);
}

TEST(addBaseEclipseToCommandLine, BeginsTheCommandWithTheNativeExecutable)
{
    const TempDir base;
    writeExecutable(base, "linux/x86/eclipse", 0755);
    const Props props({L"rcp.base.location", base.wdir.c_str(), L"eclipse.name", L"unused"});
    EXPECT_EQ(commandOf([&] {
                  addArgToCommandLine(L"dropped", true);
                  addBaseEclipseToCommandLine(props.list, PropertyList());
              }),
              (Texts{base.wide("linux/x86/eclipse")}));
}

TEST(addBaseEclipseToCommandLine, TakesTheNameFromTheLaunchersProperties)
{
    const TempDir base;
    writeExecutable(base, "linux/x86/rich", 0100);
    const std::wstring backslashes = base.wdir + L"\\linux\\..";
    const Props props({L"rcp.base.location", backslashes.c_str()});
    const Props launcherProps({L"eclipse.name", L"rich"});
    EXPECT_EQ(commandOf([&] { addBaseEclipseToCommandLine(props.list, launcherProps.list); }),
              (Texts{base.wdir + L"/linux/../linux/x86/rich"}));
}

TEST(addBaseEclipseToCommandLine, EndsWithoutABaseLocation)
{
    EXPECT_TRUE(endsWith(
        [] {
            const Props launcherProps({L"rcp.base.location", L"/base"});
            errno = EACCES;
            addBaseEclipseToCommandLine(PropertyList(), launcherProps.list);
        },
        "QVMRL0011E: Unable to determine RCP Base Plugin location. If the problem persists, "
        "reinstall.",
        EACCES));
}

TEST(addBaseEclipseToCommandLine, EndsWhenTheExecutableIsMissing)
{
    const TempDir base;
    const Props props({L"rcp.base.location", base.wdir.c_str()});
    EXPECT_TRUE(endsWith([&] { addBaseEclipseToCommandLine(props.list, PropertyList()); },
                         "QVMRL0007E: " + base.path("linux/x86/eclipse") +
                             " is not executable or does not exist.",
                         ENOENT));
}

TEST(addBaseEclipseToCommandLine, EndsWhenTheOwnerMayNotExecuteIt)
{
    const TempDir base;
    writeExecutable(base, "linux/x86/eclipse", 0677);
    const Props props({L"rcp.base.location", base.wdir.c_str()});
    EXPECT_TRUE(fatalLineHolds([&] { addBaseEclipseToCommandLine(props.list, PropertyList()); },
                               "QVMRL0007E: " + base.path("linux/x86/eclipse") +
                                   " is not executable or does not exist. : "));
}

static Texts startupWordsOf(const Line& line, const Props& props)
{
    return commandOf([&] { addStartupToCommandLine(props.list, line.argc, line.argv); });
}

TEST(addStartupToCommandLine, NamesTheBaseLocationsArchive)
{
    EXPECT_EQ(startupWordsOf(Line({L"velmora"}), Props({L"rcp.base.location", L"/base"})),
              (Texts{L"-startup", L"/base/launcher.jar"}));
    EXPECT_EQ(startupWordsOf(Line({L"velmora"}), Props({L"rcp.base.location", L"/b\\c"})),
              (Texts{L"-startup", L"/b\\c/launcher.jar"}));
}

TEST(addStartupToCommandLine, TakesTheWordBehindPerfJar)
{
    const Props props({L"rcp.base.location", L"/base"});
    EXPECT_EQ(startupWordsOf(Line({L"velmora", L"-perfJar", L"/tmp/p.jar"}), props),
              (Texts{L"-startup", L"/tmp/p.jar"}));
    EXPECT_EQ(startupWordsOf(Line({L"velmora", L"-perfJar", L"a", L"-perfJar", L"b"}), props),
              (Texts{L"-startup", L"a"}));
}

TEST(addStartupToCommandLine, PerfJarAsTheLastWordCountsAsAbsent)
{
    EXPECT_EQ(
        startupWordsOf(Line({L"velmora", L"-perfJar"}), Props({L"rcp.base.location", L"/base"})),
        (Texts{L"-startup", L"/base/launcher.jar"}));
}

TEST(addUseDaemonToCommandLine, EmitsNothingInTheMainProcess)
{
    setMainProcess(true);
    EXPECT_EQ(commandOf(addUseDaemonToCommandLine), Texts());
    EXPECT_FALSE(bDaemon);
    setMainProcess(false);
}

TEST(addUseDaemonToCommandLine, NamesThePlatformsProcessInADaemonProcess)
{
    const TempDir ws;
    // No process has this number, so the start becomes the main process; the role is set after.
    ws.write(".rcp.lock", "2147483647          ");
    const Ended ended = runAside(ws, false, [&] {
        Line line({L"velmora"});
        locateLockFile(line.argc, line.argv, ws.wdir, L"eclipse");
        setMainProcess(false);
        const Texts command = commandOf(addUseDaemonToCommandLine);
        const bool expected = command == Texts{L"-useDaemon", L"2147483647"};
        return std::string(expected ? "as expected" : "other words") +
               (bDaemon ? ", daemon" : ", no daemon");
    });
    EXPECT_EQ(ended.result, "as expected, daemon");
}
