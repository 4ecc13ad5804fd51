#pragma once

#include "app/SMMenuItem.h"
#include "app/menuRow.h"
#include "lib/base/Geometry.h"

#include <cstdint>
#include <functional>
#include <memory>
#include <string>

class MenuPainter;
class QPainter;
namespace platform {
class ModifierKeys;
}

/// One row of the menu, or one of its two stand-alone buttons. It knows its item, state, size and painting,
/// and is no widget: its superview shows it. Always owned by a shared pointer. Main thread only.
class SMMenuButton : public std::enable_shared_from_this<SMMenuButton> {
public:
    using Pointer = std::shared_ptr<SMMenuButton>;
    using Action = std::function<void(SMMenuButton& sender)>;

    /// What shows the button.
    class Superview {
    public:
        virtual void setNeedsDisplay(const SMMenuButton& button) = 0;

    protected:
        ~Superview() = default;
    };

    /// The keys are borrowed and must outlive the button.
    explicit SMMenuButton(const platform::ModifierKeys& keys)
        : m_keys(&keys) {}

    const SMMenuItem::Pointer& menuItem() const { return m_menuItem; }
    /// An item that cannot be chosen disables the button, for good.
    void setMenuItem(SMMenuItem::Pointer item);
    /// The item to show now: the alternate one while Option is held. Asked afresh at every call.
    const SMMenuItem::Pointer& curMenuItem() const;

    /// Of the item shown, else the button's own.
    const std::string& title() const;
    void setTitle(std::string title);

    bool highlighted() const { return m_highlighted; }
    void setHighlighted(bool highlighted);
    bool hasMouseOver() const { return m_hasMouseOver; }
    /// A scroll button sends its action at every call, whatever the value.
    void setHasMouseOver(bool hasMouseOver);
    bool isEnabled() const { return m_enabled; }
    bool canBecomeKeyView() const { return m_enabled; }

    std::int32_t style() const { return m_style; }
    void setStyle(std::int32_t style) { m_style = style; }
    std::int32_t indentation() const { return m_indentation; }
    void setIndentation(std::int32_t indentation);
    bool isScrollButton() const;

    /// Shared by the rows of a list.
    void setAction(std::shared_ptr<const Action> action) { m_action = std::move(action); }
    /// Does what a click does. The button lives through it.
    void sendAction();

    float preferredHeight() const;

    /// In the superview's coordinates, y upwards.
    const KXRect& frame() const { return m_frame; }
    void setFrame(const KXRect& frame) { m_frame = frame; }
    bool isHidden() const { return m_hidden; }
    void setHidden(bool hidden) { m_hidden = hidden; }
    /// Null while nothing shows the button.
    Superview* superview() const { return m_superview; }
    void setSuperview(Superview* superview) { m_superview = superview; }
    void setNeedsDisplay();

    /// Paints into (0, 0, size), y downwards.
    void draw(QPainter& painter, KXSize size, MenuPainter& tools) const;

private:
    MenuRowContent content(const SMMenuItem* item, KXSize size) const;
    bool isDrawnHighlighted() const { return m_enabled && (m_highlighted || m_hasMouseOver); }
    void drawContent(QPainter& painter, KXSize size, MenuPainter& tools, SMMenuItem* item) const;

    const platform::ModifierKeys* m_keys;
    SMMenuItem::Pointer m_menuItem;
    std::shared_ptr<const Action> m_action;
    Superview* m_superview = nullptr;
    std::string m_title;
    KXRect m_frame;
    std::int32_t m_style = SMMenuButtonStyleLeftPane;
    std::int32_t m_indentation = 0;
    bool m_highlighted = false;
    bool m_hasMouseOver = false;
    bool m_enabled = true;
    bool m_hidden = false;
};
