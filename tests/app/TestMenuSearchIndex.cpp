#include "app/menuSearchIndex.h"
#include "tests/app/MenuFixtures.h"

#include <gtest/gtest.h>

namespace {

using Titles = std::vector<std::string>;

bool finds(const std::string& title, const std::string& text) {
    return !MenuSearchIndex(listTitled({title})).itemsContaining(text).empty();
}

TEST(MenuSearchIndex, KeepsTheOrderAndFindsEachItemOnce) {
    const MenuSearchIndex index(listTitled({"Zebra", "apple", "Éditeur", "Mail", "eEe"}));
    EXPECT_EQ(titlesOf(index.itemsContaining("e")), (Titles{"Zebra", "apple", "Éditeur", "eEe"}));
    EXPECT_EQ(titlesOf(index.itemsContaining("EDIT")), (Titles{"Éditeur"}));
    EXPECT_TRUE(index.itemsContaining("x").empty());
    EXPECT_TRUE(index.itemsContaining("ebraapp").empty()) << "no hit across two titles";
    EXPECT_TRUE(MenuSearchIndex().itemsContaining("e").empty());
}

TEST(MenuSearchIndex, TakesTextLiterally) {
    EXPECT_TRUE(finds("100% [new] a.b*c?", "% [new] a.b*c?"));
    EXPECT_FALSE(finds("abc", "a.c"));
    EXPECT_FALSE(finds("abc", "a*"));
    EXPECT_FALSE(finds("abc", std::string("a\0b", 3)));
    EXPECT_FALSE(finds(std::string("a\0b", 3), std::string("a\0b", 3)));
    EXPECT_TRUE(finds(std::string("a\0b", 3), "ab"));
}

TEST(MenuSearchIndex, FoldsWhatReadersTakeForTheSame) {
    const std::pair<const char*, const char*> same[] = {
        {"Straße", "STRASSE"},    {"Łódź", "lodz"},         {"Ørsted", "orsted"}, {"İstanbul", "istanbul"},
        {"ışık", "isik"},         {"ΟΔΥΣΣΕΥΣ", "οδυσσεύς"}, {"ﬁle", "FILE"},      {"Ｗｏｒｄ", "word"},
        {"œuvre", "oeuvre"},      {"مُحَمَّد", "محمد"},         {"한국어", "한구"},   {"Việt", "viet"},
        {"e\u0301diteur", "édi"}, {"Þór", "thor"},          {"Æsir", "aesir"},    {"ёлка", "елка"},
    };
    for (const auto& [title, text] : same)
        EXPECT_TRUE(finds(title, text)) << title << " " << text;
}

TEST(MenuSearchIndex, KeepsMarksThatAreLetters) {
    const std::pair<const char*, const char*> different[] = {
        {"कुल", "कल"},
        {"カ", "ガ"},
        {"กิน", "กน"},
        {"ab", "ba"},
    };
    for (const auto& [title, text] : different)
        EXPECT_FALSE(finds(title, text)) << title << " " << text;
    EXPECT_EQ(foldForSearch("ガ"), foldForSearch("ｶﾞ"));
    EXPECT_NE(foldForSearch("ガ"), foldForSearch("カ"));
}

} // namespace
