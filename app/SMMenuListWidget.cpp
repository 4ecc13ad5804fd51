#include "app/SMMenuListWidget.h"

#include "app/SMMenuButton.h"
#include "app/SMMenuCollectionView.h"
#include "app/SMMenuHostWidget.h"
#include "lib/base/Geometry.h"
#include "platform/Clock.h"

#include <QPaintEvent>
#include <QPainter>
#include <algorithm>
#include <chrono>

namespace {

constexpr std::chrono::milliseconds slideDuration{100};
constexpr std::chrono::microseconds frameInterval{16667};

} // namespace

SMMenuListWidget::SMMenuListWidget(QWidget* parent)
    : SMMenuHostWidget(parent) {
    setAttribute(Qt::WA_TransparentForMouseEvents);
}

void SMMenuListWidget::setList(SMMenuCollectionView* list) {
    if (m_list) m_list->setHost(nullptr);
    m_list = list;
    if (!m_list) return;
    m_list->setHost(this);
    fitList();
    update();
}

void SMMenuListWidget::fitList() {
    const KXSize wanted{static_cast<float>(width()), static_cast<float>(height())};
    if (m_list && m_list->size() != wanted) m_list->setSize(wanted);
}

QPixmap SMMenuListWidget::picture() {
    const double ratio = devicePixelRatioF();
    QPixmap picture((QSizeF(size()) * ratio).toSize());
    picture.setDevicePixelRatio(ratio);
    picture.fill(Qt::transparent);
    QPainter painter(&picture);
    drawRows(painter, rect());
    return picture;
}

void SMMenuListWidget::slideTo(SMMenuCollectionView* list, bool forward, const platform::Clock& clock) {
    const bool comesFromRight = forward == (layoutDirection() == Qt::LeftToRight);
    const double distance = comesFromRight ? width() : -width();
    Slide slide{picture(), {}, 0, distance};
    setList(list);
    list->viewWillDraw();
    slide.after = picture();
    m_slide = &slide;
    const auto start = clock.now();
    for (int frame = 1;; ++frame) {
        const double elapsed = std::chrono::duration<double>(clock.now() - start) / slideDuration;
        const double t = std::min(1.0, elapsed);
        const double eased = t * t * (3 - 2 * t);
        slide.beforeX = -distance * eased;
        slide.afterX = distance * (1 - eased);
        repaint();
        if (t >= 1) break;
        clock.sleepUntil(start + frame * frameInterval);
    }
    m_slide = nullptr;
}

void SMMenuListWidget::paintEvent(QPaintEvent* event) {
    QPainter painter(this);
    if (m_slide) {
        painter.drawPixmap(QPointF(m_slide->beforeX, 0), m_slide->before);
        painter.drawPixmap(QPointF(m_slide->afterX, 0), m_slide->after);
    } else {
        drawRows(painter, event->rect());
    }
}

void SMMenuListWidget::drawRows(QPainter& painter, const QRectF& dirty) {
    if (!m_list) return;
    m_list->forEachVisibleButton([&](const SMMenuButton& button) {
        const QRectF place = placeOf(button);
        if (!place.intersects(dirty)) return;
        painter.translate(place.topLeft()); // and back: saving the painter's state would allocate
        ++m_paintedRows;
        button.draw(painter, button.frame().size(), tools());
        painter.translate(-place.topLeft());
    });
}
