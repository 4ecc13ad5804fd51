#include "server/catalogues/SampleGuest.h"
#include "server/catalogues/SampleMachine.h"
#include "server/icons/RawIcons.h"
#include "tests/support/ScratchHome.h"

#include <QImage>
#include <gmock/gmock.h>
#include <set>

using namespace tessel;
using testing::HasSubstr;

namespace {

std::string parse(const std::string& text, const SampleLimits& limits = {}) {
    std::string error;
    const auto guest = ParseSampleGuest(text, error, limits);
    if (!guest) return "refused: " + error;
    std::string rows;
    VisitItems(guest->catalogue, [&](const CatalogueItem& item) { rows += "[" + item.id + "]"; });
    return rows;
}

} // namespace

TEST(SampleGuest, TheShippedOneIsWholeAndHasAllItsIcons) {
    const ScratchHome home;
    const auto machine = SampleMachine::open("sample", KX_SAMPLE_GUEST);
    ASSERT_TRUE(machine);
    EXPECT_EQ(home.log(), "") << "a row or a name was left out";
    std::set<std::string> icons;
    VisitItems(*machine->readCatalogue(), [&](const CatalogueItem& item) { icons.insert(item.icon); });
    icons.erase("");
    EXPECT_GE(icons.size(), 12u);
    for (const std::string& icon : icons)
        EXPECT_EQ(machine->readIcon(icon).size(), iconSizes.size()) << icon;
}

TEST(SampleGuest, RefusesWhatPassesItsBoundsAndLeavesOutWhatMakesNoSense) {
    const ScratchHome home;
    EXPECT_THAT(parse("name = "), HasSubstr("refused: line 1: "));
    EXPECT_THAT(parse("programs = [ { title = \"\xff\" } ]"), HasSubstr("refused: line 1: "));
    EXPECT_EQ(parse("name = 'abc'", {.bytes = 5}), "refused: the file is too large");
    EXPECT_EQ(parse("name = 'abc'", {.title = 2}), "refused: the name is too long");
    EXPECT_EQ(parse("programs = [{title='a'}, {title='b'}]", {.items = 1}),
              "refused: there are too many rows");
    EXPECT_EQ(parse("programs = [{title='a', items=[{title='b', items=[]}]}]", {.depth = 1}),
              "refused: folders are nested too deeply");
    EXPECT_THAT(parse("a = " + std::string(100'000, '[')), HasSubstr("refused: "));

    EXPECT_EQ(parse(""), "");
    EXPECT_EQ(
        parse("programs = 7\ntop = [1, {}, {title=''}, {title=3}, {title='ok', items=2}, {title='ok'}]"),
        "[top/ok]");
    EXPECT_EQ(parse("programs=[{title='a', state='x', alternate={title='b', alternate={title='c'}}}]\n"
                    "top=[{application='a'}, {application='nobody'}]\npinned=['a', 'nobody', 4]"),
              "[a][a/alternate/b][a/alternate/b/alternate/c][a][a/alternate/b][a/alternate/b/alternate/c]");
    EXPECT_THAT(home.log(), HasSubstr("no application \"nobody\" for \"pinned\""));
    EXPECT_FALSE(SampleMachine::open("sample", home.path().string()));
}

TEST(IconFolder, ReadsNoFileButItsOwnPictures) {
    const ScratchHome home;
    const std::string head = R"(<svg xmlns="http://www.w3.org/2000/svg" viewBox="0 0 2 2">)";
    const std::string good = head + R"(<path d="M0 1h2v1h-2z" fill="#ff8000" fill-opacity="0.5"/></svg>)";
    std::ofstream(home.path() / "good.svg") << good;
    std::ofstream(home.path() / "large.svg") << good << std::string(300'000, ' ');
    std::ofstream(home.path() / "broken.svg") << "GIF89a";
    std::filesystem::create_directory(home.path() / "inner");
    const IconFolder folder(home.path());
    for (const char* name : {"inner/../good", "large", "broken", "absent"})
        EXPECT_TRUE(folder.read(name).isNil()) << name;

    const plist::Value icon = folder.read("good").at(0);
    EXPECT_EQ(icon["format"], plist::Value("bgra"));
    const plist::Data data = icon["data"].data();
    const auto channel = [&](std::size_t row, std::size_t byte) { return int(data.data()[row * 64 + byte]); };
    const int bottom[] = {0x00, 0x80, 0xff, 0x80};
    for (std::size_t byte = 0; byte < 4; ++byte)
        EXPECT_NEAR(channel(0, byte), bottom[byte], 2) << "bottom row and blue first, not premultiplied";
    EXPECT_EQ(channel(15, 3), 0);
}
