#pragma once

#include "app/SMMenuModel.h"
#include "lib/plist/Value.h"

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <utility>

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
    void setAction(std::optional<std::string> action) { m_action = std::move(action); }
    std::int32_t tag() const { return m_tag; }
    void setTag(std::int32_t tag) { m_tag = tag; }
    const plist::Value& representedObject() const { return m_representedObject; }
    void setRepresentedObject(plist::Value object) { m_representedObject = std::move(object); }
    const std::string& title() const { return m_title; }
    void setTitle(std::string title) { m_title = std::move(title); }
    bool enabled() const { return m_enabled; }
    void setEnabled(bool enabled) { m_enabled = enabled; }
    std::int32_t itemState() const { return m_itemState; }
    void setItemState(std::int32_t state) { m_itemState = state; }
    bool isSeparator() const { return m_isSeparator; }
    void setIsSeparator(bool isSeparator) { m_isSeparator = isSeparator; }
    bool isFlexibleSpace() const { return m_isFlexibleSpace; }
    void setIsFlexibleSpace(bool isFlexibleSpace) { m_isFlexibleSpace = isFlexibleSpace; }
    bool hideTriangle() const { return m_hideTriangle; }
    void setHideTriangle(bool hideTriangle) { m_hideTriangle = hideTriangle; }
    const plist::Value& rawIcons() const { return m_rawIcons; } ///< nil once they are converted
    void setRawIcons(plist::Value rawIcons) { m_rawIcons = std::move(rawIcons); }
    const std::string& iconFileType() const { return m_iconFileType; } ///< empty once it is converted
    void setIconFileType(std::string type) { m_iconFileType = std::move(type); }
    const SMMenuModel::List& submenu() const { return m_submenu; } ///< null for a leaf
    void setSubmenu(SMMenuModel::List submenu) { m_submenu = std::move(submenu); }
    Pointer parent() const { return m_parent.lock(); }
    void setParent(const Pointer& parent) { m_parent = parent; }
    const Pointer& altMenuItem() const { return m_altMenuItem; }
    void setAltMenuItem(Pointer item) { m_altMenuItem = std::move(item); }

    /// Made on first use, then kept; null when the item has none.
    std::shared_ptr<KXImage> icon();
    void setIcon(std::shared_ptr<KXImage> icon) { m_icon = std::move(icon); }

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
