#include "app/SMStatusItemView.h"
#include "tests/support/GuiApplication.h"

#include <QImage>
#include <QPainter>
#include <QPalette>
#include <gtest/gtest.h>

namespace {

QImage drawn(SMStatusItemView& view) {
    ensureGuiApplication();
    QImage image(22, 26, QImage::Format_ARGB32_Premultiplied); // a host may grant another size
    image.fill(Qt::transparent);
    QPainter painter(&image);
    view.draw(painter, {22, 26});
    return image;
}

TEST(StatusItemView, DrawsItsIconInTheMiddleAndFillsItsBoundsOnlyWhileSelected) {
    SMStatusItemView view(22);
    EXPECT_EQ(view.frameSize(), (KXSize{30, 22}));
    EXPECT_EQ(SMStatusItemView::iconRect({30, 23}, {17, 16}), (KXRect{7, 4, 17, 16}))
        << "halves away from zero";
    EXPECT_EQ(SMStatusItemView::iconRect({22, 22}, {48, 25}), (KXRect{-13, -2, 48, 25}))
        << "clipped, not scaled";

    const QImage plain = drawn(view);
    QRect ink;
    for (int i = 0; i < 22 * 26; ++i)
        if (qAlpha(plain.pixel(i % 22, i / 22))) ink |= QRect(i % 22, i / 22, 1, 1);
    EXPECT_EQ(ink, QRect(3, 5, 16, 16));
    view.setIsSelected(true);
    EXPECT_EQ(drawn(view).pixelColor(21, 25), QGuiApplication::palette().color(QPalette::Highlight));
    EXPECT_EQ(drawn(view).pixelColor(11, 13), QColor(Qt::white));
}

TEST(StatusItemView, SendsItsActionForEitherButton) {
    SMStatusItemView view(22);
    view.mouseDown();
    std::vector<SMStatusItemView*> senders;
    view.setAction([&](SMStatusItemView& sender) { senders.push_back(&sender); });
    view.mouseDown();
    view.rightMouseDown();
    EXPECT_EQ(senders, (std::vector{&view, &view}));
}

} // namespace
