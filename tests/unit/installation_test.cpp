#include "launcher/user_area/installation.h"

#include "tests/unit/fixtures.h"

#include <cerrno>
#include <chrono>
#include <filesystem>

static int configurationOf(const wchar_t* word, bool muService = false)
{
    const Props props({L"install.configuration", word});
    EXPECT_EQ(SetInstallConfiguration(props.list, muService), 1);
    return eConfig;
}

TEST(SetInstallConfiguration, KnowsItsWords)
{
    EXPECT_EQ(configurationOf(L"service"), 1);
    EXPECT_EQ(configurationOf(L"lockdown"), 2);
    EXPECT_EQ(configurationOf(L"user"), 3);
    EXPECT_EQ(configurationOf(L"serial.multiuser"), 4);
    EXPECT_EQ(configurationOf(L"multiuser"), 6);
    EXPECT_EQ(configurationOf(L"userpb"), 8);
}

TEST(SetInstallConfiguration, TakesEveryOtherWordForOtherWithoutAMessage)
{
    EXPECT_EQ(logOf(true,
                    [] {
                        for (const wchar_t* word : {L"Service", L"SERVICE", L"users", L"use", L"",
                                                    L"mu.service", L"lockdown "})
                            EXPECT_EQ(configurationOf(word), 5);
                    }),
              "");
}

TEST(SetInstallConfiguration, TakesAMissingOneForUser)
{
    EXPECT_EQ(logOf(true,
                    [] {
                        EXPECT_EQ(SetInstallConfiguration(Props({}).list, false), 1);
                        EXPECT_EQ(eConfig, 3);
                        EXPECT_FALSE(IS_LOCKDOWN);
                    }),
              "QVMRL0041I: Missed install configuration in property file. "
              "Using default setting!\n");
    EXPECT_EQ(logOf(false, [] { SetInstallConfiguration(Props({}).list, false); }), "");
}

TEST(SetInstallConfiguration, OnlyLockdownSetsTheFlagAndEveryOtherClearsIt)
{
    configurationOf(L"lockdown");
    EXPECT_TRUE(IS_LOCKDOWN);
    EXPECT_TRUE(isLockdownConfig());
    for (const wchar_t* word :
         {L"service", L"user", L"serial.multiuser", L"multiuser", L"userpb", L"Lockdown"}) {
        IS_LOCKDOWN = true;
        configurationOf(word);
        EXPECT_FALSE(IS_LOCKDOWN) << word;
        EXPECT_FALSE(isLockdownConfig());
    }
}

TEST(SetInstallConfiguration, TheCallerCanForceTheMultiUserService)
{
    EXPECT_EQ(configurationOf(L"user", true), 7);
    EXPECT_FALSE(IS_LOCKDOWN);
    EXPECT_EQ(configurationOf(L"lockdown", true), 7);
    EXPECT_TRUE(IS_LOCKDOWN);
    SetInstallConfiguration(Props({}).list, true);
    EXPECT_EQ(eConfig, 7);
    EXPECT_FALSE(IS_LOCKDOWN);
}

TEST(startsJvmDirectly, IsTrueForTheTwoServiceConfigurations)
{
    for (int configuration = 1; configuration <= 8; ++configuration) {
        eConfig = configuration;
        EXPECT_EQ(startsJvmDirectly(), configuration == 1 || configuration == 7) << configuration;
    }
}

TEST(getInstallID, IsTheProperty)
{
    for (int configuration : {CONFIG_USER, CONFIG_USERPB}) {
        eConfig = configuration;
        Props props({L"rcp.install.id", L"1234"});
        EXPECT_EQ(getInstallID(L"/nowhere/x", props.list),
                  findProperty(L"rcp.install.id", props.list));
        EXPECT_EQ(props.list.size(), 2U);
    }
}

TEST(getInstallID, TakesAnEmptyOneForPresent)
{
    eConfig = CONFIG_USER;
    Props props({L"rcp.install.id", L""});
    EXPECT_STREQ(getInstallID(L"/nowhere/x", props.list), L"");
}

TEST(getInstallID, EndsWithoutOneInEveryOtherConfiguration)
{
    for (int configuration = 1; configuration <= 7; ++configuration)
        EXPECT_TRUE(endsWith(
            [configuration] {
                eConfig = configuration;
                PropertyList none;
                errno = EACCES;
                getInstallID(L"/nowhere/x", none);
            },
            "QVMRL0016E: rcp.install.id is required for this configuration!", EACCES));
}

// Of the clock that the launcher reads: time() is some milliseconds behind it, at the turn of a second one second.
static long long secondsNow()
{
    const auto since = std::chrono::system_clock::now().time_since_epoch();
    return std::chrono::duration_cast<std::chrono::seconds>(since).count();
}

TEST(getInstallID, MakesOneUpFromTheTimeForUserpb)
{
    const TempDir dir;
    dir.write("velmora.properties", "a=b\n");
    eConfig = CONFIG_USERPB;
    Props props({L"a", L"b"});
    const long long before = secondsNow();
    const std::wstring id = getInstallID(dir.wide("velmora.properties"), props.list);
    const long long after = secondsNow();
    const long long made = std::stoll(id);
    EXPECT_LE(before, made);
    EXPECT_LE(made, after);
    EXPECT_EQ(id, std::to_wstring(made));
    EXPECT_EQ(texts(props.list), (Texts{L"a", L"b", L"rcp.install.id", id}));
    EXPECT_EQ(dir.read("velmora.properties"), "a=b\nrcp.install.id=" + std::to_string(made) + "\n");
}

TEST(getInstallID, WritesNothingBeforeTheLineSoALastLineWithoutAnEndSwallowsIt)
{
    const TempDir dir;
    dir.write("velmora.properties", "a=b");
    eConfig = CONFIG_USERPB;
    Props props({});
    const std::wstring id = getInstallID(dir.wide("velmora.properties"), props.list);
    EXPECT_EQ(dir.read("velmora.properties"),
              "a=brcp.install.id=" + std::string(id.begin(), id.end()) + "\n");
}

TEST(getInstallID, EndsWhenTheFileCannotBeOpened)
{
    const TempDir dir;
    EXPECT_TRUE(endsWith(
        [&] {
            eConfig = CONFIG_USERPB;
            Props props({});
            getInstallID(dir.wdir, props.list);
        },
        "QVMRL0017E: Could not open " + dir.dir + " to append rcp.install.id!", EISDIR));
}

TEST(getInstallID, EndsWhenTheLineCannotBeWritten)
{
    EXPECT_TRUE(endsWith(
        [] {
            eConfig = CONFIG_USERPB;
            Props props({});
            getInstallID(L"/dev/full", props.list);
        },
        "QVMRL0018E: Error while writing to /dev/full file.", ENOSPC));
}

static bool isOld(const char* userProperties, const wchar_t* installId)
{
    const TempDir dir;
    if (userProperties != nullptr)
        dir.write("rcpinstall.properties", userProperties);
    Props user({});
    return isOldRcpInstallId(installId, dir.wdir, user.list);
}

TEST(isOldRcpInstallId, IsTrueForAnotherId)
{
    EXPECT_TRUE(isOld("a=b\nrcp.install.id=old\n", L"new"));
    EXPECT_TRUE(isOld("rcp.install.id=new \n", L"New"));
    EXPECT_TRUE(isOld("rcp.install.id=new\n", L""));
}

TEST(isOldRcpInstallId, IsFalseForTheSameId)
{
    EXPECT_FALSE(isOld("rcp.install.id=new\n", L"new"));
    EXPECT_FALSE(isOld("rcp.install.id=new\nrcp.install.id=old\n", L"new"));
}

TEST(isOldRcpInstallId, IsFalseWithoutAFileOrAnId)
{
    EXPECT_FALSE(isOld(nullptr, L"new"));
    EXPECT_FALSE(isOld("", L"new"));
    EXPECT_FALSE(isOld("a=b\n", L"new"));
    EXPECT_FALSE(isOld("rcp.install.id=\n", L"new"));
}

TEST(isOldRcpInstallId, ConvertsTheSeparators)
{
    const TempDir dir;
    dir.write("c/rcpinstall.properties", "rcp.install.id=old\n");
    Props user({});
    EXPECT_TRUE(isOldRcpInstallId(L"new", dir.wdir + L"\\c", user.list));
}

TEST(isOldRcpInstallId, LeavesWhatWasRead)
{
    const TempDir dir;
    dir.write("rcpinstall.properties", "a=b\nrcp.install.id=same\n");
    Props user({});
    EXPECT_FALSE(isOldRcpInstallId(L"same", dir.wdir, user.list));
    EXPECT_STREQ(findProperty(L"a", user.list), L"b");
    EXPECT_STREQ(findProperty(L"rcp.install.id", user.list), L"same");
}

// The variant that is found when each exists, relative to the base.
static std::wstring variantFor(int configuration)
{
    const TempDir base;
    for (const char* place : {"config/muservice/", "config/user/", "config/pbuilder/", "config/"})
        base.write(std::string(place) + "config.ini", "");
    eConfig = configuration;
    return getCoreFileLocation(base.wdir, L"config.ini").substr(base.wdir.size());
}

TEST(getCoreFileLocation, PrefersTheVariantOfTheConfiguration)
{
    EXPECT_EQ(variantFor(CONFIG_LOCKDOWN), L"/config/user/config.ini");
    EXPECT_EQ(variantFor(CONFIG_USER), L"/config/user/config.ini");
    EXPECT_EQ(variantFor(CONFIG_MULTIUSER), L"/config/user/config.ini");
    EXPECT_EQ(variantFor(CONFIG_MU_SERVICE), L"/config/muservice/config.ini");
    EXPECT_EQ(variantFor(CONFIG_USERPB), L"/config/pbuilder/config.ini");
}

TEST(getCoreFileLocation, HasTwoSlashesWhereTheConfigurationHasNoVariant)
{
    EXPECT_EQ(variantFor(CONFIG_SERVICE), L"/config//config.ini");
    EXPECT_EQ(variantFor(CONFIG_SERIAL_MULTIUSER), L"/config//config.ini");
    EXPECT_EQ(variantFor(CONFIG_OTHER), L"/config//config.ini");
}

TEST(getCoreFileLocation, IsInTheBaseWhenThereIsNoVariant)
{
    const TempDir base;
    base.write("config/muservice/config.ini", "");
    eConfig = CONFIG_USER;
    EXPECT_EQ(getCoreFileLocation(base.wdir + L"\\x", L"config.ini"), base.wdir + L"/x/config.ini");
    EXPECT_EQ(getCoreFileLocation(base.wdir, L"config.ini"), base.wdir + L"/config.ini");
}
