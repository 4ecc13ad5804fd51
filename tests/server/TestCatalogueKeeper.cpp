#include "server/catalogues/CatalogueKeeper.h"
#include "tests/server/FakeMachine.h"
#include "tests/support/ManualMainLoop.h"

#include <gmock/gmock.h>

using namespace tessel;
using testing::ElementsAre;

namespace {

/// A keeper whose jobs run when told to.
struct CatalogueKeeperTest : testing::Test {
    void runOne() {
        const Job job = std::move(jobs.front());
        jobs.pop_front();
        job()();
    }
    void runAll() {
        while (!jobs.empty())
            runOne();
    }
    void refresh() {
        keeper.refresh();
        runAll();
    }
    void change(const std::string& icon) {
        machine.setApplications({{.id = "b", .title = "b", .icon = icon}});
        machine.changed();
    }

    FakeMachine machine{"one"};
    std::deque<Job> jobs;
    int changes = 0;
    CatalogueKeeper keeper{machine, [this](Job job) { jobs.push_back(std::move(job)); },
                           [this] { ++changes; }};
};

} // namespace

TEST_F(CatalogueKeeperTest, ShowsTheListFirstAndTheIconsWhenTheyAreRead) {
    keeper.refresh();
    keeper.refresh();
    runOne();
    EXPECT_EQ(changes, 1);
    EXPECT_EQ(keeper.catalogue(), *machine.content);
    EXPECT_TRUE(keeper.icons().empty());
    runAll();
    EXPECT_EQ(changes, 2);
    EXPECT_EQ(keeper.icons(), machine.icons);
    EXPECT_EQ(keeper.index().find("b"), &keeper.catalogue().programs[1]);
    EXPECT_THAT(machine.iconsAsked, ElementsAre("red")) << "once, however many rows show it";
}

TEST_F(CatalogueKeeperTest, ReadsAgainOnlyWhatHasChanged) {
    refresh();
    refresh();
    EXPECT_EQ(machine.readings, 1);
    machine.changed();
    runAll();
    EXPECT_EQ(machine.readings, 2);
    EXPECT_EQ(changes, 2) << "read, found to be the same";

    machine.icons = {{"blue", plist::Array{2}}};
    change("blue");
    runOne();
    EXPECT_EQ(changes, 2) << "there is something to show already";
    machine.changed();
    machine.changed();
    runAll();
    EXPECT_EQ(changes, 3);
    EXPECT_EQ(machine.readings, 4) << "what changed during a reading is read once after it";
    EXPECT_EQ(keeper.icons(), machine.icons);
}

TEST_F(CatalogueKeeperTest, KeepsWhatItHasWhenAReadingFails) {
    refresh();
    const Catalogue before = *std::exchange(machine.content, std::nullopt);
    machine.changed();
    runAll();
    EXPECT_EQ(keeper.catalogue(), before);
    machine.setApplications({});
    refresh();
    EXPECT_TRUE(keeper.catalogue().programs.empty()) << "asked again, it reads again";
}

TEST_F(CatalogueKeeperTest, LooksAgainForMissingIconsButNotForEver) {
    machine.icons.clear();
    refresh();
    refresh();
    EXPECT_EQ(changes, 2) << "nothing found, nothing to tell";
    machine.icons["red"] = plist::Array{1};
    refresh();
    EXPECT_EQ(changes, 3);
    EXPECT_EQ(keeper.icons(), machine.icons);
    EXPECT_EQ(machine.readings, 1);

    change("never");
    for (int i = 0; i < 10; ++i)
        refresh();
    EXPECT_EQ(std::ranges::count(machine.iconsAsked, "never"), 4);
}

TEST(Worker, AnswersInOrderOnTheMainThreadAndNotAfterItsEnd) {
    ManualMainLoop loop;
    std::vector<int> answers;
    const auto main = std::this_thread::get_id();
    std::optional<Worker> worker(loop);
    for (int number = 1; number <= 3; ++number) {
        worker->run([&, number] {
            EXPECT_NE(std::this_thread::get_id(), main);
            return [&, number] {
                EXPECT_EQ(std::this_thread::get_id(), main);
                answers.push_back(number);
                if (number == 2) worker.reset();
            };
        });
    }
    EXPECT_TRUE(loop.runUntil([&] { return !worker; }));
    loop.runPending();
    EXPECT_THAT(answers, ElementsAre(1, 2));
}
