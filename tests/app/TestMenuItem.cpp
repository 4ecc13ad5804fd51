#include "app/SMMenuItem.h"
#include "lib/kxAppKit/KXFileTypeIcons.h"
#include "lib/kxAppKit/KXImage.h"
#include "lib/plist/Binary.h"
#include "platform/FileTypeIcons.h"

#include <gtest/gtest.h>

using plist::Array;
using plist::Dictionary;
using plist::Value;

namespace {

/// The value as it looks after a trip over the wire; `message` is what keeps the bytes alive.
Value received(const Value& value, std::weak_ptr<const void>* message = nullptr) {
    std::string error;
    const auto owner = std::make_shared<SharedBytes>(plist::WriteBinary(value, error).joined());
    const auto parsed = plist::ParseBinary({owner->span(), owner}, error);
    EXPECT_EQ(error, "");
    if (message) *message = owner;
    return parsed;
}

struct OneIcon final : platform::FileTypeIcons {
    OneIcon() { KXFileTypeIcons::setSource(this); }
    ~OneIcon() override { KXFileTypeIcons::setSource(nullptr); }
    std::vector<platform::IconPixels> iconForFileType(const std::string& type) override {
        asked += type + " ";
        return {{1, 1, SharedBytes::copyOf("\1\2\3\4", 4)}};
    }
    std::string asked;
};

TEST(MenuItem, TakesEveryKeyOfItsDictionary) {
    Dictionary info{
        {"action", "launch:"}, {"tag", 7.9}, {"representedObject", "app-1"}, {"title", "Zeichnen"}};
    info.set("enabled", 0).set("itemState", -2.9).set("separatorItem", 0.5).set("hideTriangle", true);
    const auto item = SMMenuItem::initWithDictionary(received(info));
    EXPECT_EQ(item->title(), "Zeichnen");
    EXPECT_EQ(item->itemState(), -2);
    EXPECT_TRUE(!item->enabled() && item->isSeparator() && item->hideTriangle() && !item->isFlexibleSpace());
    EXPECT_EQ(item->sendActionInfo(),
              Value(Dictionary{{"action", "launch:"}, {"tag", 7}, {"representedObject", "app-1"}}));
}

TEST(MenuItem, CountsWrongTypesAsAbsent) {
    Dictionary mistyped;
    for (const char* key : {"action", "tag", "title", "enabled", "itemState", "separatorItem", "hideTriangle",
                            "iconFileType", "rawIcons", "submenuInfoArray", "altMenuItem"})
        mistyped.set(key, plist::Date{6});
    for (const Value& info : {Value{}, Value(Array{1, 2}), Value("x"), Value(mistyped)}) {
        const auto item = SMMenuItem::initWithDictionary(info);
        EXPECT_TRUE(item->enabled() && item->title().empty() && item->itemState() == 0 &&
                    !item->isSeparator());
        EXPECT_FALSE(item->submenu() || item->altMenuItem() || item->icon() || item->hideTriangle());
        EXPECT_EQ(item->sendActionInfo(), Value(Dictionary{{"representedObject", ""}}));
        item->setRepresentedObject(nullptr);
        EXPECT_EQ(item->sendActionInfo(), Value(Dictionary{}));
    }
}

TEST(MenuItem, GivesBackARepresentedObjectOfAnyTypeWithoutHoldingTheMessage) {
    const Array mixed{0.5, Array{"x"}, Dictionary{{"k", false}}, plist::Data::copyOf("abc", 3)};
    for (const Value& token :
         {Value(7), Value(true), Value("ключ"), Value(plist::Date{12.5}), Value(mixed)}) {
        std::weak_ptr<const void> message;
        const auto item = SMMenuItem::initWithDictionary(
            received(Dictionary{{"representedObject", token}, {"title", "x"}}, &message));
        EXPECT_TRUE(message.expired()) << token.description();
        EXPECT_EQ(item->sendActionInfo()["representedObject"], token) << token.description();
    }
}

TEST(MenuItem, BuildsATreeWithParentsAndAlternatesWithout) {
    const auto folder = [](Array children) -> Value {
        return Dictionary{{"submenuInfoArray", std::move(children)}};
    };
    Value tree = Dictionary{{"itemState", 1}, {"altMenuItem", folder({})}};
    constexpr int depth = 250; // as deep as a message may be
    for (int i = 0; i < depth; ++i)
        tree = folder({tree, "junk"});
    const auto root = SMMenuItem::initWithDictionary(received(tree));
    auto leaf = root;
    for (int i = 0; i < depth; ++i) {
        EXPECT_EQ(leaf->submenu()->at(0)->parent(), leaf);
        EXPECT_EQ(leaf->submenuHasCheckmark(), i == depth - 1) << "of direct children only";
        leaf = leaf->submenu()->at(0);
    }
    EXPECT_EQ(leaf->submenu(), nullptr);
    EXPECT_TRUE(leaf->altMenuItem()->submenu()->empty());
    EXPECT_EQ(leaf->altMenuItem()->parent(), nullptr);
    EXPECT_TRUE(root->hasChildItem(root.get()) && root->hasChildItem(leaf.get()));
    EXPECT_FALSE(leaf->hasChildItem(root.get()) || root->hasChildItem(leaf->altMenuItem().get()) ||
                 root->hasChildItem(nullptr));
    EXPECT_EQ(SMMenuItem::initWithSubmenu({root})->submenu()->at(0)->parent(), nullptr);
}

TEST(MenuItem, MakesItsIconOnceFromTheFirstSourceThatItHas) {
    OneIcon icons;
    const Value raw =
        Dictionary{{"format", "bgra"}, {"width", 1}, {"height", 1}, {"data", plist::Data::copyOf("abcd", 4)}};
    const auto both =
        SMMenuItem::initWithDictionary(Dictionary{{"rawIcons", Array{raw}}, {"iconFileType", "txt"}});
    EXPECT_TRUE(both->icon()->isFlipped());
    EXPECT_EQ(both->icon(), both->icon());
    EXPECT_EQ(icons.asked, "");
    const auto broken =
        SMMenuItem::initWithDictionary(Dictionary{{"rawIcons", Array{"junk"}}, {"iconFileType", "pdf"}});
    EXPECT_EQ(broken->icon(), nullptr);
    EXPECT_TRUE(broken->icon()->isFlipped()) << "the raw icons are dropped, and the type is next";
    EXPECT_EQ(broken->icon(), broken->icon());
    EXPECT_EQ(icons.asked, "pdf ");
}

} // namespace
