#include "tests/plist/RawFile.h"

#include <cmath>
#include <gtest/gtest.h>
#include <limits>

namespace plist {

namespace {

TEST(Value, NumbersConvertLikeC) {
    const Value big = std::uint64_t{1} << 63 | 7;
    EXPECT_EQ(big.unsignedLongLongValue(), std::uint64_t{1} << 63 | 7);
    EXPECT_EQ(big.longLongValue(), std::numeric_limits<std::int64_t>::min() + 7);
    EXPECT_EQ(big.intValue(), 7);
    EXPECT_EQ(big.doubleValue(), std::ldexp(1.0, 63));
    EXPECT_EQ(Value(-2).unsignedIntValue(), 0xFFFFFFFEu);
    EXPECT_EQ(Value(-2.9).intValue(), -2);
    EXPECT_EQ(Value(1e300).longLongValue(), std::numeric_limits<std::int64_t>::max());
    EXPECT_EQ(Value(-1.0).unsignedLongLongValue(), 0u);
    EXPECT_EQ(Value(std::nan("")).longLongValue(), 0);
    EXPECT_TRUE(Value(0.5).boolValue());
}

TEST(Value, OtherTypesReadAsAbsent) {
    for (const Value& value : {Value(), Value("7"), Value(Array{Value(7)}), Value(Dictionary{{"7", 7}})}) {
        EXPECT_EQ(value.intValue(), 0);
        EXPECT_FALSE(value.boolValue());
        EXPECT_TRUE(value.data().empty());
        EXPECT_TRUE(value["absent"].isNil());
        EXPECT_EQ(value.keyAt(5), "");
    }
    EXPECT_FALSE(Value(7).string());
    EXPECT_EQ(Value(7).stringOr("none"), "none");
}

TEST(Value, DictionaryKeepsOrderAndReplacesInPlace) {
    Dictionary dictionary{{"b", 1}, {"a", 2}, {"c", 3}, {"b", 4}};
    dictionary.set("a", nullptr).set("d", nullptr);
    const Value made = dictionary;
    for (const Value& value : {made, reread(made)}) {
        ASSERT_EQ(value.size(), 2u);
        EXPECT_EQ(value.keyAt(0), "b");
        EXPECT_EQ(value.at(0).intValue(), 4);
        EXPECT_EQ(value["c"].intValue(), 3);
        int sum = 0;
        for (const Value& each : value)
            sum += each.intValue();
        EXPECT_EQ(sum, 7);
    }
}

TEST(Value, EqualByTypeAndContent) {
    const Value left = Dictionary{{"x", Array{1, 2.5, "é"}}, {"y", Date{3}}};
    const Value right = Dictionary{{"y", Date{3}}, {"x", Array{1, 2.5, "é"}}};
    EXPECT_EQ(left, right);
    EXPECT_EQ(reread(left), right);
    EXPECT_EQ(Value(5), Value(5u));
    EXPECT_NE(Value(-1), Value(std::uint64_t{0xFFFFFFFFFFFFFFFF}));
    EXPECT_NE(Value(true), Value(1));
    EXPECT_NE(Value(1), Value(1.0));
    EXPECT_NE(left, Value(Dictionary{{"y", Date{3}}, {"x", Array{1, 2.5, "e"}}}));
    EXPECT_NE(left, Value(Dictionary{{"y", Date{3}}, {"z", Array{1, 2.5, "é"}}}));
    EXPECT_NE(Value(Array{1}), Value(Array{1, 2}));
}

TEST(Value, LooksUpKeysAndTextsThatAreNotASCII) {
    const Value value = reread(Dictionary{{"ключ", "Пуск"}, {"last", 3}});
    EXPECT_EQ(value["last"].intValue(), 3);
    EXPECT_TRUE(value["ключ"].equalsString("Пуск"));
    EXPECT_FALSE(value["ключ"].equalsString("Пус"));
    EXPECT_FALSE(value["ключ"].equalsString("Пуск "));
    EXPECT_TRUE(value["клю"].isNil());
}

TEST(Value, LooksKeysUpWhateverTheirLength) {
    constexpr std::size_t sizes[] = {0, 1, 13, 14, 15, 16, 300};
    Dictionary lengths;
    for (const std::size_t size : sizes)
        lengths.set(std::string(size, 'k'), size);
    const Value value = reread(lengths);
    for (const std::size_t size : sizes) {
        EXPECT_EQ(value[std::string(size, 'k')], Value(size));
        EXPECT_TRUE(value[std::string(size, 'k') + 'l'].isNil());
    }
    EXPECT_EQ(value[{}], Value(0));
    const Value spelledLong =
        parsed(RawFile{{RawFile::dictionary({1, 2}), "\x5F\x10\x01k", "\x10\x07"}}.build());
    EXPECT_EQ(spelledLong["k"], Value(7));
}

TEST(Value, DescribesForPeople) {
    EXPECT_EQ(Value().description(), "(null)");
    EXPECT_EQ(Value(false).description(), "0");
    EXPECT_EQ(Value(2.5).description(), "2.5");
    EXPECT_EQ(Value(Date{-1}).description(), "2000-12-31 23:59:59 +0000");
    EXPECT_EQ(Value(Date{1e300}).description(), "1e+300");
    const Value tree = Dictionary{{"name", "menu.update"}, {"two words", Array{1, "a\"b\n", Array{}}}};
    EXPECT_EQ(reread(tree).description(), R"({
    name = menu.update;
    "two words" = (
        1,
        "a\"b\n",
        (
        )
    );
})");
    EXPECT_EQ(Value(Data::copyOf("\x01\xFFxyz", 5)).description(), "<01ff7879 7a>");
}

TEST(Value, DescriptionIsBounded) {
    Value deep = 1;
    for (int i = 0; i < 400; ++i)
        deep = Array{deep, deep};
    EXPECT_LT(deep.description().size(), 200'000u);
    EXPECT_LT(Value(Array(100'000, Value(std::string(1000, 'x')))).description().size(), 200'000u);
    EXPECT_LT(Value(Data::copyOf(std::string(1 << 20, 'x').data(), 1 << 20)).description().size(), 200u);
}

} // namespace

} // namespace plist
