#pragma once

#include "lib/base/Geometry.h"

#include <QFont>
#include <QGlyphRun>
#include <QHash>
#include <QList>
#include <QPen>
#include <QRectF>
#include <cstdint>
#include <string>
#include <unordered_map>

class KXImage;
class QPainter;
namespace platform {
class UserDefaults;
}

/// A gradient from top to bottom.
struct MenuGradient {
    std::uint8_t start[3];
    std::uint8_t end[3];
    float alpha;
};

enum class MenuGradientUse { rowHighlight, topPane };
/// `colorVariant` is the appearance the user has set; 6 is graphite, everything else blue.
const MenuGradient& menuGradient(MenuGradientUse use, int colorVariant);

/// The line of a rectangle's top edge that is as thick as the rectangle, in whole device pixels, at least
/// one.
QRectF MenuHairline(const QPainter& painter, const QRectF& rect);

/// What the menu's parts paint with; keeps what is costly to make: shaped text, in the widths it was drawn
/// at. Rectangles count y downwards. Text is UTF-8. Main thread only.
class MenuPainter {
public:
    /// `defaults` is borrowed.
    explicit MenuPainter(const platform::UserDefaults& defaults);

    /// The appearance the user has set.
    int colorVariant() const;

    /// On one line, unshortened, in whole points.
    KXSize textSize(const std::string& text);
    /// At the rectangle's top left, with an ellipsis where it is too long.
    void drawText(QPainter& painter, const std::string& text, const KXRect& rect, float white);

    void fillWhite(QPainter& painter, const KXRect& rect, float white, float alpha) const;
    void fillArrow(QPainter& painter, const KXRect& rect, std::int32_t direction, float white) const;
    void fillHighlight(QPainter& painter, const KXRect& rect) const;
    void fillGradient(QPainter& painter, const KXRect& rect, MenuGradientUse use) const;
    void drawIcon(QPainter& painter, const KXImage& image, const KXRect& rect) const;

private:
    struct Text {
        KXSize size;
        float width = -1; ///< that the glyphs were made for
        QList<QGlyphRun> glyphs;
    };
    Text& textFor(const std::string& text);
    const QPen& pen(float white);

    const platform::UserDefaults& m_defaults;
    QFont m_font;
    QHash<int, QPen> m_pens;
    std::unordered_map<std::string, Text> m_texts;
};
