#pragma once

#include "platform/StatusBar.h"

#include <functional>

/// The start menu's place in the bar: its icon, highlighted while the menu is open. A press of either button
/// sends the action.
class SMStatusItemView final : public platform::StatusItemView {
public:
    using Action = std::function<void(SMStatusItemView& sender)>;

    /// As wide as the bar is thick, and 8 points more.
    explicit SMStatusItemView(float thickness);

    void setAction(Action action) { m_action = std::move(action); }
    /// Where a redraw is asked for: the item that shows this view, or null for none. Not held.
    void setStatusItem(platform::StatusItem* item) { m_statusItem = item; }

    bool isSelected() const { return m_isSelected; }
    void setIsSelected(bool isSelected);               ///< asks for a redraw, also when nothing changes
    KXRect windowRect() const { return m_windowRect; } ///< kept for its owner, of no use to the view
    void setWindowRect(KXRect rect) { m_windowRect = rect; }

    KXSize frameSize() const override { return m_frameSize; }
    void draw(QPainter& painter, KXSize bounds) override;
    void mouseDown() override { sendAction(); }
    void rightMouseDown() override { sendAction(); }
    std::string toolTip() const override;

private:
    void sendAction();

    KXSize m_frameSize;
    Action m_action;
    platform::StatusItem* m_statusItem = nullptr;
    bool m_isSelected = false;
    KXRect m_windowRect;
};
