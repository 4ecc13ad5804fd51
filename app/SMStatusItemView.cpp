#include "app/SMStatusItemView.h"

#include "lib/base/Geometry.h"
#include "lib/kxAppKit/KXGeometry.h"
#include "lib/kxAppKit/KXQtGeometry.h"

#include <QCoreApplication>
#include <QGuiApplication>
#include <QPainter>
#include <QPalette>
#include <QSvgRenderer>
#include <string>

namespace {

constexpr float margin = 8;

} // namespace

// Nobody else refers to them, and the linker leaves out what a static library holds for nobody. Not in a
// namespace: the macro declares a function of the resource file's.
static void loadResources() {
    Q_INIT_RESOURCE(app);
}

SMStatusItemView::SMStatusItemView(float thickness)
    : m_frameSize{thickness + margin, thickness} {
    loadResources();
}

void SMStatusItemView::setIsSelected(bool isSelected) {
    m_isSelected = isSelected;
    if (m_statusItem) m_statusItem->setNeedsDisplay();
}

void SMStatusItemView::draw(QPainter& painter, KXSize bounds) {
    if (m_isSelected)
        painter.fillRect(QRectF(0, 0, bounds.width, bounds.height), QGuiApplication::palette().highlight());
    QSvgRenderer icon(m_isSelected ? QStringLiteral(":/statusIconSelected") : QStringLiteral(":/statusIcon"));
    const QSizeF size = icon.defaultSize();
    const KXSize iconSize{static_cast<float>(size.width()), static_cast<float>(size.height())};
    icon.render(&painter, KXQtRect(KXRectCenteringSize({0, 0, bounds.width, bounds.height}, iconSize)));
}

std::string SMStatusItemView::toolTip() const {
    return QCoreApplication::translate("SMStatusItemView", "Start menu").toStdString();
}

void SMStatusItemView::sendAction() {
    if (m_action) m_action(*this);
}
