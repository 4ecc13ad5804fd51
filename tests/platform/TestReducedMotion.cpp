#include "platform/linux/ReducedMotion.h"

#include <gtest/gtest.h>
#include <string>

using namespace platform;

namespace {

std::span<const unsigned char> bytesOf(const std::string& text) {
    return {reinterpret_cast<const unsigned char*>(text.data()), text.size()};
}

TEST(ReducedMotion, FindsANumberAmongPublishedSettings) {
    using namespace std::string_literals;
    const std::string little = "\0\0\0\0\7\0\0\0\3\0\0\0"
                               "\1\0\4\0Font\0\0\0\0\5\0\0\0Sans \0\0\0"
                               "\2\0\1\0C\0\0\0\0\0\0\0rrggbbaa"
                               "\0\0\2\0An\0\0\0\0\0\0\xFE\xFF\xFF\xFF"s;
    EXPECT_EQ(XSettingsInteger(bytesOf(little), "An"), -2);
    EXPECT_EQ(XSettingsInteger(bytesOf(little), "Font"), std::nullopt);
    const std::string big = "\1\0\0\0\0\0\0\7\0\0\0\1\0\0\0\2An\0\0\0\0\0\0\0\0\1\2"s;
    EXPECT_EQ(XSettingsInteger(bytesOf(big), "An"), 258);
    for (std::size_t length = 0; length < little.size(); ++length)
        EXPECT_EQ(XSettingsInteger(bytesOf(little.substr(0, length)), "An"), std::nullopt) << length;
}

} // namespace
