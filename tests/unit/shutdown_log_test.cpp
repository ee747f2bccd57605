#include "platform/linux/shutdown_log.h"

#include "tests/unit/support.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <cstdlib>
#include <ctime>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

// The lines "Started <first>" to "Started <last>".
static std::string history(int first, int last)
{
    std::string lines;
    for (int i = first; i <= last; ++i)
        lines += "Started " + std::to_string(i) + "\n";
    return lines;
}

static std::string startedAt(time_t now)
{
    struct tm local = {};
    char text[64] = "";
    localtime_r(&now, &local);
    return std::string("Started ") + asctime_r(&local, text);
}

// What becomes of a history with these bytes.
static std::string truncated(const std::string& bytes)
{
    TempDir dir;
    dir.write("shutdown.log", bytes);
    truncateShutdownLog(dir.wdir);
    EXPECT_FALSE(dir.has("shutdown.log.new"));
    return dir.read("shutdown.log");
}

TEST(updateShutdownLog, WritesTheLocalTimeOfTheStart)
{
    setenv("TZ", "XYZ-5:30", 1);
    TempDir dir;
    const time_t before = time(nullptr);
    updateShutdownLog(dir.wdir);
    const time_t after = time(nullptr);
    const std::string line = dir.read("shutdown.log");
    bool found = false;
    for (time_t now = before; now <= after; ++now)
        found = found || line == startedAt(now);
    EXPECT_TRUE(found) << line;
    // Started Mon Oct 24 09:30:15 2011, and a line end.
    EXPECT_EQ(line.size(), 8u + 25u);
    EXPECT_EQ(line.back(), '\n');
}

TEST(updateShutdownLog, AddsALineToTheOthers)
{
    TempDir dir;
    dir.write("shutdown.log", "Started before\n");
    updateShutdownLog(dir.wdir);
    const std::string lines = dir.read("shutdown.log");
    EXPECT_EQ(lines.substr(0, 23), "Started before\nStarted ");
    EXPECT_EQ(lines.size(), 15u + 33u);
}

TEST(updateShutdownLog, TurnsBackslashes)
{
    TempDir dir;
    dir.makeDir("logs");
    updateShutdownLog(dir.wdir + L"\\logs");
    EXPECT_TRUE(dir.has("logs/shutdown.log"));
}

TEST(updateShutdownLog, EndsWhenTheFileCannotBeOpened)
{
    TempDir dir;
    EXPECT_TRUE(endsWith(
        [&] { updateShutdownLog(dir.wdir + L"/no"); },
        "QVMRL0098E: Could not open " + dir.path("no/shutdown.log") + " for writing!", ENOENT));
    dir.makeDir("shutdown.log");
    EXPECT_TRUE(endsWith([&] { updateShutdownLog(dir.wdir); },
                         "QVMRL0098E: Could not open " + dir.path("shutdown.log") + " for writing!",
                         EISDIR));
}

TEST(updateShutdownLog, EndsWhenTheDiskIsFull)
{
    TempDir dir;
    ASSERT_EQ(symlink("/dev/full", dir.path("shutdown.log").c_str()), 0);
    EXPECT_TRUE(endsWith([&] { updateShutdownLog(dir.wdir); },
                         "QVMRL0118E: Error writing to " + dir.path("shutdown.log") + " file.",
                         ENOSPC));
}

TEST(truncateShutdownLog, A199LinesStay)
{
    EXPECT_EQ(truncated(history(1, 199)), history(1, 199));
    EXPECT_EQ(truncated(""), "");
    EXPECT_EQ(truncated("Started 1"), "Started 1");
}

TEST(truncateShutdownLog, DeliberatelyKeeps101Of200Lines)
{
    EXPECT_EQ(truncated(history(1, 200)), history(100, 200));
}

TEST(truncateShutdownLog, KeepsTheLast101Lines)
{
    EXPECT_EQ(truncated(history(1, 201)), history(101, 201));
    EXPECT_EQ(truncated(history(1, 400)), history(300, 400));
}

TEST(truncateShutdownLog, LastLineNeedsNoEndAndGetsOne)
{
    EXPECT_EQ(truncated(history(1, 199) + "Started 200"), history(100, 200));
    EXPECT_EQ(truncated(history(1, 198) + "Started 199"), history(1, 198) + "Started 199");
}

TEST(truncateShutdownLog, EmptyLinesDoNotCount)
{
    EXPECT_EQ(truncated(history(1, 100) + "\n\n\n" + history(101, 199)),
              history(1, 100) + "\n\n\n" + history(101, 199));
    EXPECT_EQ(truncated(history(1, 150) + "\n\n" + history(151, 200) + "\n"), history(100, 200));
}

TEST(truncateShutdownLog, ReadThatFailsEndsTheCount)
{
    EXPECT_EQ(truncated("\n" + history(1, 300)), "\n" + history(1, 300));
}

TEST(truncateShutdownLog, DirectoryIsNoHistory)
{
    TempDir dir;
    dir.write("shutdown.log/mine", "x");
    truncateShutdownLog(dir.wdir);
    EXPECT_EQ(dir.read("shutdown.log/mine"), "x");
}

TEST(truncateShutdownLog, LineEndAtTheHeadEndsTheCountOfALongHistory)
{
    EXPECT_EQ(truncated("\n" + history(1, 3000)), "\n" + history(1, 3000));
}

TEST(truncateShutdownLog, DecisionABlockThatIsNotFullIsTheLast)
{
    TempDir dir;
    const std::string path = dir.path("shutdown.log");
    ASSERT_EQ(mkfifo(path.c_str(), 0600), 0);
    // With the other end open, whoever reads on waits.
    const int fd = open(path.c_str(), O_RDWR | O_CLOEXEC);
    ASSERT_EQ(write(fd, "Started\nStarted\n", 16), 16);
    truncateShutdownLog(dir.wdir);
    close(fd);
    struct stat entry = {};
    ASSERT_EQ(lstat(path.c_str(), &entry), 0);
    EXPECT_TRUE(S_ISFIFO(entry.st_mode));
}

TEST(truncateShutdownLog, LineOf2024BytesIsOne)
{
    const std::string longest(2024, 'x');
    EXPECT_EQ(truncated(history(1, 198) + longest + "\n"), history(1, 198) + longest + "\n");
    EXPECT_EQ(truncated(history(1, 199) + longest + "\n"), history(100, 199) + longest + "\n");
}

TEST(truncateShutdownLog, LongerLineCountsInPieces)
{
    const std::string longest(2024, 'x');
    EXPECT_EQ(truncated(history(1, 198) + longest + "y\n"), history(100, 198) + longest + "\ny\n");
    // 197 lines and three pieces.
    EXPECT_EQ(truncated(history(1, 197) + longest + longest + "y\n"),
              history(100, 197) + longest + "\n" + longest + "\ny\n");
}

TEST(truncateShutdownLog, WhiteSpaceBehindALineBelongsToItsEnd)
{
    const std::string blanks = " \t\n\v\f\r\n  ";
    EXPECT_EQ(truncated(history(1, 198) + blanks + "Started 199\n" + blanks),
              history(1, 198) + blanks + "Started 199\n" + blanks);
    EXPECT_EQ(truncated(history(1, 199) + blanks + "Started 200\n" + blanks), history(100, 200));
    // The blanks behind a line's first 2024 bytes, too.
    const std::string longest(2024, 'x');
    EXPECT_EQ(truncated(history(1, 198) + longest + " \t\n"), history(1, 198) + longest + " \t\n");
    EXPECT_EQ(truncated(history(1, 198) + longest + " \ty\n"),
              history(100, 198) + longest + "\ny\n");
}

TEST(truncateShutdownLog, BlanksAtTheHeadAreALine)
{
    EXPECT_EQ(truncated(" \n" + history(1, 198)), " \n" + history(1, 198));
    EXPECT_EQ(truncated(" \n" + history(1, 199)), history(99, 199));
    EXPECT_EQ(truncated(std::string("\0", 1) + "\n" + history(1, 199)), history(99, 199));
}

TEST(truncateShutdownLog, CountsOverTheBlocksThatAreRead)
{
    // Lines of 41 bytes with their ends, so that a line end falls on each place of a block.
    std::string lines;
    for (int i = 0; i < 199; ++i)
        lines += std::string(40, 'x') + "\n";
    EXPECT_EQ(truncated(lines), lines);
    EXPECT_EQ(truncated(lines + "y").substr(0, 41), std::string(40, 'x') + "\n");
    EXPECT_EQ(truncated(lines + "y").size(), 100 * 41 + 2u);
}

TEST(truncateShutdownLog, BytesAreTheLocales)
{
    std::string lines;
    for (int i = 0; i < 101; ++i)
        lines += "Started \xc3\xa9\xe2\x82\xac\n";
    EXPECT_EQ(truncated(history(1, 99) + lines), lines);
}

TEST(truncateShutdownLog, LeftoverOfAnEarlierCutIsOverwritten)
{
    TempDir dir;
    dir.write("shutdown.log", history(1, 200));
    dir.write("shutdown.log.new", history(1, 1000));
    truncateShutdownLog(dir.wdir);
    EXPECT_EQ(dir.read("shutdown.log"), history(100, 200));
    EXPECT_FALSE(dir.has("shutdown.log.new"));
}

TEST(truncateShutdownLog, LogsWhenThereIsNoFile)
{
    TempDir dir;
    EXPECT_EQ(logOf(false, [&] { truncateShutdownLog(dir.wdir + L"\\logs"); }),
              "QVMRL0138E: Unable to open file.\"" + dir.path("logs/shutdown.log") + "\"\n");
}

TEST(truncateShutdownLog, LogsWhenTheNewFileCannotBeOpened)
{
    TempDir dir;
    dir.write("shutdown.log", history(1, 200));
    dir.makeDir("shutdown.log.new");
    EXPECT_EQ(logOf(false, [&] { truncateShutdownLog(dir.wdir); }),
              "QVMRL0105E: Unable to open file for writing.\"" + dir.path("shutdown.log.new") +
                  "\"\n");
    EXPECT_EQ(dir.read("shutdown.log"), history(1, 200));
}

TEST(truncateShutdownLog, LogsWhenTheDiskIsFull)
{
    TempDir dir;
    dir.write("shutdown.log", history(1, 200));
    ASSERT_EQ(symlink("/dev/full", dir.path("shutdown.log.new").c_str()), 0);
    ASSERT_EQ(logOf(false, [&] { truncateShutdownLog(dir.wdir); }),
              "QVMRL0137E: Error while truncating file.\"" + dir.path("shutdown.log") + "\"\n");
    EXPECT_EQ(dir.read("shutdown.log"), history(1, 200));
}

TEST(truncateShutdownLog, LogsWhenAWriteFailsBeforeTheEnd)
{
    // Long lines, so that the stream is full before the last one.
    TempDir dir;
    std::string lines;
    for (int i = 0; i < 250; ++i)
        lines += std::string(1000, 'x') + "\n";
    dir.write("shutdown.log", lines);
    ASSERT_EQ(symlink("/dev/full", dir.path("shutdown.log.new").c_str()), 0);
    ASSERT_EQ(logOf(false, [&] { truncateShutdownLog(dir.wdir); }),
              "QVMRL0137E: Error while truncating file.\"" + dir.path("shutdown.log") + "\"\n");
    EXPECT_EQ(dir.read("shutdown.log"), lines);
}

TEST(truncateShutdownLog, SaysNothingWhenAllIsWell)
{
    TempDir dir;
    dir.write("shutdown.log", history(1, 200));
    EXPECT_EQ(logOf(true, [&] { truncateShutdownLog(dir.wdir); }), "");
}

TEST(doShutdownLogUpdate, AddsALineThenCuts)
{
    TempDir dir;
    dir.write("logs/shutdown.log", history(1, 199));
    doShutdownLogUpdate(dir.wdir);
    const std::string lines = dir.read("logs/shutdown.log");
    const std::string kept = history(100, 199);
    EXPECT_EQ(lines.substr(0, kept.size()), kept);
    EXPECT_EQ(lines.size(), kept.size() + 33u);
}

TEST(doShutdownLogUpdate, A198LinesBecome199)
{
    TempDir dir;
    dir.write("logs/shutdown.log", history(1, 198));
    doShutdownLogUpdate(dir.wdir);
    const std::string lines = dir.read("logs/shutdown.log");
    EXPECT_EQ(lines.substr(0, history(1, 198).size()), history(1, 198));
    EXPECT_EQ(lines.size(), history(1, 198).size() + 33u);
}

TEST(doShutdownLogUpdate, EndsWithoutALogDirectory)
{
    TempDir dir;
    EXPECT_TRUE(endsWith(
        [&] { doShutdownLogUpdate(dir.wdir); },
        "QVMRL0098E: Could not open " + dir.path("logs/shutdown.log") + " for writing!", ENOENT));
}

TEST(truncateShutdownLog, KeepsNoStreamOpenWhenTheNewFileCannotBeOpened)
{
    TempDir dir;
    dir.write("shutdown.log", history(1, 200));
    dir.makeDir("shutdown.log.new");
    logOf(false, [&] {
        const int before = dup(0);
        close(before);
        truncateShutdownLog(dir.wdir);
        const int after = dup(0);
        close(after);
        EXPECT_EQ(after, before);
    });
}

TEST(truncateShutdownLog, APieceThatEndsInsideACharacterIsABlankLine)
{
    TempDir dir;
    // The 2024th byte of the line is the first of the two of an e with an accent.
    dir.write("shutdown.log", history(1, 199) + std::string(2023, 'x') + "\xc3\xa9tail\n");
    truncateShutdownLog(dir.wdir);
    // 201 lines: the last 101 begin with line 101, and the last two cannot be converted.
    EXPECT_EQ(dir.read("shutdown.log"), history(101, 199) + "\n\n");
}
