#include "launcher/command/platform_arguments.h"

#include "launcher/user_area/installation.h"
#include "tests/unit/fixtures.h"

#include <algorithm>
#include <cerrno>

static const std::initializer_list<const wchar_t*> USER_PROPS = {L"rcp.install.id", L"1234"};
static const std::initializer_list<const wchar_t*> LAUNCHER_PROPS = {L"rcp.data", L"/ws"};

static Texts mainOptions(const Line& line,
                         std::initializer_list<const wchar_t*> userProps = USER_PROPS,
                         std::initializer_list<const wchar_t*> launcherProps = LAUNCHER_PROPS,
                         int configuration = CONFIG_USER)
{
    eConfig = configuration;
    return commandOf([&] {
        const Props user(userProps);
        const Props launcher(launcherProps);
        addMainOptionsToCommandLine(user.list, launcher.list, line.argc, line.argv, L"/opt/app");
    });
}

// What stands between "--launcher.suppressErrors" and the workspace "/ws".
static Texts userWords(const Line& line)
{
    const Texts command = mainOptions(line);
    const Texts tail = {L"-data", L"/ws", L"-configuration", L"/ws/.config"};
    EXPECT_GE(command.size(), 5U);
    EXPECT_EQ(command.front(), L"--launcher.suppressErrors");
    EXPECT_EQ(Texts(command.end() - 4, command.end()), tail);
    return Texts(command.begin() + 1, command.end() - 4);
}

TEST(addMainOptionsToCommandLine, PassesTheUsersWordsOnUpToVmargs)
{
    EXPECT_EQ(userWords(Line({L"velmora", L"-foo", L"", L"x y"})), (Texts{L"-foo", L"", L"x y"}));
    EXPECT_EQ(userWords(Line({L"velmora", L"-foo", L"-vmargs", L"-Xmx1g", L"-bar"})),
              (Texts{L"-foo"}));
    EXPECT_EQ(userWords(Line({L"velmora", L"-vmargs"})), Texts());
    EXPECT_EQ(userWords(Line({L"velmora"})), Texts());
}

TEST(addMainOptionsToCommandLine, DropsPairs)
{
    EXPECT_EQ(userWords(Line({L"velmora", L"-configuration", L"/c", L"-a", L"-vm", L"/j",
                              L"-rcp_old_pid", L"7", L"-b"})),
              (Texts{L"-a", L"-b"}));
    EXPECT_EQ(userWords(Line({L"velmora", L"-data", L"/ws", L"-foo", L"-vmargs", L"-Xmx1g"})),
              (Texts{L"-foo"}));
    EXPECT_EQ(userWords(Line({L"velmora", L"-a", L"-rcp_old_pid"})), (Texts{L"-a"}));
}

TEST(addMainOptionsToCommandLine, DropsSingles)
{
    EXPECT_EQ(userWords(Line({L"velmora", L"-restart", L"-resetconfig"})), Texts());
    EXPECT_EQ(userWords(Line({L"velmora", L"-restart", L"a", L"-resetconfig", L"b"})),
              (Texts{L"a", L"b"}));
}

TEST(addMainOptionsToCommandLine, PassesTheRepeatOfADroppedOptionOn)
{
    EXPECT_EQ(userWords(Line({L"velmora", L"-vm", L"/a", L"-vm", L"/b", L"-restart", L"-restart",
                              L"-data", L"/ws", L"-data", L"/x"})),
              (Texts{L"-vm", L"/b", L"-restart", L"-data", L"/x"}));
}

TEST(addMainOptionsToCommandLine, PassesPairsOnWhateverTheSecondWordIs)
{
    for (const wchar_t* option :
         {L"-plugincustomization", L"-application", L"-product", L"-personality"})
        EXPECT_EQ(userWords(Line({L"velmora", option, L"-restart", L"-resetconfig", L"-x"})),
                  (Texts{option, L"-restart", L"-x"}));
}

TEST(addMainOptionsToCommandLine, ARepeatOfAWordThatWasASecondWordIsPassedOn)
{
    // What counts is the first of each option, and that one was a value here.
    EXPECT_EQ(userWords(Line({L"velmora", L"-application", L"-restart", L"-restart"})),
              (Texts{L"-application", L"-restart", L"-restart"}));
    EXPECT_EQ(userWords(Line({L"velmora", L"-configuration", L"-vm", L"/j", L"-vm", L"/k"})),
              (Texts{L"/j", L"-vm", L"/k"}));
}

TEST(addMainOptionsToCommandLine, AWorkspaceCalledVmargsEndsTheWalk)
{
    EXPECT_EQ(mainOptions(Line({L"velmora", L"-a", L"-data", L"-vmargs", L"-Xa"})),
              (Texts{L"--launcher.suppressErrors", L"-a", L"-data", L"-vmargs", L"-configuration",
                     L"-vmargs/.config"}));
}

TEST(addMainOptionsToCommandLine, ASecondWordOfAPairMayBeData)
{
    // "-data" goes along; what follows it is an ordinary word.
    EXPECT_EQ(userWords(Line({L"velmora", L"-product", L"-data", L"/ws"})),
              (Texts{L"-product", L"-data", L"/ws"}));
}

TEST(addMainOptionsToCommandLine, ASecondWordVmargsEndsTheWalkBehindIt)
{
    EXPECT_EQ(userWords(Line({L"velmora", L"-a", L"-product", L"-vmargs", L"-Xmx1g"})),
              (Texts{L"-a", L"-product", L"-vmargs"}));
}

TEST(addMainOptionsToCommandLine, PassesAPairAsTheLastWordOnAlone)
{
    EXPECT_EQ(userWords(Line({L"velmora", L"-application"})), (Texts{L"-application"}));
}

TEST(addMainOptionsToCommandLine, HasNoSplashInTheDirectKindOnly)
{
    EXPECT_EQ(
        mainOptions(Line({L"velmora"}), USER_PROPS, {}, CONFIG_SERVICE),
        (Texts{L"-nosplash", L"--launcher.suppressErrors", L"-data", L"/opt/app/eclipse/.workspace",
               L"-configuration", L"/opt/app/eclipse/.config"}));
    EXPECT_EQ(
        mainOptions(Line({L"velmora"}), USER_PROPS, {}, CONFIG_MU_SERVICE),
        (Texts{L"-nosplash", L"--launcher.suppressErrors", L"-data", L"/opt/app/eclipse/.muservice",
               L"-configuration", L"/opt/app/eclipse/.muservice/.config"}));
    for (int configuration : {CONFIG_LOCKDOWN, CONFIG_USER, CONFIG_SERIAL_MULTIUSER, CONFIG_OTHER,
                              CONFIG_MULTIUSER, CONFIG_USERPB})
        EXPECT_EQ(mainOptions(Line({L"velmora"}), USER_PROPS, LAUNCHER_PROPS, configuration),
                  (Texts{L"--launcher.suppressErrors", L"-data", L"/ws", L"-configuration",
                         L"/ws/.config"}));
}

TEST(addMainOptionsToCommandLine, DebugModeShowsErrors)
{
    EXPECT_EQ(mainOptions(Line({L"velmora", L"-debug"})),
              (Texts{L"-debug", L"-data", L"/ws", L"-configuration", L"/ws/.config"}));
    EXPECT_EQ(mainOptions(Line({L"velmora", L"-debug", L"-restart"})),
              (Texts{L"--launcher.suppressErrors", L"-debug", L"-data", L"/ws", L"-configuration",
                     L"/ws/.config"}));
}

TEST(addMainOptionsToCommandLine, TakesTheLocationsFromTheLaunchersProperties)
{
    EXPECT_EQ(
        mainOptions(Line({L"velmora"}), {L"rcp.install.id", L"1", L"rcp.data", L"/other"}),
        (Texts{L"--launcher.suppressErrors", L"-data", L"/ws", L"-configuration", L"/ws/.config"}));
    EXPECT_EQ(mainOptions(Line({L"velmora", L"-data", L"/given"})),
              (Texts{L"--launcher.suppressErrors", L"-data", L"/given", L"-configuration",
                     L"/given/.config"}));
}

static const std::initializer_list<const wchar_t*> DEFAULTS = {
    L"rcp.install.id",      L"1234", L"personality", L"pers", L"product", L"prod",
    L"plugincustomization", L"cust", L"application", L"app"};

// What stands behind the configuration location.
static Texts defaultsFor(const Line& line, std::initializer_list<const wchar_t*> userProps,
                         std::initializer_list<const wchar_t*> launcherProps = LAUNCHER_PROPS)
{
    const Texts command = mainOptions(line, userProps, launcherProps);
    auto at = std::find(command.begin(), command.end(), L"/ws/.config");
    EXPECT_NE(at, command.end());
    return Texts(at + 1, command.end());
}

TEST(addMainOptionsToCommandLine, AddsTheDefaultsInTheirOrder)
{
    EXPECT_EQ(defaultsFor(Line({L"velmora"}), DEFAULTS),
              (Texts{L"-application", L"app", L"-plugincustomization", L"cust", L"-product",
                     L"prod", L"-personality", L"pers"}));
    EXPECT_EQ(defaultsFor(Line({L"velmora"}), USER_PROPS), Texts());
    EXPECT_EQ(defaultsFor(Line({L"velmora"}), {L"rcp.install.id", L"1", L"personality", L""}),
              (Texts{L"-personality", L""}));
}

TEST(addMainOptionsToCommandLine, AddsNoDefaultForWhatTheUserGave)
{
    EXPECT_EQ(
        defaultsFor(Line({L"velmora", L"-application"}), DEFAULTS),
        (Texts{L"-plugincustomization", L"cust", L"-product", L"prod", L"-personality", L"pers"}));
    EXPECT_EQ(defaultsFor(Line({L"velmora", L"-product", L"x", L"-personality", L"y"}), DEFAULTS),
              (Texts{L"-application", L"app", L"-plugincustomization", L"cust"}));
    // A word behind "-vmargs" counts as given.
    EXPECT_EQ(defaultsFor(Line({L"velmora", L"-vmargs", L"-plugincustomization"}), DEFAULTS),
              (Texts{L"-application", L"app", L"-product", L"prod", L"-personality", L"pers"}));
}

TEST(addMainOptionsToCommandLine, TakesTheLaunchersProductFirstAndNothingElseOfIts)
{
    EXPECT_EQ(defaultsFor(Line({L"velmora"}), DEFAULTS,
                          {L"rcp.data", L"/ws", L"product", L"mine", L"application", L"no",
                           L"personality", L"no", L"plugincustomization", L"no"}),
              (Texts{L"-application", L"app", L"-plugincustomization", L"cust", L"-product",
                     L"mine", L"-personality", L"pers"}));
    EXPECT_EQ(defaultsFor(Line({L"velmora"}), USER_PROPS,
                          {L"rcp.data", L"/ws", L"product", L"mine", L"application", L"no"}),
              (Texts{L"-product", L"mine"}));
}

TEST(addMainOptionsToCommandLine, EndsWithoutAnInstallId)
{
    EXPECT_TRUE(endsWith(
        [] {
            errno = EACCES;
            mainOptions(Line({L"velmora"}), {}, {L"rcp.data", L"/ws", L"rcp.install.id", L"1"});
        },
        "QVMRL0005E: Couldn't find the rcp.install.id property!", EACCES));
}

TEST(addMainOptionsToCommandLine, MissesTheInstallIdBeforeTheLocationsDo)
{
    EXPECT_FATAL(mainOptions(Line({L"velmora"}), {}, {}), "QVMRL0005E");
}

static Texts systemProperties(std::initializer_list<const wchar_t*> userProps,
                              std::initializer_list<const wchar_t*> launcherProps,
                              int configuration = CONFIG_USER)
{
    eConfig = configuration;
    return commandOf([&] {
        const Props user(userProps);
        const Props launcher(launcherProps);
        const Line line({L"velmora"});
        addDashDToCommandLine(user.list, launcher.list, line.argc, line.argv, L"/opt\\app");
    });
}

TEST(addDashDToCommandLine, EmitsItsWordsInTheirOrder)
{
    EXPECT_EQ(
        systemProperties({L"-Dfoo", L"bar", L"rcp.install.id", L"1234", L"-Dempty", L"", L"x-Dno",
                          L"1", L"-Da=b", L"c"},
                         {L"osgi.splashPath", L"/splash", L"rcp.data", L"/ws", L"-Dno", L"1"}),
        (Texts{L"-Drcp.home=/opt\\app", L"-Drcp.data=/ws", L"-Dosgi.splashPath=/splash",
               L"-Dcom.vantor.rcp.install.id=1234", L"-Drcp.install.config=user", L"-Dfoo=bar",
               L"-Dempty=", L"-Da=b=c", L"-Drcp.osgi.install.area=/opt/app/rcp/eclipse"}));
}

TEST(addDashDToCommandLine, LeavesTheSplashPathOutWhenItIsNotSet)
{
    EXPECT_EQ(
        systemProperties({L"rcp.install.id", L"1", L"osgi.splashPath", L"/no"}, LAUNCHER_PROPS),
        (Texts{L"-Drcp.home=/opt\\app", L"-Drcp.data=/ws", L"-Dcom.vantor.rcp.install.id=1",
               L"-Drcp.install.config=user", L"-Drcp.osgi.install.area=/opt/app/rcp/eclipse"}));
}

TEST(addDashDToCommandLine, NamesTheInstallConfiguration)
{
    const struct {
        int configuration;
        const wchar_t* name;
    } rows[] = {{CONFIG_SERVICE, L"service"},     {CONFIG_LOCKDOWN, L"lockdown"},
                {CONFIG_USER, L"user"},           {CONFIG_SERIAL_MULTIUSER, L"serial.multiuser"},
                {CONFIG_MULTIUSER, L"multiuser"}, {CONFIG_MU_SERVICE, L"multiuser"},
                {CONFIG_USERPB, L"userpb"}};
    for (const auto& row : rows)
        EXPECT_EQ(systemProperties(USER_PROPS, LAUNCHER_PROPS, row.configuration).at(3),
                  std::wstring(L"-Drcp.install.config=") + row.name);
}

TEST(addDashDToCommandLine, EndsForAConfigurationWithoutANameSpeakingOfTheInstallId)
{
    EXPECT_TRUE(endsWith(
        [] {
            errno = EACCES;
            systemProperties(USER_PROPS, LAUNCHER_PROPS, CONFIG_OTHER);
        },
        "QVMRL0025E: The platform rcp.install.id must be provided for this configuration!",
        EACCES));
}

TEST(addDashDToCommandLine, EndsWithoutAnInstallId)
{
    EXPECT_TRUE(endsWith(
        [] {
            errno = EACCES;
            systemProperties({}, {L"rcp.data", L"/ws", L"rcp.install.id", L"1"});
        },
        "QVMRL0036E: Couldn't find the rcp.install.id property!", EACCES));
}

TEST(addDashDToCommandLine, MissesTheInstallIdBeforeTheConfigurationsName)
{
    EXPECT_FATAL(systemProperties({}, {L"rcp.data", L"/ws"}, CONFIG_OTHER), "QVMRL0036E");
}

TEST(addDashDToCommandLine, TracesEachWordThatAPropertyGives)
{
    EXPECT_EQ(logOf(true,
                    [] {
                        systemProperties(
                            {L"rcp.install.id", L"1", L"-Dfoo", L"bar", L"-Dp", L"100%s"},
                            LAUNCHER_PROPS);
                    }),
              "QVMRL0075I: commandArg  = \"-Dfoo=bar\"\n"
              "QVMRL0075I: commandArg  = \"-Dp=100%s\"\n");
    EXPECT_EQ(
        logOf(false,
              [] {
                  systemProperties({L"rcp.install.id", L"1", L"-Dfoo", L"bar"}, LAUNCHER_PROPS);
              }),
        "");
}

TEST(addDashDToCommandLine, HasNoNulInItsWords)
{
    for (const std::wstring& word :
         systemProperties({L"rcp.install.id", L"1", L"-Dfoo", L"bar"}, LAUNCHER_PROPS))
        EXPECT_EQ(word.find(L'\0'), std::wstring::npos);
}
