#include "launcher/command/jvm_executable.h"

#include "launcher/command/launch_command.h"
#include "launcher/user_area/installation.h"
#include "platform/linux/lock_file.h"
#include "tests/unit/fixtures.h"

#include <cerrno>

namespace {
// A directory "bin" with these executables.
struct Bin {
    Bin(std::initializer_list<const char*> names)
    {
        eConfig = CONFIG_USER;
        for (const char* name : names)
            dir.write(std::string("bin/") + name, "");
    }

    std::wstring at(const std::wstring& name) const
    {
        return dir.wdir + L"/bin/" + name;
    }

    // The name of the executable that stands behind "-vm" for this one, with this line.
    std::wstring chosen(const std::wstring& vm, const wchar_t* option,
                        std::initializer_list<const wchar_t*> launcherProps = {}) const
    {
        const Props props({L"vm", at(vm).c_str()});
        const Props launcher(launcherProps);
        const Line line({L"velmora", option});
        bool isLibrary = true;
        const Texts command = commandOf([&] {
            isLibrary = addVmToCommandLine(props.list, launcher.list, line.argc, line.argv);
        });
        EXPECT_FALSE(isLibrary);
        EXPECT_EQ(command.size(), 2U);
        EXPECT_EQ(command.at(0), L"-vm");
        return command.at(1).substr(at(L"").size());
    }

    TempDir dir;
};
} // namespace

TEST(isJavaw, TakesTheConsoleVariant)
{
    const Bin bin({"java"});
    std::wstring vm = bin.at(L"javaw");
    EXPECT_TRUE(isJavaw(vm, L"javaw", L"java"));
    EXPECT_EQ(vm, bin.at(L"java"));
}

TEST(isJavaw, ChangesNothingForAnotherEnding)
{
    const Bin bin({"java"});
    for (const wchar_t* name : {L"java", L"javaw.exe", L"javawx", L"JAVAW"}) {
        std::wstring vm = bin.at(name);
        EXPECT_FALSE(isJavaw(vm, L"javaw", L"java"));
        EXPECT_EQ(vm, bin.at(name));
    }
    std::wstring shorter = L"avaw";
    EXPECT_FALSE(isJavaw(shorter, L"javaw", L"java"));
}

TEST(isJavaw, EndsWhenTheVariantDoesNotExist)
{
    const Bin bin({"javaw"});
    std::wstring vm = bin.at(L"javaw");
    EXPECT_TRUE(endsWith(
        [&] { isJavaw(vm, L"javaw", L"java"); },
        "QVMRL0003E: Specified vm (" + bin.dir.path("bin/java") + ") does not exist!", ENOENT));
}

TEST(replaceJavaExecutableName, TakesAnotherNameThatExists)
{
    const Bin bin({"myjava"});
    std::wstring vm = bin.at(L"java");
    EXPECT_TRUE(replaceJavaExecutableName(vm, L"java", L"myjava"));
    EXPECT_EQ(vm, bin.at(L"myjava"));
}

TEST(replaceJavaExecutableName, KeepsThePathElse)
{
    const Bin bin({"java"});
    std::wstring vm = bin.at(L"java");
    EXPECT_FALSE(replaceJavaExecutableName(vm, L"java", L"myjava"));
    EXPECT_FALSE(replaceJavaExecutableName(vm, L"javaw", L"java"));
    EXPECT_EQ(vm, bin.at(L"java"));
}

TEST(addVmToCommandLine, PassesTheVmAsTwoWordsInTheNativeKind)
{
    for (int configuration : {CONFIG_LOCKDOWN, CONFIG_USER, CONFIG_SERIAL_MULTIUSER, CONFIG_OTHER,
                              CONFIG_MULTIUSER, CONFIG_USERPB}) {
        eConfig = configuration;
        EXPECT_EQ(commandOf([] {
                      const Props props({L"vm", L"/jvm/java"});
                      const Line line({L"velmora"});
                      addArgToCommandLine(L"before", true);
                      EXPECT_FALSE(
                          addVmToCommandLine(props.list, PropertyList(), line.argc, line.argv));
                  }),
                  (Texts{L"before", L"-vm", L"/jvm/java"}));
    }
}

TEST(addVmToCommandLine, BeginsTheCommandWithTheVmInTheDirectKind)
{
    for (int configuration : {CONFIG_SERVICE, CONFIG_MU_SERVICE}) {
        eConfig = configuration;
        EXPECT_EQ(commandOf([] {
                      const Props props({L"vm", L"/unused"});
                      const Line line({L"velmora", L"-vm", L"/jvm/java"});
                      addArgToCommandLine(L"dropped", true);
                      EXPECT_FALSE(
                          addVmToCommandLine(props.list, PropertyList(), line.argc, line.argv));
                  }),
                  (Texts{L"/jvm/java"}));
    }
}

static Texts vmWords(std::initializer_list<const wchar_t*> properties, const Line& line,
                     bool isLibrary = false)
{
    eConfig = CONFIG_USER;
    return commandOf([&] {
        const Props props(properties);
        EXPECT_EQ(addVmToCommandLine(props.list, PropertyList(), line.argc, line.argv), isLibrary);
    });
}

TEST(addVmToCommandLine, EmitsNothingWithoutAVm)
{
    EXPECT_EQ(vmWords({}, Line({L"velmora"})), Texts());
}

TEST(addVmToCommandLine, TakesAnEmptyPropertyForSet)
{
    EXPECT_EQ(vmWords({L"vm", L""}, Line({L"velmora"})), (Texts{L"-vm", L""}));
}

TEST(addVmToCommandLine, UsesThePathAsItIsWritten)
{
    EXPECT_EQ(vmWords({L"vm", L"${rcp.home}\\jvm/${prop.x}"}, Line({L"velmora"})),
              (Texts{L"-vm", L"${rcp.home}\\jvm/${prop.x}"}));
}

TEST(addVmToCommandLine, EndsForAVmOptionWithoutAPath)
{
    for (const Texts& given : {Texts{L"velmora", L"-vm"}, Texts{L"velmora", L"-vm", L""}})
        EXPECT_TRUE(endsWith(
            [&] {
                errno = EACCES;
                vmWords({L"vm", L"/jvm"}, Line(given));
            },
            "QVMRL0002E: vm must be specified with -vm argument!", EACCES));
}

TEST(addVmToCommandLine, WaitModeComesWithItsWord)
{
    EXPECT_FALSE(isWaitMode());
    vmWords({}, Line({L"velmora", L"-velmorawait"}));
    EXPECT_FALSE(isWaitMode());
    vmWords({}, Line({L"velmora", L"-velmoraWait"}));
    EXPECT_TRUE(isWaitMode());
}

TEST(addVmToCommandLine, TakesTheConsoleVariantOfEachNameForAConsole)
{
    const Bin bin({"java", "qv", "quillon"});
    for (const wchar_t* option : {L"-console", L"-consoleLog"}) {
        EXPECT_EQ(bin.chosen(L"javaw", option), L"java");
        EXPECT_EQ(bin.chosen(L"qvw", option), L"qv");
        EXPECT_EQ(bin.chosen(L"quillonw", option), L"quillon");
        EXPECT_EQ(bin.chosen(L"java", option), L"java");
        EXPECT_EQ(bin.chosen(L"otherw", option), L"otherw");
    }
}

TEST(addVmToCommandLine, FindsTheConsoleVariantBehindBackslashesAndKeepsThem)
{
    const Bin bin({"java"});
    const std::wstring windowed = bin.dir.wdir + L"\\bin\\javaw";
    EXPECT_EQ(vmWords({L"vm", windowed.c_str()}, Line({L"velmora", L"-console"})),
              (Texts{L"-vm", bin.dir.wdir + L"\\bin\\java"}));
}

TEST(addVmToCommandLine, KeepsTheWindowedVariantWithoutAConsole)
{
    const Bin bin({"java", "qv", "quillon"});
    EXPECT_EQ(bin.chosen(L"javaw", L"-Console"), L"javaw");
    EXPECT_EQ(bin.chosen(L"qvw", L"-x"), L"qvw");
}

TEST(addVmToCommandLine, EndsWhenTheConsoleVariantIsMissing)
{
    const Bin bin({"javaw"});
    EXPECT_TRUE(endsWith(
        [&] { bin.chosen(L"javaw", L"-console"); },
        "QVMRL0003E: Specified vm (" + bin.dir.path("bin/java") + ") does not exist!", ENOENT));
}

TEST(addVmToCommandLine, RenamesTheConsoleExecutable)
{
    const Bin bin({"java", "myjava"});
    for (const wchar_t* name : {L"java", L"qv", L"quillon"})
        EXPECT_EQ(bin.chosen(name, L"-x", {L"java.exe.name.linux", L"myjava"}), L"myjava");
    EXPECT_EQ(bin.chosen(L"javaw", L"-x", {L"java.exe.name.linux", L"myjava"}), L"javaw");
    EXPECT_EQ(bin.chosen(L"java", L"-x", {L"java.exe.name", L"myjava"}), L"java");
}

TEST(addVmToCommandLine, RenamesTheWindowedExecutable)
{
    const Bin bin({"javaw", "myjavaw"});
    for (const wchar_t* name : {L"javaw", L"qvw", L"quillonw"})
        EXPECT_EQ(bin.chosen(name, L"-x", {L"javaw.exe.name.linux", L"myjavaw"}), L"myjavaw");
    EXPECT_EQ(bin.chosen(L"java", L"-x", {L"javaw.exe.name.linux", L"myjavaw"}), L"java");
}

TEST(addVmToCommandLine, RenamesOnceThoughTheNewNameEndsLikeAnotherOldOne)
{
    const Bin bin({"myqv", "mymyqv", "myqvw", "mymyqvw"});
    EXPECT_EQ(bin.chosen(L"java", L"-x", {L"java.exe.name.linux", L"myqv"}), L"myqv");
    EXPECT_EQ(bin.chosen(L"javaw", L"-x", {L"javaw.exe.name.linux", L"myqvw"}), L"myqvw");
}

TEST(addVmToCommandLine, AnEmptyNewNameLeavesTheDirectory)
{
    const Bin bin({"java"});
    const Props props({L"vm", bin.at(L"java").c_str()});
    const Props launcher({L"java.exe.name.linux", L""});
    const Line line({L"velmora"});
    EXPECT_EQ(
        commandOf([&] { addVmToCommandLine(props.list, launcher.list, line.argc, line.argv); }),
        (Texts{L"-vm", bin.dir.wdir + L"/bin/"}));
}

TEST(addVmToCommandLine, KeepsTheVmWhenTheNewNameDoesNotExist)
{
    const Bin bin({"java"});
    EXPECT_EQ(bin.chosen(L"java", L"-x", {L"java.exe.name.linux", L"myjava"}), L"java");
}

TEST(addVmToCommandLine, RenamesBehindTheConsoleSwitch)
{
    const Bin bin({"java", "myjava"});
    EXPECT_EQ(bin.chosen(L"javaw", L"-console", {L"java.exe.name.linux", L"myjava"}), L"myjava");
}

TEST(addVmToCommandLine, RenamesTheRenamedWhenItEndsLikeAWindowedOne)
{
    const Bin bin({"myjavaw", "mythird"});
    EXPECT_EQ(bin.chosen(L"java", L"-x",
                         {L"java.exe.name.linux", L"myjavaw", L"javaw.exe.name.linux", L"third"}),
              L"mythird");
}

TEST(addVmToCommandLine, PassesALibraryOnAsItIs)
{
    for (const wchar_t* name : {L"/jvm/default.ee", L"/jvm/jvm.dll", L".ee"}) {
        EXPECT_EQ(vmWords({L"vm", name}, Line({L"velmora", L"-console"}), true),
                  (Texts{L"-vm", name}));
    }
    EXPECT_EQ(vmWords({L"vm", L"/jvm/java.EE"}, Line({L"velmora"})),
              (Texts{L"-vm", L"/jvm/java.EE"}));
}

TEST(addVmToCommandLine, DecisionANameShorterThanTheEndingIsNoLibrary)
{
    for (const wchar_t* name : {L"jvm", L"vm", L"ee", L"dll", L"x.e"})
        EXPECT_EQ(vmWords({L"vm", name}, Line({L"velmora"}), false), (Texts{L"-vm", name}));
}

TEST(addVmToCommandLine, MakesALibraryTheProgramOfAService)
{
    eConfig = CONFIG_SERVICE;
    const Props props({L"vm", L"/jvm/default.ee"});
    const Line line({L"velmora"});
    bool isLibrary = false;
    EXPECT_EQ(commandOf([&] {
                  isLibrary = addVmToCommandLine(props.list, PropertyList(), line.argc, line.argv);
              }),
              (Texts{L"/jvm/default.ee"}));
    EXPECT_TRUE(isLibrary);
}
