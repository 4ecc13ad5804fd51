#include "app/SMStatusItemView.h"
#include "tests/support/GuiApplication.h"

#include <QImage>
#include <QPainter>
#include <QPalette>
#include <gtest/gtest.h>

namespace {

QImage drawn(SMStatusItemView& view, QSize size) {
    ensureGuiApplication();
    QImage image(size, QImage::Format_ARGB32_Premultiplied);
    image.fill(Qt::transparent);
    QPainter painter(&image);
    view.draw(painter, {static_cast<float>(size.width()), static_cast<float>(size.height())});
    return image;
}

/// The part of the picture that differs from its corner's colour.
QRect ink(const QImage& image) {
    QRect rect;
    for (int y = 0; y < image.height(); ++y)
        for (int x = 0; x < image.width(); ++x)
            if (image.pixel(x, y) != image.pixel(0, 0)) rect |= QRect(x, y, 1, 1);
    return rect;
}

TEST(StatusItemView, DrawsItsIconInTheMiddleAndFillsItsBoundsOnlyWhileSelected) {
    SMStatusItemView view(22);
    EXPECT_EQ(view.frameSize(), (KXSize{30, 22}));
    EXPECT_EQ(SMStatusItemView::iconRect({30, 23}, {17, 16}), (KXRect{7, 4, 17, 16}))
        << "halves away from zero";
    EXPECT_EQ(SMStatusItemView::iconRect({22, 22}, {48, 25}), (KXRect{-13, -2, 48, 25}))
        << "clipped, not scaled";

    EXPECT_EQ(qAlpha(drawn(view, {30, 22}).pixel(0, 0)), 0);
    EXPECT_EQ(ink(drawn(view, {30, 22})), QRect(7, 3, 16, 16));
    EXPECT_EQ(ink(drawn(view, {22, 26})), QRect(3, 5, 16, 16)) << "a host may grant another size";
    view.setIsSelected(true);
    const QImage selected = drawn(view, {30, 22});
    EXPECT_EQ(selected.pixelColor(29, 21), QGuiApplication::palette().color(QPalette::Highlight));
    EXPECT_EQ(selected.pixelColor(15, 11), QColor(Qt::white));
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
