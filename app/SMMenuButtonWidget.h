#pragma once

#include "app/SMMenuButton.h"
#include "app/SMMenuHostWidget.h"

/// Shows one of the two buttons that stand outside of the lists.
class SMMenuButtonWidget final : public SMMenuHostWidget, private SMMenuButton::Superview {
public:
    explicit SMMenuButtonWidget(QWidget* parent = nullptr);

    /// Borrowed; null for none.
    void setButton(SMMenuButton* button);
    const SMMenuButton* button() const { return m_button; }

protected:
    void paintEvent(QPaintEvent* event) override;

private:
    void setNeedsDisplay(const SMMenuButton&) override { update(); }

    SMMenuButton* m_button = nullptr;
};
