#include "fuzz/Quiet.h"
#include "tests/plist/RawFile.h"

#include <bit>
#include <gtest/gtest.h>

namespace plist {

namespace {

std::string bytesOf(const Data& file) {
    return {reinterpret_cast<const char*>(file.data()), file.size()};
}

std::vector<std::uint64_t> times(std::size_t count, std::uint64_t reference) {
    return std::vector<std::uint64_t>(count, reference);
}

/// Each level refers to the next one `width` times.
Data bomb(std::size_t levels, std::size_t width) {
    RawFile file;
    for (std::size_t i = 1; i <= levels; ++i)
        file.objects.push_back(RawFile::array(times(width, i)));
    file.objects.push_back("\x09");
    return file.build();
}

TEST(HostileBinary, MalformedFilesAreRefused) {
    const std::string one = "\x09";
    const std::pair<const char*, std::vector<std::string>> cases[] = {
        {"a reference points past the last object", {RawFile::array({1})}},
        {"a container holds itself", {RawFile::array({0})}},
        {"a container holds itself", {RawFile::array({1}), RawFile::dictionary({2, 0}), "Qk"}},
        {"a key is not a string", {RawFile::dictionary({1, 1}), one}},
        {"a string is not ASCII", {"Q\x80"}},
        {"a string is not ASCII", {"\x5F\x10\x14" + std::string(19, 'x') + "\xFF"}},
        {"an integer of more than 64 bits", {'\x14' + std::string(8, '\xFF') + bigEndian(1, 8)}},
        {"an object is malformed", {std::string(1, '\0')}},                    // null
        {"an object is malformed", {"\x80\x01"}},                              // an identifier of an archive
        {"an object is malformed", {RawFile::container('\xC0', {1}, 1), one}}, // a set
        {"an object is malformed", {"\x15" + std::string(32, '\0')}},
        {"an object is malformed", {"\x32" + std::string(8, '\0')}},
        {"an object is malformed", {"\x4F\x22" + std::string(4, '\0')}}, // a count that is no integer
        {"an object is longer than the file", {"\x13\x01\x02"}},
        {"an object is longer than the file", {"\x4F\x13" + bigEndian(std::uint64_t{1} << 63, 8)}},
        {"an object is longer than the file", {"\x6F\x13" + bigEndian(std::uint64_t{1} << 63, 8)}},
        {"an object is longer than the file", {"\xDF\x13" + bigEndian(std::uint64_t{1} << 61, 8)}},
        {"an object is longer than the file", {"\xA2" + bigEndian(1, 4) + "\x09"}},
    };
    for (const auto& [error, objects] : cases)
        EXPECT_EQ(errorOf(RawFile{objects}.build()), error);
}

TEST(HostileBinary, WrongTrailersAreRefused) {
    const Data file = RawFile{{"\x09"}}.build();
    const std::string whole = bytesOf(file);
    const struct {
        std::size_t fromEnd, size;
        std::vector<std::uint64_t> numbers;
        const char* error;
    } changes[] = {
        {40, 8, {0, 7, 9, UINT64_MAX}, "an object lies outside the file"},
        {26, 1, {0, 9, 255}, "the trailer is malformed"},
        {25, 1, {0, 9, 255}, "the trailer is malformed"},
        {24, 8, {2, std::uint64_t{1} << 63, UINT64_MAX}, "the table of offsets is longer than the file"},
        {16, 8, {1, UINT64_MAX}, "a reference points past the last object"},
        {8, 8, {7, 18, UINT64_MAX}, "the table of offsets lies outside the file"},
    };
    for (const auto& [fromEnd, size, numbers, error] : changes)
        for (const std::uint64_t number : numbers) {
            std::string changed = whole;
            changed.replace(changed.size() - fromEnd, size, bigEndian(number, size));
            EXPECT_EQ(errorOf(changed), error);
        }
    EXPECT_EQ(errorOf("text"), "not a property list");
    EXPECT_EQ(errorOf("bplist00"), "the file is too short");
    EXPECT_EQ(errorOf("bplist01" + whole.substr(8)), "not a binary property list");
    EXPECT_EQ(errorOf(file, {.bytes = file.size() - 1}), "the file is too large");
}

TEST(HostileBinary, NestingIsBounded) {
    EXPECT_EQ(errorOf(bomb(512, 1)), "");
    EXPECT_EQ(errorOf(bomb(513, 1), {.nesting = 1000}), "nested too deeply");
    EXPECT_EQ(errorOf(bomb(1'000'000, 1)), "nested too deeply");

    // Seen first near the top, then again where it no longer fits.
    RawFile shared{
        {RawFile::array({2, 1}), RawFile::array({2}), RawFile::array({3}), RawFile::array({4}), "\x09"}};
    EXPECT_EQ(errorOf(shared.build(), {.nesting = 4}), "");
    EXPECT_EQ(errorOf(shared.build(), {.nesting = 3}), "nested too deeply");
}

TEST(HostileBinary, SharedReferencesAreCountedEachTime) {
    EXPECT_EQ(errorOf(bomb(3, 10), {.objects = 1111}), ""); // 1 + 10 + 100 + 1000
    EXPECT_EQ(errorOf(bomb(3, 10), {.objects = 1110}), "too many objects");
    EXPECT_EQ(errorOf(bomb(400, 100)), "too many objects");
    EXPECT_EQ(errorOf(RawFile{std::vector<std::string>(20, "\x09")}.build(), {.objects = 19}),
              "too many objects");
}

TEST(HostileBinary, MegabytesReferredToOftenAreNotMultiplied) {
    const auto file = [](char kind, const std::string& payload, std::size_t count) {
        return RawFile{{RawFile::array(times(4000, 1)), kind + ('\x12' + bigEndian(count, 4)) + payload}}
            .build();
    };
    const std::string megabyte(1 << 20, 'x');
    EXPECT_EQ(errorOf(file('\x5F', megabyte, megabyte.size())), "too many objects");
    EXPECT_EQ(errorOf(file('\x6F', megabyte, megabyte.size() / 2)), "too many objects");

    const Value data = parsed(file('\x4F', megabyte, megabyte.size()));
    ASSERT_EQ(data.size(), 4000u);
    EXPECT_LT(written(data).size, megabyte.size() + 10'000);
}

TEST(HostileBinary, ObjectsDoNotOverlap) {
    // Two arrays of a thousand references in the same place.
    const std::string top = "bplist00" + RawFile::array({1, 2}), both = RawFile::array(times(1000, 3));
    std::string table;
    for (const std::size_t offset : {std::size_t{8}, top.size(), top.size(), top.size() + both.size()})
        table += bigEndian(offset, 8);
    EXPECT_EQ(errorOf(RawFile::finish(top + both + '\x09', table)), "objects overlap");
}

TEST(HostileBinary, EveryCutAndEveryChangeOfAByteIsSafe) {
    // No number in it is a change of one byte away from NaN, which equals nothing.
    const Value original = Dictionary{{"name", "up"},
                                      {"é", Array{1, INT64_MIN / 2, 2.0, true, Date{1e9}, UINT64_MAX}},
                                      {"icon", dataOf(std::string(3, 'i'))},
                                      {"nested", Dictionary{{"name", Array{"😀", Array{}, "up"}}}}};
    const std::string whole = bytesOf(written(original).joined());
    for (std::size_t size = 0; size < whole.size(); ++size)
        EXPECT_NE(errorOf(whole.substr(0, size)), "");

    for (std::size_t at = 0; at < whole.size(); ++at) {
        for (unsigned change = 1; change < 256; ++change) {
            std::string changed = whole;
            changed[at] = static_cast<char>(static_cast<unsigned char>(changed[at]) ^ change);
            std::string error;
            const Value value = Parse(dataOf(changed), error);
            EXPECT_EQ(value.isNil(), !error.empty());
            if (value.isNil()) continue;
            ReadAll(value);
            g_seen = g_seen + value.description().size();
            if (!std::has_single_bit(change)) continue;
            ASSERT_EQ(reread(value), value) << "byte " << at << " changed by " << change;
        }
    }
    EXPECT_GT(g_seen, 0u);
}

} // namespace

} // namespace plist
