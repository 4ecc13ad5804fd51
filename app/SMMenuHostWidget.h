#pragma once

#include "lib/base/Geometry.h"

#include <QWidget>

class MenuPainter;

/// A widget that shows what is no widget itself. It sees no mouse: its window tracks that for all.
class SMMenuHostWidget : public QWidget {
public:
    using QWidget::QWidget;

    /// Borrowed; before the first painting.
    void setPainter(MenuPainter* tools) { m_tools = tools; }
    MenuPainter& tools() const { return *m_tools; }

protected:
    /// The one place where rectangles that count y upwards become this widget's.
    KXRect fromUpwards(const KXRect& rect) const {
        return {rect.x, static_cast<float>(height()) - rect.maxY(), rect.width, rect.height};
    }

private:
    MenuPainter* m_tools = nullptr;
};
