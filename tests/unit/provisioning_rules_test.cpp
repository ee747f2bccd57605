#include "launcher/user_area/provisioning_rules.h"

#include "launcher/user_area/installation.h"
#include "platform/linux/lock_file.h"
#include "tests/unit/fixtures.h"

#include <cerrno>
#include <cstdlib>

TEST(isNewProvisioningLevel, IsTrueWithoutAUserLevel)
{
    EXPECT_TRUE(isNewProvisioningLevel(nullptr, L"1"));
    EXPECT_TRUE(isNewProvisioningLevel(nullptr, nullptr));
}

TEST(isNewProvisioningLevel, IsTrueWhenTheTwoDiffer)
{
    EXPECT_TRUE(isNewProvisioningLevel(L"1", L"2"));
    EXPECT_TRUE(isNewProvisioningLevel(L"1", L"1 "));
    EXPECT_TRUE(isNewProvisioningLevel(L"a", L"A"));
    EXPECT_TRUE(isNewProvisioningLevel(L"", L"1"));
    EXPECT_TRUE(isNewProvisioningLevel(L"1", nullptr));
}

TEST(isNewProvisioningLevel, IsFalseForEqualLevels)
{
    EXPECT_FALSE(isNewProvisioningLevel(L"1.0", L"1.0"));
    EXPECT_FALSE(isNewProvisioningLevel(L"", L""));
}

static bool required(std::initializer_list<const wchar_t*> launcherProps,
                     std::initializer_list<const wchar_t*> userProps = {},
                     int configuration = CONFIG_USER)
{
    eConfig = configuration;
    const Props launcher(launcherProps);
    const Props user(userProps);
    return isInitialRequired(launcher.list, user.list);
}

// A group that names the flag "done".
static const std::initializer_list<const wchar_t*> GROUP = {
    L"config.initial.1", L"-application",         L"config.initial.2", L"some.app",
    L"config.initial.3", L"-initialCompleteFlag", L"config.initial.4", L"done"};

TEST(isInitialRequired, IsTrueUntilTheFlagSaysTrue)
{
    EXPECT_TRUE(required(GROUP));
    EXPECT_TRUE(required(GROUP, {L"done", L"false"}));
    EXPECT_TRUE(required(GROUP, {L"done", L""}));
    EXPECT_TRUE(required(GROUP, {L"done", L"True"}));
    EXPECT_TRUE(required(GROUP, {L"done", L"tru"}));
    EXPECT_TRUE(required(GROUP, {L"Done", L"true"}));
    EXPECT_FALSE(required(GROUP, {L"done", L"true"}));
}

TEST(isInitialRequired, ComparesOnlyFourCharactersOfTheFlagsValue)
{
    EXPECT_FALSE(required(GROUP, {L"done", L"trueish"}));
    EXPECT_TRUE(required(GROUP, {L"done", L" true"}));
}

TEST(isInitialRequired, IsForThreeConfigurations)
{
    for (int configuration = 1; configuration <= 8; ++configuration)
        EXPECT_EQ(required(GROUP, {}, configuration), configuration == CONFIG_USER ||
                                                          configuration == CONFIG_USERPB ||
                                                          configuration == CONFIG_MULTIUSER)
            << configuration;
}

TEST(isInitialRequired, IsFalseWithoutAGroup)
{
    EXPECT_FALSE(required({}));
    EXPECT_FALSE(required({L"config.initial", L"-initialCompleteFlag", L"config.initia.1", L"x"}));
}

TEST(isInitialRequired, IsFalseWhenAPairWithoutAKeyHidesTheGroup)
{
    EXPECT_FALSE(required(
        {L"", L"x", L"config.initial.1", L"-initialCompleteFlag", L"config.initial.2", L"done"}));
}

TEST(isInitialRequired, TakesTheFlagsValueAsItStands)
{
    setenv("VELMORA_TEST_X", "true", 1);
    EXPECT_TRUE(required(GROUP, {L"done", L"${env.VELMORA_TEST_X}"}));
}

TEST(isInitialRequired, AsksForNothingInOtherConfigurationsEvenIfTheGroupIsBad)
{
    EXPECT_FALSE(required({L"config.initial.7", L"x"}, {}, CONFIG_LOCKDOWN));
}

TEST(isInitialRequired, TakesTheGroupInTheOrderOfItsNumbers)
{
    EXPECT_FALSE(required(
        {L"config.initial.2", L"done", L"x", L"y", L"config.initial.1", L"-initialCompleteFlag"},
        {L"done", L"true"}));
}

TEST(isInitialRequired, TheFlagsFollowerIsTheValueOfTheNextEntry)
{
    // In file order "other" follows the flag; by its number it is "done".
    EXPECT_FALSE(required({L"config.initial.1", L"-initialCompleteFlag", L"config.initial.3",
                           L"other", L"config.initial.2", L"done"},
                          {L"done", L"true", L"other", L"false"}));
}

TEST(isInitialRequired, ComparesTwentyCharactersOfTheFlagsWord)
{
    EXPECT_FALSE(
        required({L"config.initial.1", L"-initialCompleteFlagged", L"config.initial.2", L"done"},
                 {L"done", L"true"}));
}

TEST(isInitialRequired, TakesTheFirstOfTwoFlags)
{
    EXPECT_FALSE(
        required({L"config.initial.1", L"-initialCompleteFlag", L"config.initial.2", L"done",
                  L"config.initial.3", L"-initialCompleteFlag", L"config.initial.4", L"other"},
                 {L"done", L"true"}));
}

TEST(isInitialRequired, AnEmptyFlagNameIsAFlagThatNobodyHas)
{
    EXPECT_TRUE(required({L"config.initial.1", L"-initialCompleteFlag", L"config.initial.2", L""}));
}

TEST(isInitialRequired, TheKeyFor10StandsFor1WhenItComesFirst)
{
    // Ten entries. For 1 the key of 10 is taken, "-initialCompleteFlag"; its follower is that of 2.
    const std::initializer_list<const wchar_t*> tenFirst = {
        L"config.initial.10", L"-initialCompleteFlag",
        L"config.initial.1",  L"one",
        L"config.initial.2",  L"done",
        L"config.initial.3",  L"three",
        L"config.initial.4",  L"four",
        L"config.initial.5",  L"five",
        L"config.initial.6",  L"six",
        L"config.initial.7",  L"seven",
        L"config.initial.8",  L"eight",
        L"config.initial.9",  L"nine"};
    EXPECT_FALSE(required(tenFirst, {L"done", L"true"}));
    EXPECT_TRUE(required(tenFirst, {L"one", L"true"}));
}

TEST(isInitialRequired, TheKeyFor10IsItselfBehindTheKeyFor1)
{
    // Ten entries in order: the flag is the ninth, its follower the tenth.
    const std::initializer_list<const wchar_t*> inOrder = {
        L"config.initial.1",  L"one",
        L"config.initial.2",  L"two",
        L"config.initial.3",  L"three",
        L"config.initial.4",  L"four",
        L"config.initial.5",  L"five",
        L"config.initial.6",  L"six",
        L"config.initial.7",  L"seven",
        L"config.initial.8",  L"eight",
        L"config.initial.9",  L"-initialCompleteFlag",
        L"config.initial.10", L"done"};
    EXPECT_FALSE(required(inOrder, {L"done", L"true"}));
    EXPECT_TRUE(required(inOrder, {L"two", L"true"}));
}

TEST(isInitialRequired, TakesTheFirstOfANumberThatIsThereTwice)
{
    // Ten entries and ten numbers: the key of 10 is the first word and the tenth.
    const std::initializer_list<const wchar_t*> twice = {
        L"config.initial.10", L"-initialCompleteFlag",
        L"config.initial.2",  L"done",
        L"config.initial.2",  L"other",
        L"config.initial.3",  L"three",
        L"config.initial.4",  L"four",
        L"config.initial.5",  L"five",
        L"config.initial.6",  L"six",
        L"config.initial.7",  L"seven",
        L"config.initial.8",  L"eight",
        L"config.initial.9",  L"nine"};
    EXPECT_FALSE(required(twice, {L"done", L"true"}));
    EXPECT_TRUE(required(twice, {L"other", L"true"}));
}

static const char* const NO_FLAG =
    "QVMRL0115E: Invalid config.initial arguments. -initialCompleteFlag not found";

static testing::AssertionResult ends(std::initializer_list<const wchar_t*> launcherProps,
                                     const char* line)
{
    return endsWith(
        [&] {
            errno = EACCES;
            required(launcherProps);
        },
        line, EACCES);
}

TEST(isInitialRequired, EndsWhenANumberIsMissing)
{
    EXPECT_TRUE(ends({L"config.initial.2", L"x"},
                     "QVMRL0114E: Invalid config.initial arguments. config.initial.1 not found"));
    EXPECT_TRUE(ends({L"config.initial.1", L"-initialCompleteFlag", L"config.initial.3", L"done"},
                     "QVMRL0114E: Invalid config.initial arguments. config.initial.2 not found"));
}

TEST(isInitialRequired, ANumberThatIsThereTwiceCountsTwice)
{
    // Four entries are counted, so a fourth number is asked for; with it five, and so a fifth.
    EXPECT_TRUE(ends({L"config.initial.1", L"-initialCompleteFlag", L"config.initial.2", L"done",
                      L"config.initial.2", L"other", L"config.initial.3", L"x"},
                     "QVMRL0114E: Invalid config.initial arguments. config.initial.4 not found"));
    EXPECT_TRUE(
        ends({L"config.initial.1", L"-initialCompleteFlag", L"config.initial.2", L"done",
              L"config.initial.2", L"other", L"config.initial.3", L"x", L"config.initial.4", L"x"},
             "QVMRL0114E: Invalid config.initial arguments. config.initial.5 not found"));
}

TEST(isInitialRequired, EveryKeyOfTheGroupCountsTheRestartExecutableToo)
{
    // Three entries are counted, so a third number is asked for.
    EXPECT_TRUE(ends({L"config.initial.1", L"-initialCompleteFlag", L"config.initial.2", L"done",
                      L"config.initial.restartExe.linux", L"/x"},
                     "QVMRL0114E: Invalid config.initial arguments. config.initial.3 not found"));
}

TEST(isInitialRequired, EndsWithoutAFlag)
{
    EXPECT_TRUE(
        ends({L"config.initial.1", L"-InitialCompleteFlag", L"config.initial.2", L"x"}, NO_FLAG));
    EXPECT_TRUE(
        ends({L"config.initial.1", L"x-initialCompleteFlag", L"config.initial.2", L"x"}, NO_FLAG));
    EXPECT_TRUE(
        ends({L"config.initial.1", L"-initialCompleteFla", L"config.initial.2", L"x"}, NO_FLAG));
}

TEST(isInitialRequired, EndsWhenTheFlagHasNoFollower)
{
    EXPECT_TRUE(ends({L"config.initial.1", L"-initialCompleteFlag"}, NO_FLAG));
    EXPECT_TRUE(
        ends({L"config.initial.1", L"x", L"config.initial.2", L"-initialCompleteFlag"}, NO_FLAG));
}

TEST(defeateSharedClassesInProvisioning, ReplacesTheSharedClassesAndLogsAnotherSpelling)
{
    VmargMap map = {{L"vmarg.Dshare", L"-Xshareclasses:name=a"}, {L"vmarg.a", L"b"}};
    EXPECT_EQ(logOf(true, [&] { defeateSharedClassesInProvisioning(map); }),
              "QVMRL0120I: \"vmarg.Dshare\" shared classes property found. Setting "
              "-Xsharedclasses=none while provisioning\n");
    EXPECT_EQ(map, (VmargMap{{L"vmarg.Dshare", L"-Xshareclasses=none"}, {L"vmarg.a", L"b"}}));
}

TEST(defeateSharedClassesInProvisioning, AddsNothingWhenThereWereNone)
{
    VmargMap map = {{L"vmarg.Dshared", L"x"}};
    EXPECT_EQ(logOf(true, [&] { defeateSharedClassesInProvisioning(map); }),
              "QVMRL0121I: \"vmarg.Dshare\" shared classes property was not detected. No special "
              "action needed while provisioning\n");
    EXPECT_EQ(map, (VmargMap{{L"vmarg.Dshared", L"x"}}));
}

TEST(defeateSharedClassesInProvisioning, ReplacesAnEmptyEntryToo)
{
    VmargMap map = {{L"vmarg.Dshare", L""}};
    EXPECT_EQ(logOf(false, [&] { defeateSharedClassesInProvisioning(map); }), "");
    EXPECT_EQ(map, (VmargMap{{L"vmarg.Dshare", L"-Xshareclasses=none"}}));
}

TEST(validateInstallerState, AcceptsAnInstallerInTheMainProcess)
{
    Line line({L"velmora", L"-provManifest"});
    setMainProcess(true);
    EXPECT_EQ(logOf(true, [&] { validateInstallerState(line.argc, line.argv); }), "");
    setMainProcess(false);
}

TEST(validateInstallerState, AcceptsADaemonProcessWithoutAnInstaller)
{
    Line line({L"velmora", L"-velmoraWait", L"-provmanifest"});
    setMainProcess(false);
    EXPECT_EQ(logOf(true, [&] { validateInstallerState(line.argc, line.argv); }), "");
}

TEST(validateInstallerState, EndsAnInstallerInADaemonProcess)
{
    const TempDir ws;
    // The number that is in the lock file; no process has it.
    ws.write(".rcp.lock", "2147483647          ");
    Line line({L"velmora", L"-provManifest"});
    EXPECT_TRUE(endsWith(
        [&] {
            locateLockFile(line.argc, line.argv, ws.wdir, L"eclipse");
            setMainProcess(false);
            errno = EACCES;
            validateInstallerState(line.argc, line.argv);
        },
        "QVMRL0122E: Attempting to install while process 2147483647 is running.", EACCES));
}
