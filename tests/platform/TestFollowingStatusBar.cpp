#include "platform/linux/FollowingStatusBar.h"
#include "tests/support/ManualMainLoop.h"

#include <gtest/gtest.h>

namespace {

struct NoView final : platform::StatusItemView {
    KXSize frameSize() const override { return {30, 22}; }
    void draw(QPainter&, KXSize) override {}
    void mouseDown() override {}
    void rightMouseDown() override {}
    std::string toolTip() const override { return {}; }
};

/// Writes down when an item appears in it (its letter) and goes (the letter with a minus).
struct RecordingBar final : platform::HostedStatusBar {
    struct Item final : platform::StatusItem {
        explicit Item(RecordingBar& itsBar)
            : bar(itsBar) {}
        ~Item() override { bar.record += std::string("-") + bar.letter + " "; }
        void setNeedsDisplay() override { bar.record += std::string("draw ") + bar.letter + " "; }
        KXRect frame() const override { return {1, 2, 3, 4}; }
        RecordingBar& bar;
    };
    RecordingBar(char itsLetter, std::string& itsRecord)
        : letter(itsLetter)
        , record(itsRecord) {}
    std::unique_ptr<platform::StatusItem> addItem(float, platform::StatusItemView&) override {
        record += std::string(1, letter) + " ";
        return std::make_unique<Item>(*this);
    }
    using HostedStatusBar::hostAppeared;
    using HostedStatusBar::hostWent;
    char letter;
    std::string& record;
};

TEST(FollowingStatusBar, PutsItsItemsWhereThereIsAHostAndMovesThemAfterIt) {
    ManualMainLoop loop;
    std::string record;
    RecordingBar tray('T', record), notifier('N', record), strip('S', record);
    platform::FollowingStatusBar bar(loop, {&tray, &notifier}, strip);
    NoView view;
    auto item = bar.addItem(30, view);
    EXPECT_EQ(item->frame(), KXRect{}) << "nowhere yet";
    item->setNeedsDisplay();
    const auto recordedIn = [&](const std::function<void()>& happens) {
        record.clear();
        happens();
        loop.advance(std::chrono::seconds(1));
        return record;
    };
    EXPECT_EQ(recordedIn([] {}), "S ");
    EXPECT_EQ(recordedIn([&] { item->setNeedsDisplay(); }), "draw S ");
    EXPECT_EQ(item->frame(), (KXRect{1, 2, 3, 4}));
    EXPECT_EQ(recordedIn([&] { notifier.hostAppeared(); }), "-S N ");
    EXPECT_EQ(recordedIn([&] { tray.hostAppeared(); }), "-N T ") << "preferred";
    EXPECT_EQ(recordedIn([&] { notifier.hostWent(); }), "") << "not the one in use";
    EXPECT_EQ(recordedIn([&] {
                  tray.hostWent();
                  tray.hostAppeared();
              }),
              "-T T ")
        << "another host, though there never seemed to be none";
    EXPECT_EQ(recordedIn([&] {
                  tray.hostWent();
                  notifier.hostAppeared();
              }),
              "-T N ")
        << "not by way of the strip";
    EXPECT_EQ(recordedIn([&] { notifier.hostWent(); }), "-N S ");
    EXPECT_EQ(recordedIn([&] { item.reset(); }), "-S ");
    EXPECT_EQ(recordedIn([&] { tray.hostAppeared(); }), "");
}

} // namespace
