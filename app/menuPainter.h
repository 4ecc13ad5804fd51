#pragma once

#include "lib/base/Geometry.h"

#include <QFont>
#include <QGlyphRun>
#include <QHash>
#include <QImage>
#include <QList>
#include <QPen>
#include <array>
#include <cstddef>
#include <cstdint>
#include <map>
#include <string>
#include <unordered_map>

class KXImage;
class QPainter;
namespace platform {
class UserDefaults;
}

enum class MenuGradientUse { rowHighlight, topPane };

/// What the menu's parts paint with; keeps what is costly to make: shaped text, in the widths it was drawn
/// at. Rectangles count y downwards. Text is UTF-8. Main thread only.
class MenuPainter {
public:
    /// `defaults` is borrowed.
    explicit MenuPainter(const platform::UserDefaults& defaults);

    /// Loads the fonts that the text needs, and shapes and fills it once: the first text in a script takes
    /// most of a frame.
    static void prepareFonts(const std::string& text);

    /// The appearance the user has set: 6 is graphite, everything else blue.
    int colorVariant() const;

    /// On one line, unshortened, in whole points.
    KXSize textSize(const std::string& text);
    /// At the rectangle's top left, with an ellipsis where it is too long.
    void drawText(QPainter& painter, const std::string& text, const KXRect& rect, float white);

    void fillWhite(QPainter& painter, const KXRect& rect, float white, float alpha) const;
    void fillArrow(QPainter& painter, const KXRect& rect, std::int32_t direction, float white);
    void fillGradient(QPainter& painter, const KXRect& rect, MenuGradientUse use) const;
    void drawIcon(QPainter& painter, const KXImage& image, const KXRect& rect) const;

    /// How many texts were shaped and arrows filled, because they were not kept from an earlier painting.
    std::size_t madeAnew() const { return m_madeAnew; }

private:
    struct Text {
        KXSize size;
        std::map<float, QList<QGlyphRun>> glyphs; ///< by the width that they were made for
    };
    Text& textFor(const std::string& text);
    const QPen& pen(float white);
    const QImage& arrow(KXSize size, std::int32_t direction, float white, double ratio);

    const platform::UserDefaults& m_defaults;
    QFont m_font;
    QHash<int, QPen> m_pens;
    std::unordered_map<std::string, Text> m_texts;
    std::map<std::array<float, 5>, QImage> m_arrows; ///< by size, direction, grey and scale
    std::size_t m_madeAnew = 0;
};
