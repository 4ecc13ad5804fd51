#include "tests/plist/RawFile.h"

#include <gtest/gtest.h>
#include <limits>

namespace plist {

namespace {

std::string listOf(const std::string& content) {
    return "<plist version=\"1.0\">" + content + "</plist>";
}

TEST(XML, ReadsEveryType) {
    const Value value = parsed(dataOf(R"(<?xml version="1.0" encoding="UTF-8"?>
<!DOCTYPE plist SYSTEM "PropertyList.dtd">
<!-- settings -->
<plist version="1.0">
<dict>
    <key>a &amp; b</key> <string> &lt;é&#x1F600;&gt;<![CDATA[<&]]> </string>
    <key>numbers</key>
    <array>
        <integer> 18446744073709551615 </integer> <integer>-9223372036854775808</integer> <integer>+0x1F</integer>
        <real>-1.5e3</real> <real>inf</real> <true/> <false></false>
    </array>
    <key>date</key> <date>2012-11-05T14:03:22Z</date>
    <key>data</key> <data>
        AAEC
        /w==
    </data>
    <key>empty</key> <array/>
    <key>twice</key> <integer>1</integer>
    <key>twice</key> <dict/>
</dict>
</plist>
)"));
    const Value expected =
        Dictionary{{"a & b", " <é😀><& "},
                   {"numbers", Array{UINT64_MAX, INT64_MIN, 31, -1500.0,
                                     std::numeric_limits<double>::infinity(), true, false}},
                   {"date", Date{373817002}},
                   {"data", dataOf({"\0\1\2\xFF", 4})},
                   {"empty", Array{}},
                   {"twice", Dictionary{}}};
    EXPECT_EQ(value, expected) << value.description();
    EXPECT_EQ(value.keyAt(5), "twice");

    const std::string latin = "<?xml version='1.0' encoding='ISO-8859-1'?>" + listOf("<string>\xE9</string>");
    EXPECT_EQ(parsed(dataOf(latin)), Value("é"));
    EXPECT_EQ(parsed(dataOf("\xEF\xBB\xBF" + listOf("<string/>"))), Value(""));
}

TEST(XML, RefusesWhatIsNoPropertyList) {
    const std::pair<std::string, std::string> cases[] = {
        {"<plist>\n<dict>\n<string/>", "line 3: a value without a key"},
        {listOf("<dict><key>k</key></dict>"), "line 1: a key without a value"},
        {listOf("<dict><key>k</key><key>k</key></dict>"), "line 1: a key without its place"},
        {listOf("<key>k</key>"), "line 1: a key without its place"},
        {listOf("<true/><true/>"), "line 1: more than one value"},
        {listOf(""), "line 1: no value"},
        {listOf(listOf("<true/>")), "line 1: plist is the outermost element, and no other"},
        {"<array/>", "line 1: plist is the outermost element, and no other"},
        {listOf("<set/>"), "line 1: an element of unknown name"},
        {listOf("<string><true/></string>"), "line 1: an element inside a scalar"},
        {listOf("<array>text</array>"), "line 1: text between elements"},
        {listOf("<true/>") + "<true/>", "line 1: junk after document element"},
        {"<plist><true/>", "line 1: no element found"},
    };
    for (const auto& [text, error] : cases)
        EXPECT_EQ(errorOf(text), error);
    for (const char* scalar :
         {"<integer/>", "<integer>1.5</integer>", "<integer>18446744073709551616</integer>",
          "<integer>-9223372036854775809</integer>", "<integer>- 1</integer>", "<real>x</real>",
          "<real>+-1</real>", "<date>2012-02-30T00:00:00Z</date>", "<date>2012-02-03</date>",
          "<date>2012-02-03T24:00:00Z</date>", "<data>AAE</data>", "<data>A===</data>", "<data>AA=A</data>",
          "<data>A*==</data>"})
        EXPECT_EQ(errorOf(listOf(scalar)), "line 1: a scalar that cannot be read") << scalar;
}

TEST(XML, IsBounded) {
    const auto nested = [](int depth) {
        std::string text;
        for (int i = 0; i < depth; ++i)
            text = "<array>" + text + "</array>";
        return listOf(text);
    };
    EXPECT_EQ(errorOf(nested(512)), "");
    EXPECT_EQ(errorOf(nested(513)), "line 1: nested too deeply");
    EXPECT_EQ(errorOf(listOf("<array><true/><true/></array>"), {.objects = 2}), "line 1: too many objects");
    EXPECT_EQ(errorOf(listOf("<string>" + std::string(640, 'x') + "</string>"), {.objects = 10}),
              "line 1: too many objects");
    EXPECT_EQ(errorOf(listOf("<true/>"), {.bytes = 20}), "the file is too large");
    EXPECT_EQ(errorOf(listOf("<true/>"), {.xmlBytes = 20}), "the file is too large");

    const std::string entity = "<!DOCTYPE plist [<!ENTITY a \"aaaa\">]>" + listOf("<string>&a;</string>");
    EXPECT_EQ(errorOf(entity), "line 1: it declares an entity");
    const std::string outside = "<!DOCTYPE plist SYSTEM \"/etc/passwd\">" + listOf("<string>&a;</string>");
    EXPECT_EQ(errorOf(outside), "line 1: an unknown entity");

    std::string entries;
    for (int i = 0; i < 50'000; ++i)
        entries += "<key>" + std::to_string(i % 40'000) + "</key><true/>";
    EXPECT_EQ(parsed(dataOf(listOf("<dict>" + entries + "</dict>"))).size(), 40'000u);
}

} // namespace

} // namespace plist
