#include "launcher/user_area/first_launch.h"

#include "tests/unit/fixtures.h"

#include <cerrno>
#include <filesystem>

static const char* const MESSAGE = "QVMRL0083E: Unable to create %ls directory.";

TEST(makeUserDirectory, LeavesADirectoryAloneAndMarksNothing)
{
    const TempDir dir;
    userFirstLaunch = false;
    makeUserDirectory(dir.wdir, MESSAGE);
    EXPECT_FALSE(userFirstLaunch);
}

TEST(makeUserDirectory, MakesEveryLevelAndMarksTheFirstLaunch)
{
    const TempDir dir;
    userFirstLaunch = false;
    makeUserDirectory(dir.wdir + L"\\a\\b/c", MESSAGE);
    EXPECT_TRUE(std::filesystem::is_directory(dir.path("a/b/c")));
    EXPECT_TRUE(userFirstLaunch);
    userFirstLaunch = false;
}

TEST(makeUserDirectory, EndsWithTheGivenMessageWhenAFileIsInTheWay)
{
    const TempDir dir;
    dir.write("file", "");
    EXPECT_TRUE(endsWith([&] { makeUserDirectory(dir.wide("file"), MESSAGE); },
                         "QVMRL0083E: Unable to create " + dir.path("file") + " directory.",
                         EEXIST));
    EXPECT_TRUE(endsWith([&] { makeUserDirectory(dir.wide("file/a"), "QVMRL0039E: %ls!"); },
                         "QVMRL0039E: " + dir.path("file/a") + "!", ENOTDIR));
}

TEST(makeUserDirectory, TakesALinkToADirectoryForNone)
{
    const TempDir dir;
    dir.makeDir("real");
    std::filesystem::create_symlink(dir.path("real"), dir.path("link"));
    EXPECT_TRUE(endsWith([&] { makeUserDirectory(dir.wide("link"), MESSAGE); },
                         "QVMRL0083E: Unable to create " + dir.path("link") + " directory.",
                         EEXIST));
}
