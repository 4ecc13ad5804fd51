#include "app/SMTitlePopUpButton.h"

#include "app/menuMirroring.h"
#include "app/menuPicture.h"
#include "lib/base/Geometry.h"
#include "lib/kxAppKit/KXBezierPath.h"
#include "lib/kxAppKit/KXQtGeometry.h"

#include <QFontMetricsF>
#include <QPainter>
#include <QWheelEvent>
#include <algorithm>
#include <cmath>

namespace {

constexpr float titleInset = 14;
constexpr double titleRoom = 40;
constexpr float arrowGap = 7;
constexpr KXSize arrowSize{8, 6};

} // namespace

SMTitlePopUpButton::SMTitlePopUpButton(QWidget* parent)
    : QComboBox(parent) {
    setFocusPolicy(Qt::NoFocus);
}

void SMTitlePopUpButton::paintEvent(QPaintEvent*) {
    if (const QString title = currentText(); title != m_drawnTitle) {
        m_drawnTitle = title;
        m_picture.invalidate();
    }
    QPainter painter(this);
    m_picture.draw(painter, *this, [this](QPainter& onPicture) { drawTitle(onPicture); });
}

void SMTitlePopUpButton::drawTitle(QPainter& painter) const {
    QFont titleFont = font();
    titleFont.setBold(true);
    titleFont.setPixelSize(12);
    const QFontMetricsF metrics(titleFont);
    const double titleHeight = std::ceil(metrics.height());
    const double titleWidth =
        std::min(std::ceil(metrics.horizontalAdvance(m_drawnTitle)), width() - titleRoom);
    KXRect titleRect{titleInset, static_cast<float>(std::round((height() - titleHeight) * 0.5) - 1),
                     static_cast<float>(titleWidth), static_cast<float>(titleHeight)};
    KXRect arrow{titleRect.maxX() + arrowGap,
                 std::round((static_cast<float>(height()) - arrowSize.height) * 0.5F), arrowSize.width,
                 arrowSize.height};
    if (menuIsMirrored()) {
        titleRect = menuMirrored(titleRect, static_cast<float>(width()));
        arrow = menuMirrored(arrow, static_cast<float>(width()));
    }

    painter.setFont(titleFont);
    painter.setPen(Qt::white);
    painter.drawText(KXQtRect(titleRect), Qt::AlignLeft | Qt::TextSingleLine,
                     metrics.elidedText(m_drawnTitle, Qt::ElideMiddle, titleWidth));
    painter.setRenderHint(QPainter::Antialiasing);
    // "Up" is not the wrong way round: y grows downwards here, so the arrow points down.
    KXBezierPath::arrowInRect(arrow, KXArrowDirectionUp).fill(painter, Qt::white);
}

void SMTitlePopUpButton::wheelEvent(QWheelEvent* event) {
    event->ignore();
}
