#pragma once

#include "app/SMMenuCollectionView.h"
#include "app/SMMenuHostWidget.h"
#include "lib/kxAppKit/KXQtGeometry.h"

#include <QPixmap>
#include <cstddef>

/// Shows a list; paints its visible rows.
class SMMenuListWidget final : public SMMenuHostWidget, private SMMenuCollectionView::Host {
public:
    explicit SMMenuListWidget(QWidget* parent = nullptr);
    ~SMMenuListWidget() override { setList(nullptr); }
    SMMenuListWidget(const SMMenuListWidget&) = delete;
    SMMenuListWidget& operator=(const SMMenuListWidget&) = delete;

    /// Borrowed; null for none. The list takes the widget's size.
    void setList(SMMenuCollectionView* list);
    void fitList();
    SMMenuCollectionView* list() const { return m_list; }
    /// In the widget.
    QRectF placeOf(const SMMenuButton& row) const { return KXQtRect(fromUpwards(row.frame())); }
    /// Rows painted since the beginning, for those who count.
    std::size_t paintedRows() const { return m_paintedRows; }
    /// Slides from the list shown to another, which comes in from where text ends when `forward`. Returns
    /// when it is there; no event is handled meanwhile.
    void slideTo(SMMenuCollectionView* list, bool forward, const platform::Clock& clock);

protected:
    void paintEvent(QPaintEvent* event) override;

private:
    void setNeedsDisplay(const KXRect& area) override { update(KXQtRect(fromUpwards(area)).toAlignedRect()); }

    struct Slide {
        QPixmap before;
        QPixmap after;
        double beforeX;
        double afterX;
    };
    QPixmap picture();
    void drawRows(QPainter& painter, const QRectF& dirty);

    SMMenuCollectionView* m_list = nullptr;
    const Slide* m_slide = nullptr; ///< while one is under way
    std::size_t m_paintedRows = 0;
};
