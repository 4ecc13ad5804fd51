#include "app/SMStatusItemView.h"
#include "tests/support/GuiApplication.h"

#include <QImage>
#include <QPainter>
#include <QPalette>
#include <gtest/gtest.h>

namespace {

QImage drawn(SMStatusItemView& view) {
    QImage image(22, 26, QImage::Format_ARGB32_Premultiplied); // a host may grant another size
    image.fill(Qt::transparent);
    QPainter painter(&image);
    view.draw(painter, {22, 26});
    return image;
}

TEST(StatusItemView, DrawsItsIconInTheMiddleAndFillsItsBoundsOnlyWhileSelected) {
    ensureGuiApplication();
    SMStatusItemView view(22);
    const QImage plain = drawn(view);
    QRect ink;
    for (int i = 0; i < 22 * 26; ++i)
        if (qAlpha(plain.pixel(i % 22, i / 22))) ink |= QRect(i % 22, i / 22, 1, 1);
    EXPECT_EQ(ink, QRect(3, 5, 16, 16));
    view.setIsSelected(true);
    EXPECT_EQ(drawn(view).pixelColor(21, 25), QGuiApplication::palette().color(QPalette::Highlight));
    EXPECT_EQ(drawn(view).pixelColor(11, 13), QColor(Qt::white));
}

} // namespace
