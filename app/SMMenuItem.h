#pragma once

#include "app/SMMenuModel.h"
#include "lib/plist/Value.h"

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>

class KXImage;

/// One node of the menu: an application, a folder, a command, a separator or a flexible space.
/// Main thread only. Children are shared by those who show them; `parent` is not held.
class SMMenuItem : public std::enable_shared_from_this<SMMenuItem> {
public:
    using Pointer = std::shared_ptr<SMMenuItem>;

    SMMenuItem() = default;
    /// From what the main application sent. A value of the wrong type counts as absent.
    static Pointer initWithDictionary(const plist::Value& dictionary);
    /// A folder over the given items, whose `parent` stays as it is: navigation depends on that.
    static Pointer initWithSubmenu(const SMMenuItems& items);
    static Pointer separatorItem();
    static Pointer flexibleSpaceItem();

    const std::optional<std::string>& action() const { return m_action; }
    std::int32_t tag() const { return m_tag; }
    const plist::Value& representedObject() const { return m_representedObject; }
    const std::string& title() const { return m_title; }
    bool enabled() const { return m_enabled; }
    std::int32_t itemState() const { return m_itemState; }
    bool isSeparator() const { return m_isSeparator; }
    bool isFlexibleSpace() const { return m_isFlexibleSpace; }
    bool hideTriangle() const { return m_hideTriangle; }
    const SMMenuModel::List& submenu() const { return m_submenu; } ///< null for a leaf
    Pointer parent() const { return m_parent.lock(); }
    const Pointer& altMenuItem() const { return m_altMenuItem; }

    /// Made on first use, then kept; null when the item has none.
    std::shared_ptr<KXImage> icon();

    plist::Value sendActionInfo() const;
    /// An item counts as its own child; null is nobody's.
    bool hasChildItem(const SMMenuItem* item) const;
    bool submenuHasCheckmark() const; ///< direct children only
    /// Below, equal or above zero: titles in case-insensitive order.
    int titleCompare(const SMMenuItem& other) const;

private:
    std::optional<std::string> m_action;
    std::int32_t m_tag = 0;
    plist::Value m_representedObject = std::string();
    std::string m_title;
    bool m_enabled = true;
    std::int32_t m_itemState = 0;
    bool m_isSeparator = false;
    bool m_isFlexibleSpace = false;
    bool m_hideTriangle = false;
    std::shared_ptr<KXImage> m_icon;
    plist::Value m_rawIcons;
    std::string m_iconFileType;
    SMMenuModel::List m_submenu;
    std::weak_ptr<SMMenuItem> m_parent;
    Pointer m_altMenuItem;
};
