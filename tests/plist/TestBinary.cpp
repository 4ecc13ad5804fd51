#include "tests/plist/RawFile.h"

#include <algorithm>
#include <gtest/gtest.h>
#include <limits>

namespace plist {

namespace {

Data unhex(std::string_view digits) {
    std::string bytes;
    for (std::size_t i = 0; i < digits.size(); i += 2)
        bytes += static_cast<char>(std::stoi(std::string(digits.substr(i, 2)), nullptr, 16));
    return dataOf(bytes);
}

TEST(Binary, ReadsWhatAnotherWriterWrote) {
    const Data file =
        unhex("62706c6973743030d3010203040506546e616d655670736e4b657964006e00e9d83dde005c6d656e752e72656672"
              "6573681400000000000000008000000000000005a60708090a0b0c13ffffffffffffffff23400000000000000033"
              "41b647feaa0000004200ff081200011170080f141b24314249525b64676800000000000001010000000000000"
              "00d0000000000000000000000000000006d");
    const Value expected =
        Dictionary{{"name", "menu.refresh"},
                   {"psnKey", (std::uint64_t{1} << 63) + 5},
                   {"né😀", Array{-1, 2.0, Date{373817002}, dataOf({"\0\xFF", 2}), false, 70000}}};
    EXPECT_EQ(parsed(file), expected) << parsed(file).description();
}

TEST(Binary, WritesTheFormatByteForByte) {
    EXPECT_EQ(written(Array{"a", 258, "a"}).joined(),
              unhex("62706c69737430305161110102a30102010d080a0000000000000101000000000000"
                    "000300000000000000000000000000000011"));
}

TEST(Binary, NumbersSurviveAtEveryWidth) {
    Array numbers{true, false, UINT64_MAX, 0.0, -1.5, std::numeric_limits<double>::infinity(), Date{-0.25}};
    for (int bit = 0; bit < 64; ++bit) {
        const std::uint64_t power = std::uint64_t{1} << bit;
        for (const std::uint64_t number : {power - 1, power, power + 1}) {
            numbers.push_back(number);
            numbers.push_back(static_cast<std::int64_t>(number));
        }
    }
    EXPECT_EQ(reread(numbers), Value(numbers));
}

TEST(Binary, TextSurvivesInBothEncodings) {
    Array texts;
    for (const std::size_t length : {0u, 1u, 7u, 8u, 9u, 15u, 16u, 255u, 256u, 70000u}) {
        texts.push_back(std::string(length, 'x'));
        std::string wide;
        for (std::size_t i = 0; i < length; ++i)
            wide += "\xF0\x9F\x98\x80";
        texts.push_back(wide);
        texts.push_back(std::string(length, 'x') + "\xC3\xA9");
    }
    texts.push_back(std::string("a\0b", 3));
    texts.push_back(
        "\xC2\x80\xDF\xBF\xE0\xA0\x80\xED\x9F\xBF\xEE\x80\x80\xEF\xBF\xBF\xF0\x90\x80\x80\xF4\x8F\xBF\xBF");
    const Value again = reread(texts);
    for (std::size_t i = 0; i < texts.size(); ++i)
        EXPECT_EQ(again.at(i).string(), texts[i].string());
}

TEST(Binary, MalformedTextIsReplaced) {
    const std::string mark = "\xEF\xBF\xBD";
    const std::pair<std::string, std::string> written[] = {
        {"a\xFF!", "a" + mark + "!"},
        {"\xC0\xAF", mark + mark},                       // overlong
        {"\xED\xA0\x80", mark + mark + mark},            // a surrogate
        {"\xF4\x90\x80\x80", mark + mark + mark + mark}, // past the last character
        {"\xE2\x82", mark + mark},                       // cut short
        {"\xE2\x82x", mark + mark + "x"},
    };
    for (const auto& [text, expected] : written)
        EXPECT_EQ(reread(text).string(), expected);

    const std::pair<std::string, std::string> units[] = {
        {{"\x63\xD8\x00\x00x\x00y", 7}, mark + "xy"}, // a high surrogate alone
        {{"\x62\xDC\x00\x00x", 5}, mark + "x"},       // a low one
        {{"\x61\xD8\x3D", 3}, mark},                  // a high one at the end
        {{"\x63\xD8\x00\xD8\x3D\xDE\x00", 7}, mark + "\xF0\x9F\x98\x80"},
    };
    for (const auto& [object, expected] : units) {
        const Value value = parsed(RawFile{{object}}.build());
        EXPECT_EQ(value.string(), expected);
        EXPECT_TRUE(value.equalsString(expected));
    }
}

TEST(Binary, EqualLeavesAndSharedContainersAreWrittenOnce) {
    const Data icon = dataOf(std::string(100'000, 'i')), alike = dataOf(std::string(100'000, 'i'));
    Array icons;
    for (int i = 0; i < 4000; ++i)
        icons.push_back(i % 2 == 0 ? icon : alike);
    EXPECT_EQ(reread(icons), Value(icons));
    EXPECT_LT(written(icons).size, 100'000u + 4000 * 2 + 100);

    std::string text(40'000, 't');
    EXPECT_LT(written(Array{text, text, Dictionary{{text, text}}}).size, 40'200u);

    Array several; // differing where a hash of samples does not look
    for (char c = 'a'; c < 'z'; ++c)
        several.push_back(dataOf(std::string(100, '.') + c + std::string(100'000, '.')));
    for (std::size_t i = 0; i < 25; ++i)
        several.push_back(several[i]);
    EXPECT_EQ(reread(several), Value(several));
    EXPECT_LT(written(several).size, 2'510'000u);

    const Value item = Dictionary{{"title", "Editor"}, {"icons", Array(200, "icon")}};
    const Value items = Dictionary{{"pinned", Array(50, item)}, {"all", Array(50, item)}};
    EXPECT_EQ(reread(items), items);
    EXPECT_LT(written(reread(items)).size, 500u);
}

TEST(Binary, DataIsNeverCopied) {
    const Data icon = dataOf(std::string(5000, 'i'));
    const Encoded encoded = written(Dictionary{{"icon", icon}});
    const auto isIcon = [&](std::span<const std::byte> piece) { return piece.data() == icon.data(); };
    EXPECT_EQ(std::ranges::count_if(encoded.pieces, isIcon), 1);

    Data file = encoded.joined();
    const std::byte* const start = file.data();
    const std::byte* const end = start + file.size();
    const Data inside = parsed(std::exchange(file, {}))["icon"].data();
    EXPECT_TRUE(inside.data() > start && inside.data() < end);
    EXPECT_EQ(inside, icon); // the bytes live as long as what points into them
}

TEST(Binary, LargeDataComesLastAndIsReadWithoutBeingTouched) {
    const std::vector<std::byte> one(100'000, std::byte{1}), two(100'000, std::byte{2});
    const auto file = written(Array{Data(one, nullptr), Data(two, nullptr), "after"}).joined();
    const auto whole = file.span();
    const auto found = std::search(whole.begin(), whole.end(), two.begin(), two.end());
    const auto last = static_cast<std::size_t>(found - whole.begin());
    EXPECT_LT(file.size() - last - two.size(), 50U);

    std::vector<std::byte> spoiled(file.span().begin(), file.span().end());
    spoiled[last - 6] = {}; // where the data's head is
    const Data untouched(spoiled, nullptr);
    EXPECT_EQ(errorOf(untouched), "an object is malformed");
    std::string error;
    EXPECT_EQ(Parse(untouched, error, {}, peekInto(file)).size(), 3U) << error;
    const auto failing = [](std::size_t, std::span<std::byte>) { return false; };
    EXPECT_EQ(Parse(file, error, {}, failing).at(1).data(), Data(two, nullptr));
}

TEST(Binary, ParsedPartsAreWrittenAsPartsOfOthers) {
    const Value part = reread(Dictionary{{"é", Array{"é", dataOf(std::string(600, 'd')), Dictionary{}}}});
    const Value outer = Dictionary{{"inner", part["é"]}, {"again", Array{part, 1, Dictionary{}}}};
    EXPECT_EQ(reread(outer), outer);
}

TEST(Binary, RefusesToWriteWhatCannotBeRead) {
    const auto errorOf = [](const Value& value, const Limits& limits = {}) {
        std::string error;
        EXPECT_TRUE(WriteBinary(value, error, limits).pieces.empty());
        return error;
    };
    EXPECT_EQ(errorOf(Array{1, nullptr}), "nil cannot stand in a property list");
    EXPECT_EQ(errorOf(std::string(1000, 'x'), {.bytes = 1000}), "the property list is too large");
    EXPECT_EQ(errorOf(Array{1, 1, 1}, {.objects = 3}), "too many objects");

    const Value inner = Array{1}, shared = Array{inner}, outer = Array{shared};
    std::string error;
    EXPECT_EQ(WriteBinary(Array{shared, shared}, error, {.objects = 7}).pieces.size(), 1u) << error;
    EXPECT_EQ(errorOf(Array{shared, shared}, {.objects = 6}), "too many objects");
    // Met first near the top, then again where it no longer fits.
    EXPECT_EQ(errorOf(Array{shared, Array{outer, 1}}, {.nesting = 4}), "nested too deeply");
    EXPECT_EQ(WriteBinary(Array{shared, Array{outer, 1}}, error, {.nesting = 5}).pieces.size(), 1u);

    Value deep = 1;
    for (unsigned i = 0; i < kDeepestNesting; ++i)
        deep = Array{deep};
    EXPECT_EQ(reread(deep), deep);
    EXPECT_EQ(errorOf(Array{deep}), "nested too deeply");
    Value bomb = 1;
    for (int i = 0; i < 60; ++i)
        bomb = Array{bomb, bomb};
    EXPECT_EQ(errorOf(bomb, {.objects = 10'000}), "too many objects");
}

} // namespace

} // namespace plist
