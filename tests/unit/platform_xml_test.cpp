#include "launcher/user_area/platform_xml.h"

#include "launcher/user_area/first_launch.h"
#include "launcher/user_area/installation.h"
#include "tests/unit/fixtures.h"

#include <cerrno>
#include <filesystem>
#include <sys/stat.h>
#include <unistd.h>

namespace fs = std::filesystem;

static const char* const TARGET = "ws/.config/org.eclipse.update/platform.xml";

namespace {
// An installation with a template and a user's configuration location.
struct World {
    explicit World(const std::string& text)
    {
        eConfig = CONFIG_USER;
        userFirstLaunch = false;
        dir.write("base/platform.xml", text);
        dir.makeDir("ws/.config");
    }

    int create(const Props& props, bool replaceFeatureLines = false) const
    {
        return createPlatformXML(dir.wide("ws/.config"), dir.wide("base"), props.list,
                                 replaceFeatureLines);
    }

    std::string target() const
    {
        return dir.read(TARGET);
    }

    TempDir dir;
};
} // namespace

static const std::initializer_list<const wchar_t*> FEATURES = {
    L"jvm.feature.id",        L"ID",     L"jvm.feature.version",        L"1.2",
    L"jvm.parent.feature.id", L"PARENT", L"jvm.parent.feature.version", L"3.4"};

// The user's file that this template gives, with both features known.
static std::string filledIn(const std::string& text, bool replaceFeatureLines = false)
{
    const World world(text);
    EXPECT_EQ(world.create(Props(FEATURES), replaceFeatureLines), 0);
    return world.target();
}

TEST(createPlatformXML, CopiesTheTemplateAndMarksTheFirstLaunch)
{
    const World world("<?xml?>\n<config>\n</config>\n");
    world.dir.makeDir("ws/.config/org.eclipse.update");
    EXPECT_EQ(logOf(true, [&] { EXPECT_EQ(world.create(Props({})), 0); }), "");
    EXPECT_EQ(world.target(), "<?xml?>\n<config>\n</config>\n");
    EXPECT_TRUE(userFirstLaunch);
    EXPECT_FALSE(world.dir.has(std::string(TARGET) + ".part"));
}

TEST(createPlatformXML, PutsIdAndVersionInAsOftenAsTheyStandThere)
{
    EXPECT_EQ(filledIn("<a ${jvm.feature.id}_${jvm.feature.version} "
                       "${jvm.feature.id}_${jvm.feature.version}/>\n"),
              "<a ID_1.2 ID_1.2/>\n");
    EXPECT_EQ(filledIn("${jvm.parent.feature.version}${jvm.parent.feature.id}"
                       "${jvm.parent.feature.version}\n"),
              "3.4PARENT3.4\n");
}

TEST(createPlatformXML, PutsBothFeaturesIntoOneLine)
{
    EXPECT_EQ(filledIn("${jvm.feature.id} ${jvm.parent.feature.id} ${jvm.feature.version} "
                       "${jvm.parent.feature.version}\n"),
              "ID PARENT 1.2 3.4\n");
}

TEST(createPlatformXML, LeavesAVersionWithoutItsIdAsItStands)
{
    EXPECT_EQ(filledIn("v=${jvm.feature.version}\nv=${jvm.parent.feature.version}\n"
                       "${jvm.feature.id} ${jvm.parent.feature.version}\n"),
              "v=${jvm.feature.version}\nv=${jvm.parent.feature.version}\n"
              "ID ${jvm.parent.feature.version}\n");
}

TEST(createPlatformXML, KnowsItsPlaceholdersExactly)
{
    const std::string text = "${JVM.feature.id} ${jvm.feature.id ${ jvm.feature.id}\n";
    EXPECT_EQ(filledIn(text), text);
}

TEST(createPlatformXML, ReplacesFeatureLinesAsAWholeWhenAsked)
{
    EXPECT_EQ(filledIn("<a>\n<b ${jvm.feature.id} ${jvm.feature.version}/>\n"
                       "<c ${jvm.parent.feature.id}/>\nv=${jvm.feature.version}\n",
                       true),
              "<a>\n<feature>\n<feature>\nv=${jvm.feature.version}\n");
}

TEST(createPlatformXML, NeedsNoValuesWhenItReplacesFeatureLines)
{
    const World world("${jvm.feature.id}\n${jvm.parent.feature.id}\n");
    EXPECT_EQ(logOf(false, [&] { EXPECT_EQ(world.create(Props({}), true), 0); }), "");
    EXPECT_EQ(world.target(), "<feature>\n<feature>\n");
}

TEST(createPlatformXML, ResolvesWhatAValueBringsIn)
{
    const World world("${jvm.feature.id}\n");
    EXPECT_EQ(
        world.create(Props({L"jvm.feature.id", L"x${jvm.feature.version}", L"jvm.feature.version",
                            L"y${jvm.parent.feature.id}", L"jvm.parent.feature.id", L"P",
                            L"jvm.parent.feature.version", L"3"})),
        0);
    EXPECT_EQ(world.target(), "xyP\n");
}

// Creates the file with these properties, which must be cut behind its first two lines.
static void expectCutCopy(std::initializer_list<const wchar_t*> props, const std::string& third,
                          const std::string& line)
{
    const World world("<one>\n<two>\n" + third + "\n<four>\n");
    EXPECT_EQ(logOf(false, [&] { EXPECT_EQ(world.create(Props(props)), 0); }), line + "\n");
    EXPECT_EQ(world.target(), "<one>\n<two>\n");
    EXPECT_TRUE(userFirstLaunch);
    // A later start believes it, whatever the properties say by then.
    EXPECT_EQ(world.create(Props(FEATURES)), 0);
    EXPECT_EQ(world.target(), "<one>\n<two>\n");
}

static const char* const MISSING =
    "QVMRL0101E: Error while copying platform.xml to user specific platform.xml file.";
static const char* const MISSING_PARENT =
    "QVMRL0102E: Error while copying platform.xml to user specific platform.xml file.";
static const char* const NOT_WRITTEN =
    "QVMRL0103E: Error while copying platform.xml to user specific platform.xml file.";

TEST(createPlatformXML, AMissingFeatureValueCutsTheCopyForGood)
{
    const char* third = "${jvm.feature.id} ${jvm.feature.version}";
    expectCutCopy({}, third, MISSING);
    expectCutCopy({L"jvm.feature.id", L"ID"}, third, MISSING);
    expectCutCopy({L"jvm.feature.version", L"1"}, third, MISSING);
    // The version must be there even where the line does not need it.
    expectCutCopy({L"jvm.feature.id", L"ID"}, "${jvm.feature.id}", MISSING);
}

TEST(createPlatformXML, AMissingParentValueCutsTheCopyForGood)
{
    const char* third = "${jvm.parent.feature.id} ${jvm.parent.feature.version}";
    expectCutCopy({}, third, MISSING_PARENT);
    expectCutCopy({L"jvm.parent.feature.id", L"P"}, third, MISSING_PARENT);
    expectCutCopy({L"jvm.parent.feature.version", L"1"}, third, MISSING_PARENT);
}

TEST(createPlatformXML, TakesAnEmptyValueForPresent)
{
    const World world("<${jvm.feature.id}_${jvm.feature.version}>\n");
    EXPECT_EQ(world.create(Props({L"jvm.feature.id", L"", L"jvm.feature.version", L""})), 0);
    EXPECT_EQ(world.target(), "<_>\n");
}

TEST(createPlatformXML, AValueThatHoldsItsOwnPlaceholderCountsAsMissing)
{
    expectCutCopy({L"jvm.feature.id", L"x${jvm.feature.id}", L"jvm.feature.version", L"1"},
                  "${jvm.feature.id}", MISSING);
    expectCutCopy({L"jvm.feature.id", L"x", L"jvm.feature.version", L"${jvm.feature.version}"},
                  "${jvm.feature.id} ${jvm.feature.version}", MISSING);
    expectCutCopy({L"jvm.parent.feature.id", L"${jvm.parent.feature.id}",
                   L"jvm.parent.feature.version", L"1"},
                  "${jvm.parent.feature.id}", MISSING_PARENT);
}

TEST(createPlatformXML, LeavesAnExistingFileAlone)
{
    const World world("<new>\n");
    world.dir.write(TARGET, "<old>");
    EXPECT_EQ(world.create(Props(FEATURES)), 0);
    EXPECT_EQ(world.target(), "<old>");
    EXPECT_FALSE(userFirstLaunch);
}

TEST(createPlatformXML, MakesOnlyTheDirectoryWhenUpdatesAreNotManaged)
{
    const World world("<new>\n");
    EXPECT_EQ(world.create(Props({L"update.policy.managed", L"false"})), 0);
    EXPECT_TRUE(fs::is_directory(world.dir.path("ws/.config/org.eclipse.update")));
    EXPECT_FALSE(world.dir.has(TARGET));
    EXPECT_TRUE(userFirstLaunch);
}

TEST(createPlatformXML, TakesEveryOtherPolicyForManaged)
{
    for (const wchar_t* value : {L"FALSE", L"true", L"", L"false "}) {
        const World world("<new>\n");
        EXPECT_EQ(world.create(Props({L"update.policy.managed", value})), 0);
        EXPECT_EQ(world.target(), "<new>\n");
    }
}

TEST(createPlatformXML, MakesNothingAtAllForUserpb)
{
    const World world("<new>\n");
    eConfig = CONFIG_USERPB;
    EXPECT_EQ(world.create(Props({})), 0);
    EXPECT_FALSE(world.dir.has("ws/.config/org.eclipse.update"));
    EXPECT_FALSE(userFirstLaunch);
}

TEST(createPlatformXML, TakesTheTemplateOfTheConfiguration)
{
    const World world("<base>\n");
    world.dir.write("base/config/user/platform.xml", "<user>\n");
    EXPECT_EQ(world.create(Props({})), 0);
    EXPECT_EQ(world.target(), "<user>\n");
}

TEST(createPlatformXML, DropsBlankLinesAndTheIndentationBehindALineEnd)
{
    EXPECT_EQ(filledIn("  <one>\n    <two>\n\n\n\t<three>  \n\n"), "  <one>\n<two>\n<three>  \n");
}

TEST(createPlatformXML, SwallowsBlankLinesAtTheHeadOfTheTemplate)
{
    EXPECT_EQ(filledIn("\n\n  <one>\n<two>"), "<one>\n<two>\n");
    EXPECT_EQ(filledIn("\n\n"), "");
    EXPECT_EQ(filledIn(""), "");
}

TEST(createPlatformXML, SplitsALineOfMoreThan2024Bytes)
{
    const std::string full(2024, 'x');
    EXPECT_EQ(filledIn(full + "\n"), full + "\n");
    EXPECT_EQ(filledIn(full + "y\nz\n"), full + "\ny\nz\n");
    EXPECT_EQ(filledIn(full + full + "y\n"), full + "\n" + full + "\ny\n");
}

TEST(createPlatformXML, EndsWhenItsDirectoryCannotBeMade)
{
    const World world("<new>\n");
    world.dir.write("ws/.config/org.eclipse.update", "a file");
    EXPECT_TRUE(endsWith([&] { world.create(Props({})); },
                         "QVMRL0039E: Unable to create " +
                             world.dir.path("ws/.config/org.eclipse.update") + " directory.",
                         EEXIST));
}

TEST(createPlatformXML, LogsATemplateThatCannotBeOpened)
{
    const World world("<new>\n");
    fs::remove(world.dir.path("base/platform.xml"));
    EXPECT_EQ(logOf(false, [&] { EXPECT_EQ(world.create(Props({})), -1); }),
              "QVMRL0104E: Unable to open platform.xml.\"" + world.dir.path("base/platform.xml") +
                  "\"\n");
    EXPECT_FALSE(world.dir.has(TARGET));
}

TEST(createPlatformXML, LogsATemplateThatMayNotBeRead)
{
    const World world("<new>\n");
    chmod(world.dir.dir.c_str(), 0755);
    chmod(world.dir.path("base/platform.xml").c_str(), 0);
    for (const char* place : {"ws", "ws/.config", "aside"}) {
        world.dir.makeDir(place);
        chmod(world.dir.path(place).c_str(), 0777);
    }
    const Ended ended = runAside(world.dir, false, [&] {
        if (geteuid() == 0 && setresuid(65534, 65534, 65534) != 0)
            return std::string("still root");
        return std::to_string(world.create(Props({})));
    });
    EXPECT_EQ(ended.log, "QVMRL0104E: Unable to open platform.xml.\"" +
                             world.dir.path("base/platform.xml") + "\"\n");
    EXPECT_FALSE(world.dir.has(TARGET));
}

TEST(createPlatformXML, LogsATargetThatCannotBeOpened)
{
    const World world("<new>\n");
    world.dir.makeDir("ws/.config/org.eclipse.update");
    fs::create_symlink(world.dir.path("missing/x"), world.dir.path(TARGET));
    EXPECT_EQ(logOf(false, [&] { EXPECT_EQ(world.create(Props({})), -1); }),
              "QVMRL0139E: Unable to open platform.xml for writing.\"" + world.dir.path(TARGET) +
                  "\"\n");
    EXPECT_FALSE(userFirstLaunch);
}

TEST(createPlatformXML, WritesThroughADanglingLink)
{
    const World world("<new>\n");
    world.dir.makeDir("ws/.config/org.eclipse.update");
    fs::create_symlink(world.dir.path("elsewhere"), world.dir.path(TARGET));
    EXPECT_EQ(world.create(Props({})), 0);
    EXPECT_EQ(world.dir.read("elsewhere"), "<new>\n");
    EXPECT_TRUE(fs::is_symlink(world.dir.path(TARGET)));
}

TEST(createPlatformXML, AFailedWriteCutsTheCopyForGood)
{
    std::string text;
    for (int i = 0; i < 2000; ++i)
        text += "<line of twenty one>\n";
    const World world(text);
    const Ended ended = runAside(world.dir, false, [&] {
        limitFileSize(8192);
        const int result = world.create(Props({}));
        return std::to_string(result) + (userFirstLaunch ? " first" : "");
    });
    EXPECT_EQ(ended.result, "0 first");
    EXPECT_EQ(ended.log, std::string(NOT_WRITTEN) + "\n");
    EXPECT_EQ(world.target(), text.substr(0, 8192));
}

TEST(createPlatformXML, LogsAWriteThatFailsOnlyAtTheEnd)
{
    // The whole text fits into the stream's buffer, so only the flush behind it can fail.
    std::string text;
    for (int i = 0; i < 20; ++i)
        text += "<line of twenty one>\n";
    const World world(text);
    const Ended ended = runAside(world.dir, false, [&] {
        limitFileSize(210);
        return std::to_string(world.create(Props({})));
    });
    EXPECT_EQ(ended.result, "0");
    EXPECT_EQ(ended.log, std::string(NOT_WRITTEN) + "\n");
    EXPECT_EQ(world.target(), text.substr(0, 210));
}
