#include "launcher/startup.h"

#include "launcher/command/launch_command.h"
#include "tests/unit/fixtures.h"

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sys/stat.h>
#include <unistd.h>

namespace fs = std::filesystem;

// Where what a start left in /tmp goes, which is gone with the process.
static std::string earlyLogs;

static void keepEarlyLogs()
{
    for (const fs::directory_entry& entry : fs::directory_iterator("/tmp")) {
        if (entry.path().extension() == ".log")
            fs::copy_file(entry.path(), earlyLogs + "/" + entry.path().filename().string(),
                          fs::copy_options::overwrite_existing);
    }
}

// The sequence, as a copy of this executable that stands in "<world>/rcp". The words are the lines
// of "<world>/words"; the result is the command, a word a line.
static const InstalledJob SEQUENCE("Sequence", [](const std::string& world) {
    std::vector<std::wstring> words = {L"velmora"};
    std::ifstream given(world + "/words");
    for (std::string line; std::getline(given, line);)
        words.emplace_back(line.begin(), line.end());
    earlyLogs = world + "/early";
    atexit(keepEarlyLogs);
    setenv("HOME", (world + "/home").c_str(), 1);
    setenv("USER", "anna", 1);
    unsetenv("LD_LIBRARY_PATH");
    const Line line(words);
    startup(line.argc, line.argv, launchArgs);
    std::string result;
    for (const std::wstring& word : launchArgs)
        result += std::string(word.begin(), word.end()) + "\n";
    return result;
});

namespace {
// A whole installation; the workspace is "<world>/ws".
struct World {
    World()
    {
        setProperties("");
        dir.makeDir("early");
        dir.write("base/config.ini", "ini\n");
        dir.write("base/rcpinstall.properties", "a=b\n");
        dir.write("base/platform.xml", "<p ${jvm.feature.id}/>\n");
        dir.write("base/linux/x86/eclipse", "");
        chmod(dir.path("base/linux/x86/eclipse").c_str(), 0755);
    }

    void setProperties(const std::string& more) const
    {
        dir.write("rcp/velmora.properties", "install.configuration=user\nrcp.install.id=1234\n"
                                            "rcp.base.location=${rcp.home}/base\nrcp.data=" +
                                                dir.path("ws") + "\n" + more);
    }

    Ended start(const std::string& words = "") const
    {
        fs::remove(dir.path("rcp/velmora"));
        fs::remove(dir.path("aside/result"));
        dir.write("words", words);
        return runInstalled(dir, "rcp/velmora", "Sequence");
    }

    std::string log() const
    {
        return dir.read("ws/logs/velmora.log");
    }

    TempDir dir;
};
} // namespace

static bool hasLine(const std::string& text, const std::string& line)
{
    return ("\n" + text).find("\n" + line + "\n") != std::string::npos;
}

// How a start ended whose log was never opened: its status and the last line of its log in /tmp.
static std::string earlyEnd(const World& world, const std::string& words = "")
{
    const Ended ended = world.start(words);
    EXPECT_EQ(ended.status, 255);
    std::string log = world.dir.read("early/velmora.log");
    EXPECT_FALSE(log.empty());
    log.erase(log.find_last_not_of('\n') + 1);
    return log.substr(log.rfind('\n') + 1);
}

// How a start ended whose log was open: the last line of that.
static std::string lateEnd(const World& world, const std::string& words = "")
{
    EXPECT_EQ(world.start(words).status, 255);
    std::string log = world.log();
    log.erase(log.find_last_not_of('\n') + 1);
    return log.substr(log.rfind('\n') + 1);
}

TEST(startup, MakesTheUsersAreaOnAFirstStart)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const World world;
    const Ended ended = world.start();
    EXPECT_EQ(ended.status, 0);
    for (const char* place : {"logs", ".config", "applications/eclipse/features",
                              "applications/eclipse/plugins", ".config/org.eclipse.update"})
        EXPECT_TRUE(fs::is_directory(world.dir.path(std::string("ws/") + place))) << place;
    EXPECT_EQ(world.dir.read("ws/.config/config.ini"), "ini\n");
    EXPECT_EQ(world.dir.read("ws/.config/rcpinstall.properties"),
              "a=b\nrcp.install.id=1234\nrcp.base.location=${rcp.home}/base\n"
              "install.configuration=user\n");
    EXPECT_EQ(world.dir.read("ws/.config/org.eclipse.update/platform.xml"), "<feature>\n");
    EXPECT_EQ(world.dir.read("ws/.config/args.properties"),
              "arg0=" + world.dir.path("rcp/velmora") +
                  "\nargc=1\ncom.vantor.rcp.core.internal.librarypath=\n");
    EXPECT_FALSE(world.dir.has("ws/applications/eclipse/.eclipseextension"));
    EXPECT_TRUE(hasLine(ended.result, world.dir.path("base/linux/x86/eclipse")));
}

TEST(startup, CopiesTheSharedExtensionLink)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const World world;
    world.dir.write("shared/eclipse/.eclipseextension", "id=x\n");
    world.start();
    EXPECT_EQ(world.dir.read("ws/applications/eclipse/.eclipseextension"), "id=x\n");
}

TEST(startup, CountsAJvmPropertiesFileAsFoundOnlyWhenItIsThere)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const std::string absent = "QVMRL0125I: No jvm.properties file was loaded. A default file "
                               "should be at \"${rcp.home}/rcp/deploy\"";
    const World world;
    EXPECT_EQ(world.start().status, 0);
    EXPECT_TRUE(hasLine(world.log(), absent));
    EXPECT_EQ(world.log().find("QVMRL0077I"), std::string::npos);
    world.dir.write("rcp/deploy/jvm.properties", "vmarg.x=-Xfound\n");
    const Ended found = world.start();
    EXPECT_FALSE(hasLine(world.log(), absent));
    EXPECT_TRUE(hasLine(world.log(), "QVMRL0077I: loading jvm.properties at \"" +
                                         world.dir.path("rcp/deploy/jvm.properties") + "\""));
    EXPECT_TRUE(hasLine(found.result, "-Xfound"));
}

// A property of jvm.properties that shows what has become of java.home and the library path.
static const char* const SHOW =
    "-Dhome=${prop.java.home}\njvm.library.path=lib\n-Dpath=${prop.jvm.library.path}\n";

TEST(startup, MakesJavaHomeUpFromTheVmPath)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const World world;
    world.dir.write("x/jvm/jvm.properties", SHOW);
    const std::string result =
        world.start("-vm\n" + world.dir.path("x/jvm/bin/java") + "\n").result;
    EXPECT_TRUE(hasLine(result, "-Dhome=" + world.dir.path("x"))) << result;
    EXPECT_TRUE(hasLine(result, "-Dpath=" + world.dir.path("x") + "/lib")) << result;
}

TEST(startup, TakesTheInstallationForJavaHomeElse)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const World world;
    world.dir.write("rcp/deploy/jvm.properties", SHOW);
    EXPECT_TRUE(hasLine(world.start().result, "-Dhome=" + world.dir.dir));
}

TEST(startup, KeepsAJavaHomeThatIsThere)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const World world;
    world.dir.write("rcp/deploy/jvm.properties", std::string(SHOW) + "java.home=/given\n");
    const std::string result = world.start().result;
    EXPECT_TRUE(hasLine(result, "-Dhome=/given"));
    EXPECT_TRUE(hasLine(result, "-Dpath=/given/lib"));
}

TEST(startup, TakesThePluginForJavaHomeAndFillsThePlatformXmlIn)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const World world;
    world.setProperties("jvm.feature.id=ID\njvm.feature.version=1\n");
    world.dir.write("eclipse/plugins/jre.x/jvm.properties", SHOW);
    const std::string result =
        world.start("-vm\n${rcp.home}/eclipse/plugins/jre.x/jre/bin/java\n").result;
    EXPECT_TRUE(hasLine(result, "-Dhome=" + world.dir.path("eclipse/plugins/jre.x"))) << result;
    EXPECT_EQ(world.dir.read("ws/.config/org.eclipse.update/platform.xml"), "<p ID/>\n");
}

TEST(startup, ARestartWritesNoRecordAndNeedsNone)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const World world;
    const Ended ended = world.start("-restart\n");
    EXPECT_EQ(ended.status, 0);
    EXPECT_FALSE(world.dir.has("ws/.config/args.properties"));
    EXPECT_TRUE(world.dir.has("ws/.config/config.ini"));
    EXPECT_TRUE(hasLine(ended.result, world.dir.path("base/linux/x86/eclipse")));
}

TEST(startup, TakesTheRestartExecutableOfTheRawWords)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const World world;
    world.setProperties("config.a.1=-x\nconfig.a.restartExe.linux=${rcp.home}/again\n");
    const Ended ended = world.start("-config\na\n");
    EXPECT_TRUE(hasLine(ended.result, "-x"));
    EXPECT_EQ(world.dir.read("ws/.config/args.properties"),
              "arg0=" + world.dir.path("again") +
                  "\narg1=-config\narg2=a\nargc=3\ncom.vantor.rcp.core.internal.librarypath=\n");
}

TEST(startup, RefusesRawWordsOnceTheWorkspaceIsThere)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const char* const count = "QVMRL0069E: velmora invoked with an invalid URL handler action - "
                              "bad argument count. : ";
    const char* const quote =
        "QVMRL0089E: velmora invoked with double quote in arg - bad argument. : ";
    const char* const name =
        "QVMRL0192E: velmora invoked with arg containing \"java.home\" - not allowed. : ";
    const struct {
        const char* words;
        const char* line;
    } rows[] = {
        {"-maxargcnt\n9\na\"java.home\n", count}, {"a\"java.home\n", quote}, {"java.home\n", name}};
    for (const auto& row : rows) {
        const World world;
        EXPECT_EQ(earlyEnd(world, row.words).substr(0, std::string(row.line).size()), row.line);
        EXPECT_TRUE(world.dir.has("ws"));
        EXPECT_FALSE(world.dir.has("ws/.rcp.lock"));
    }
}

TEST(startup, DoesNotRefuseTheWordsOfAnExtension)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const World world;
    world.setProperties("config.a.1=-Djava.home=x\"\n");
    EXPECT_TRUE(hasLine(world.start("-config\na\n-maxargcnt\n5\n").result, "-Djava.home=x\""));
}

TEST(startup, EndsWithoutAPropertiesFile)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const World world;
    const std::string path = world.dir.path("rcp/velmora.properties");
    fs::remove(path);
    EXPECT_EQ(earlyEnd(world), "QVMRL0096E: Unable to load " + path +
                                   " file! : "
                                   "No such file or directory");
}

TEST(startup, EndsWithoutABaseLocation)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const World world;
    world.dir.write("rcp/velmora.properties", "rcp.install.id=1\n");
    const std::string line = "QVMRL0050E: rcp.base.location property is missing from " +
                             world.dir.path("rcp/velmora.properties") + " : ";
    EXPECT_EQ(earlyEnd(world).substr(0, line.size()), line);
}

TEST(startup, EndsWhenTheWorkspaceOrTheLogDirectoryCannotBeMade)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const World workspace;
    workspace.dir.write("ws", "");
    EXPECT_EQ(earlyEnd(workspace), "QVMRL0083E: Unable to create " + workspace.dir.path("ws") +
                                       " directory. : File exists");
    const World logs;
    logs.dir.write("ws/logs", "");
    EXPECT_EQ(earlyEnd(logs), "QVMRL0084E: Unable to create " + logs.dir.path("ws/logs") +
                                  " directory. : File exists");
}

TEST(startup, EndsWhenALaterDirectoryCannotBeMade)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const struct {
        const char* place;
        const char* identifier;
    } rows[] = {{"ws/.config", "QVMRL0093E"},
                {"ws/applications/eclipse/features", "QVMRL0094E"},
                {"ws/applications/eclipse/plugins", "QVMRL0095E"}};
    for (const auto& row : rows) {
        const World world;
        world.dir.write(row.place, "");
        EXPECT_EQ(lateEnd(world), std::string(row.identifier) + ": Unable to create " +
                                      world.dir.path(row.place) + " directory. : File exists");
    }
}

TEST(startup, EndsWithoutAFurtherMessageWhenTheLogCannotBeOpened)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const World world;
    world.dir.makeDir("ws/logs/velmora.log");
    EXPECT_EQ(earlyEnd(world), "QVMRL0019E: Could not open " +
                                   world.dir.path("ws/logs/velmora.log") +
                                   " for writing! : Is a directory");
}

TEST(startup, ReusesTheWorkspaceOfAnotherInstallationAndResetsOnRequest)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const World world;
    world.start();
    world.dir.write("ws/.config/own", "");
    world.start();
    EXPECT_TRUE(world.dir.has("ws/.config/own")) << "an ordinary second start keeps it";
    world.start("-resetconfig\n");
    EXPECT_TRUE(world.dir.has("ws/.configbak/own"));
    EXPECT_FALSE(world.dir.has("ws/.config/own"));
    EXPECT_FALSE(world.dir.has("ws/platform.xml.old")) << "a reset keeps no such record";
    world.dir.write("ws/.config/rcpinstall.properties", "rcp.install.id=old\n");
    world.dir.write("ws/.config/own", "");
    world.start("-resetconfig\n");
    EXPECT_TRUE(world.dir.has("ws/.configbak/own"));
    EXPECT_TRUE(world.dir.has("ws/platform.xml.old")) << "another installation goes before a reset";
}

TEST(startup, AFirstLaunchIsNeitherReusedNorReset)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const World world;
    // The log directory is missing, so that the area counts as new.
    world.dir.write("ws/.config/rcpinstall.properties",
                    "rcp.install.id=old\nrcp.base.location=" + world.dir.path("base") + "\n");
    EXPECT_EQ(world.start("-resetconfig\n").status, 0);
    EXPECT_FALSE(world.dir.has("ws/.configbak"));
}

TEST(startup, AnInitialRunKeepsTheFirstOfFourWordsAndDropsTheOthers)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const World world;
    world.setProperties("config.initial.1=-initialCompleteFlag\nconfig.initial.2=done\n");
    const Ended ended = world.start("-foo\n-consoleLog\n-data\n" + world.dir.path("ws") +
                                    "\n-debugFile\n-data\n-second\n-noExitNow\n-console\n"
                                    "-debugX\n-noExit\n-vmargs\n-Xdropped\n");
    const std::string head = world.dir.path("base/linux/x86/eclipse") +
                             "\n--launcher.suppressErrors\n-consoleLog\n-debugFile\n-noExitNow\n"
                             "-initialCompleteFlag\ndone\n-data\n" +
                             world.dir.path("ws") + "\n";
    EXPECT_EQ(ended.result.substr(0, head.size()), head);
    EXPECT_EQ(ended.result.find("-Xdropped"), std::string::npos);
}

TEST(startup, ACompletedInitialRunIsNotMadeAgain)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const World world;
    world.setProperties("config.initial.1=-initialCompleteFlag\nconfig.initial.2=done\n");
    world.dir.write("base/rcpinstall.properties", "done=true\n");
    const Ended ended = world.start("-foo\n");
    EXPECT_TRUE(hasLine(ended.result, "-foo"));
    EXPECT_FALSE(hasLine(ended.result, "-initialCompleteFlag"));
}

TEST(startup, GivesTheProvisioningOfTheFirstStartTheWholeCommand)
{
    SKIP_WITHOUT_PRIVATE_TMP();
    const World world;
    world.setProperties("provisioning=true\nprovisioning.application=prov.app\n");
    world.dir.write("base/linux/x86/eclipse",
                    "#!/bin/sh\nprintf '%s\\n' \"$@\" >'" + world.dir.path("ran") + "'\n");
    const Ended ended = world.start();
    EXPECT_EQ(ended.status, 0);
    EXPECT_EQ(ended.result, "") << "the process ended before it came to the platform's command";
    EXPECT_TRUE(hasLine(world.dir.read("ran"), "prov.app"));
}
