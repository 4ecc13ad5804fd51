#include "app/menuSearchIndex.h"
#include "tests/app/MenuFixtures.h"

#include <gtest/gtest.h>

namespace {

const std::string withNull("a\0b", 3);

struct Search {
    std::string text;
    std::string title;
};

/// How many of two items of this title are found.
std::size_t hits(const Search& search) {
    return MenuSearchIndex(listTitled({search.title, search.title})).itemsContaining(search.text).size();
}

TEST(MenuSearchIndex, FindsWhatReadersTakeForTheSameOnceInEachItem) {
    const Search same[] = {
        {"STRASSE", "Straße"},    {"lodz", "Łódź"},     {"orsted", "Ørsted"},
        {"istanbul", "İstanbul"}, {"isik", "ışık"},     {"οδυσσεύς", "ΟΔΥΣΣΕΥΣ"},
        {"FILE", "ﬁle"},          {"word", "Ｗｏｒｄ"}, {"oeuvre", "œuvre"},
        {"محمد", "مُحَمَّد"},         {"한구", "한국어"},   {"viet", "Việt"},
        {"édi", "e\u0301diteur"}, {"thor", "Þór"},      {"aesir", "Æsir"},
        {"елка", "ёлка"},         {"ｶﾞ", "ガ"},         {"ガ", "ｶﾞ"},
    };
    for (const auto& search : same)
        EXPECT_EQ(hits(search), 2U) << search.title << " " << search.text;
    EXPECT_EQ(hits({"e", "eEe"}), 2U);
    EXPECT_EQ(hits({"[a.b*c?", "100% [a.b*c?"}), 2U);
    EXPECT_EQ(hits({"ab", withNull}), 2U);
}

TEST(MenuSearchIndex, FindsNoPatternsNoOtherLettersAndNothingAcrossTitles) {
    const Search different[] = {{"x", "abc"},      {"a.c", "abc"},       {"a*", "abc"}, {"cab", "abc"},
                                {withNull, "abc"}, {withNull, withNull}, {"कल", "कुल"},  {"ガ", "カ"},
                                {"กน", "กิน"},      {"ba", "ab"}};
    for (const auto& search : different)
        EXPECT_EQ(hits(search), 0U) << search.title << " " << search.text;
    EXPECT_TRUE(MenuSearchIndex().itemsContaining("e").empty());
}

} // namespace
