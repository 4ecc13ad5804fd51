#include "app/menuPainter.h"

#include "lib/base/Geometry.h"
#include "lib/kxAppKit/KXBezierPath.h"
#include "lib/kxAppKit/KXImage.h"
#include "lib/kxAppKit/KXQtGeometry.h"
#include "platform/UserDefaults.h"

#include <QFontMetricsF>
#include <QGuiApplication>
#include <QPainter>
#include <QTextLayout>
#include <QtMath>
#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <string>

namespace {

constexpr int fontSize = 12;
constexpr int graphiteVariant = 6;
constexpr std::size_t keptTexts = 4096;

/// From top to bottom.
struct MenuGradient {
    std::uint8_t start[3];
    std::uint8_t end[3];
    float alpha;
};
/// By use, then for blue and graphite.
constexpr MenuGradient gradients[2][2] = {
    {{{81, 112, 246}, {26, 67, 243}, 1}, {{106, 114, 122}, {85, 94, 105}, 1}},
    {{{72, 105, 246}, {30, 70, 243}, 0.95F}, {{107, 115, 123}, {88, 98, 108}, 0.95F}},
};

QColor grey(float white, float alpha) {
    return QColor::fromRgbF(white, white, white, alpha);
}

/// The colour at `part` of the way down.
QColor mixed(const MenuGradient& colors, double part) {
    const auto channel = [&](std::size_t i) {
        return qRound(colors.start[i] + part * (colors.end[i] - colors.start[i]));
    };
    QColor color(channel(0), channel(1), channel(2));
    color.setAlphaF(colors.alpha);
    return color;
}

QFont menuFont() {
    QFont font = QGuiApplication::font();
    font.setPixelSize(fontSize);
    return font;
}

QString singleLine(const std::string& text) {
    QString line = QString::fromStdString(text);
    const auto isBreak = [](QChar c) {
        return c < u' ' || c == QChar::LineSeparator || c == QChar::ParagraphSeparator;
    };
    std::replace_if(line.begin(), line.end(), isBreak, u' ');
    return line;
}

/// Lays the line out with its top left at (0, 0).
QTextLine layOut(QTextLayout& layout) {
    layout.beginLayout();
    QTextLine line = layout.createLine();
    line.setPosition({0, 0});
    layout.endLayout();
    return line;
}

/// One pixel of the picture is one of the device, so nothing is scaled again and the edges stay sharp.
void drawPixels(QPainter& painter, const QImage& picture, QPointF corner, double ratio) {
    const QTransform toDevice = painter.deviceTransform();
    const QPointF device = toDevice.map(corner);
    const QPointF snapped = toDevice.inverted().map(QPointF(std::round(device.x()), std::round(device.y())));
    painter.drawImage(QRectF(snapped, QSizeF(picture.size()) / ratio), picture);
}

/// The line of a rectangle's top edge that is as thick as the rectangle, in whole device pixels, at least
/// one.
QRectF hairline(const QPainter& painter, const QRectF& rect) {
    const QTransform toDevice = painter.deviceTransform();
    const QRectF device = toDevice.mapRect(rect);
    const double thickness = std::max(1.0, std::floor(toDevice.m22() * rect.height() + 1e-4));
    return toDevice.inverted().mapRect(
        QRectF(device.left(), std::floor(device.top() + 0.5), device.width(), thickness));
}

} // namespace

MenuPainter::MenuPainter(const platform::UserDefaults& defaults)
    : m_defaults(defaults)
    , m_font(menuFont()) {}

void MenuPainter::prepareFonts(const std::string& text) {
    QImage scratch(fontSize, fontSize, QImage::Format_ARGB32_Premultiplied);
    QPainter painter(&scratch);
    painter.setFont(menuFont());
    painter.drawText(0, fontSize, singleLine(text));
}

int MenuPainter::colorVariant() const {
    return m_defaults.integerForKey("AppleAquaColorVariant");
}

MenuPainter::Text& MenuPainter::textFor(const std::string& text) {
    if (const auto known = m_texts.find(text); known != m_texts.end()) return known->second;
    if (m_texts.size() >= keptTexts) m_texts.clear();
    ++m_madeAnew;
    QTextLayout layout(singleLine(text), m_font);
    const QTextLine line = layOut(layout);
    Text& entry = m_texts[text];
    entry.size = {static_cast<float>(std::ceil(line.naturalTextWidth())),
                  static_cast<float>(std::ceil(QFontMetricsF(m_font).height()))};
    entry.glyphs.emplace(entry.size.width, layout.glyphRuns());
    return entry;
}

KXSize MenuPainter::textSize(const std::string& text) {
    return textFor(text).size;
}

const QPen& MenuPainter::pen(float white) {
    // A pen that is kept costs no allocation when it is set.
    QPen& pen = m_pens[qRound(white * 255)];
    if (pen.color() != grey(white, 1)) pen = QPen(grey(white, 1));
    return pen;
}

void MenuPainter::drawText(QPainter& painter, const std::string& text, const KXRect& rect, float white) {
    Text& entry = textFor(text);
    const float width = std::min(rect.width, entry.size.width);
    if (width <= 0) return;
    auto made = entry.glyphs.find(width);
    if (made == entry.glyphs.end()) {
        ++m_madeAnew;
        QTextLayout layout(QFontMetricsF(m_font).elidedText(singleLine(text), Qt::ElideRight, width), m_font);
        layOut(layout);
        made = entry.glyphs.emplace(width, layout.glyphRuns()).first;
    }
    painter.setPen(pen(white));
    for (const QGlyphRun& glyphs : made->second)
        painter.drawGlyphRun(KXQtPoint(rect.origin()), glyphs);
}

void MenuPainter::fillWhite(QPainter& painter, const KXRect& rect, float white, float alpha) const {
    const QRectF area = rect.height == 1 ? hairline(painter, KXQtRect(rect)) : KXQtRect(rect);
    painter.fillRect(area, grey(white, alpha));
}

const QImage& MenuPainter::arrow(KXSize size, std::int32_t direction, float white, double ratio) {
    QImage& picture =
        m_arrows[{size.width, size.height, static_cast<float>(direction), white, static_cast<float>(ratio)}];
    if (!picture.isNull()) return picture;
    ++m_madeAnew;
    picture =
        QImage(qCeil(size.width * ratio), qCeil(size.height * ratio), QImage::Format_ARGB32_Premultiplied);
    picture.fill(Qt::transparent);
    QPainter painter(&picture);
    painter.setRenderHint(QPainter::Antialiasing);
    painter.scale(ratio, ratio);
    KXBezierPath::arrowInRect({0, 0, size.width, size.height}, direction).fill(painter, grey(white, 1));
    return picture;
}

void MenuPainter::fillArrow(QPainter& painter, const KXRect& rect, std::int32_t direction, float white) {
    const double ratio = painter.device()->devicePixelRatioF();
    drawPixels(painter, arrow(rect.size(), direction, white, ratio), KXQtPoint(rect.origin()), ratio);
}

void MenuPainter::fillGradient(QPainter& painter, const KXRect& rect, MenuGradientUse use) const {
    const MenuGradient& colors =
        gradients[use == MenuGradientUse::topPane][colorVariant() == graphiteVariant];
    // Line by line: a gradient of the toolkit's would be made anew, with its table, at every painting.
    const QTransform toDevice = painter.deviceTransform();
    const QTransform fromDevice = toDevice.inverted();
    const QRectF device = toDevice.mapRect(KXQtRect(rect));
    const int top = qRound(device.top());
    const int bottom = qRound(device.bottom());
    for (int y = top; y < bottom; ++y) {
        const QRectF line(device.left(), y, device.width(), 1);
        painter.fillRect(fromDevice.mapRect(line), mixed(colors, (y - top + 0.5) / (bottom - top)));
    }
}

void MenuPainter::drawIcon(QPainter& painter, const KXImage& image, const KXRect& rect) const {
    const double ratio = painter.device()->devicePixelRatioF();
    const float extent = std::max(rect.width, rect.height);
    const QImage picture = image.squareImage(qRound(static_cast<double>(extent) * ratio));
    if (picture.isNull()) return;
    const QPointF corner =
        KXQtPoint({rect.x - (extent - rect.width) / 2, rect.y - (extent - rect.height) / 2});
    drawPixels(painter, picture, corner, ratio);
}
