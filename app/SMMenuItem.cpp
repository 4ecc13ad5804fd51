#include "app/SMMenuItem.h"

#include "app/SMMenuModel.h"
#include "lib/kxAppKit/KXFileTypeIcons.h"
#include "lib/kxAppKit/KXImage.h"
#include "lib/plist/Value.h"

#include <QString>
#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <utility>

namespace {

/// A copy that does not keep the message alive in which the value came.
plist::Value detached(const plist::Value& value) {
    switch (value.type()) {
    case plist::Type::data:
        return plist::Data::copyOf(value.data().data(), value.data().size());
    case plist::Type::string:
        return value.stringOr("");
    case plist::Type::array: {
        plist::Array array;
        array.reserve(value.size());
        for (const auto& element : value)
            array.push_back(detached(element));
        return array;
    }
    case plist::Type::dictionary: {
        plist::Dictionary dictionary;
        for (std::size_t i = 0; i < value.size(); ++i)
            dictionary.set(value.keyAt(i), detached(value.at(i)));
        return dictionary;
    }
    case plist::Type::date:
        return value.dateValue();
    case plist::Type::real:
        return value.doubleValue();
    case plist::Type::boolean:
        return value.boolValue();
    case plist::Type::nil:
    case plist::Type::integer:
        break;
    }
    return value;
}

std::int32_t intValue(const plist::Value& value, std::int32_t fallback) {
    return value.isNumber() ? value.intValue() : fallback;
}

bool boolValue(const plist::Value& value, bool fallback) {
    return value.isNumber() ? value.boolValue() : fallback;
}

} // namespace

SMMenuItem::Pointer SMMenuItem::initWithDictionary(const plist::Value& dictionary) {
    auto item = std::make_shared<SMMenuItem>();
    item->m_action = dictionary["action"].string();
    item->m_tag = intValue(dictionary["tag"], item->m_tag);
    if (const auto object = dictionary["representedObject"]; !object.isNil())
        item->m_representedObject = detached(object);
    item->m_title = dictionary["title"].stringOr(item->m_title);
    item->m_enabled = boolValue(dictionary["enabled"], item->m_enabled);
    item->m_itemState = intValue(dictionary["itemState"], item->m_itemState);
    item->m_isSeparator = boolValue(dictionary["separatorItem"], item->m_isSeparator);
    item->m_hideTriangle = boolValue(dictionary["hideTriangle"], item->m_hideTriangle);
    item->m_iconFileType = dictionary["iconFileType"].stringOr(item->m_iconFileType);
    if (auto rawIcons = dictionary["rawIcons"]; rawIcons.isArray()) item->m_rawIcons = std::move(rawIcons);
    if (const auto children = dictionary["submenuInfoArray"]; children.isArray()) {
        auto submenu = std::make_shared<SMMenuItems>();
        submenu->reserve(children.size());
        for (const auto& info : children) {
            submenu->push_back(initWithDictionary(info));
            submenu->back()->m_parent = item;
        }
        item->m_submenu = std::move(submenu);
    }
    if (const auto alternate = dictionary["altMenuItem"]; alternate.isDictionary())
        item->m_altMenuItem = initWithDictionary(alternate);
    return item;
}

SMMenuItem::Pointer SMMenuItem::initWithSubmenu(const SMMenuItems& items) {
    auto item = std::make_shared<SMMenuItem>();
    item->m_submenu = std::make_shared<SMMenuItems>(items);
    return item;
}

SMMenuItem::Pointer SMMenuItem::separatorItem() {
    auto item = std::make_shared<SMMenuItem>();
    item->m_isSeparator = true;
    return item;
}

SMMenuItem::Pointer SMMenuItem::flexibleSpaceItem() {
    auto item = std::make_shared<SMMenuItem>();
    item->m_isFlexibleSpace = true;
    return item;
}

std::shared_ptr<KXImage> SMMenuItem::icon() {
    if (m_icon) return m_icon;
    if (!m_rawIcons.isNil())
        m_icon = KXImage::imageWithRawIcons(std::exchange(m_rawIcons, {}));
    else if (!m_iconFileType.empty())
        m_icon = KXFileTypeIcons::iconForFileType(std::exchange(m_iconFileType, {}));
    if (m_icon) m_icon->setFlipped(true);
    return m_icon;
}

plist::Value SMMenuItem::sendActionInfo() const {
    plist::Dictionary info;
    if (m_action) info.set("action", *m_action);
    if (m_tag != 0) info.set("tag", m_tag);
    if (!m_representedObject.isNil()) info.set("representedObject", m_representedObject);
    return info;
}

bool SMMenuItem::hasChildItem(const SMMenuItem* item) const {
    if (this == item) return true;
    return m_submenu &&
           std::ranges::any_of(*m_submenu, [item](const auto& child) { return child->hasChildItem(item); });
}

bool SMMenuItem::submenuHasCheckmark() const {
    return m_submenu &&
           std::ranges::any_of(*m_submenu, [](const auto& child) { return child->m_itemState != 0; });
}

int SMMenuItem::titleCompare(const SMMenuItem& other) const {
    return QString::fromStdString(m_title).compare(QString::fromStdString(other.m_title),
                                                   Qt::CaseInsensitive);
}
