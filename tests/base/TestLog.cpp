#include "lib/base/CheckedMalloc.h"
#include "lib/base/Log.h"
#include "tests/support/ScratchHome.h"

#include <csignal>
#include <cstdint>
#include <gtest/gtest.h>
#include <regex>
#include <sstream>
#include <thread>
#include <vector>

namespace fs = std::filesystem;

namespace {

void put(const std::string& path, const std::string& text) {
    fs::create_directories(fs::path(path).parent_path());
    std::ofstream(path) << text;
}

TEST(Log, WritesDatedEntriesIntoTheUsersLibrary) {
    const ScratchHome home;
    Log("%s: unknown icon format '%s'\n", "here", "rgb");
    Warning("%s\n", std::string(5000, 'x').c_str());

    const fs::path log = home.path() / "Library/Logs/Corvane Tessel/corvane-tesselStartMenu";
    EXPECT_EQ(LogFilePath(-1), log.string() + ".log");
    EXPECT_EQ(LogFilePath(3), log.string() + "-2.log");
    const std::regex entries("[A-Z][a-z]{2} [ 123][0-9] [0-9]{2}:[0-9]{2}:[0-9]{2}\\.[0-9]{3}: "
                             "here: unknown icon format 'rgb'\n[^\n]*: x{5000}\n");
    EXPECT_TRUE(std::regex_match(ScratchHome::log(), entries)) << ScratchHome::log();
}

TEST(Log, EntriesOfManyThreadsStayWhole) {
    const ScratchHome home;
    std::vector<std::jthread> threads;
    for (char letter : {'a', 'b', 'c', 'd'})
        threads.emplace_back([letter] {
            for (int i = 0; i < 200; ++i)
                Log("%s\n", std::string(300, letter).c_str());
        });
    threads.clear();
    std::istringstream lines(ScratchHome::log());
    int count = 0;
    for (std::string line; std::getline(lines, line); ++count)
        EXPECT_EQ(line.substr(21), std::string(300, line.back()));
    EXPECT_EQ(count, 800);
}

TEST(Log, DropsWhatCannotBeWritten) {
    const ScratchHome home;
    put(home.path() / "Library", "a file where the directory should be");
    Log("lost\n");
    EXPECT_EQ(ScratchHome::contents(home.path() / "Library"), "a file where the directory should be");
}

TEST(Log, RotationShiftsByOneForgetsTheOldestAndKeepsGaps) {
    const std::pair<const char*, const char*> cases[] = {
        {"----", "----"}, {"0123", "-012"}, {"0-2-", "-0-2"}, {"0---", "-0--"}};
    for (const auto& [before, after] : cases) {
        const ScratchHome home;
        for (int index = 0; index <= 3; ++index)
            if (before[index] != '-') put(LogFilePath(index), {before[index]});
        std::string found;
        RotateLogFiles();
        for (int index = 0; index <= 3; ++index)
            found += fs::exists(LogFilePath(index)) ? ScratchHome::log(index) : "-";
        EXPECT_EQ(found, after);
    }
}

TEST(Log, OfAProgramThatStartsOftenRotatesWhenItIsLarge) {
    const ScratchHome home;
    for (const std::size_t size : {1000U, 1U << 20}) {
        put(LogFilePath(0), std::string(size, 'x'));
        RotateLargeLogFile();
        EXPECT_EQ(fs::exists(LogFilePath(1)), size > 1000);
        EXPECT_EQ(fs::exists(LogFilePath(0)), size == 1000);
    }
}

TEST(CheckedMalloc, PanicsOnlyWhenThereIsNoMemory) {
    const ScratchHome home;
    // NOLINTBEGIN(*-no-malloc)
    std::free(CheckedMalloc(-1, 0, "file", 1));
    std::free(CheckedMalloc(-1, 16, "file", 1));
    // NOLINTEND(*-no-malloc)
    EXPECT_FALSE(fs::exists(LogFilePath(0)));

    const std::size_t tooMuch = SIZE_MAX / 4;
    EXPECT_EXIT((void)CheckedMalloc(-1, tooMuch, "a.cpp", 7), testing::KilledBySignal(SIGABRT), "");
    EXPECT_EXIT((void)CheckedMalloc(42, tooMuch, "b.cpp", 8), testing::KilledBySignal(SIGABRT), "");
    const std::string failure = ": Unrecoverable memory allocation failure at ";
    for (const auto& text : {failure + "a.cpp:7\n", failure + "b.cpp:8.  Bug number: 42\n"})
        EXPECT_EQ(ScratchHome::logged(text), 1) << ScratchHome::log();
    EXPECT_EQ(ScratchHome::logged("*** Panic: Backtrace\n"), 2);
}

} // namespace
