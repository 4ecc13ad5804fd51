#include "lib/kxAppKit/KXAffineTransform.h"
#include "lib/kxAppKit/KXBezierPath.h"
#include "lib/kxAppKit/KXBitmapImageRep.h"
#include "lib/kxAppKit/KXColor.h"
#include "lib/kxAppKit/KXGeometry.h"
#include "lib/kxAppKit/KXImage.h"
#include "lib/kxAppKit/KXQtGeometry.h"
#include "lib/plist/Value.h"

#include <QGuiApplication>
#include <QPainter>
#include <cstdio>

// Draws the two pictures of docs/imaging.md into the folder that is named: QT_QPA_PLATFORM=offscreen
// build/release/bin/drawImagingPictures docs/images

namespace {

QImage canvas(int width, int height) {
    QImage image(width, height, QImage::Format_ARGB32_Premultiplied);
    image.fill(QColor(245, 245, 245));
    return image;
}

/// The icon of an application that does not exist, at one size.
QImage drawnIcon(int side) {
    QImage image(side, side, QImage::Format_ARGB32);
    image.fill(Qt::transparent);
    QPainter painter(&image);
    painter.setRenderHint(QPainter::Antialiasing);
    const auto unit = static_cast<float>(side) / 16;
    const KXRect plate{unit, unit, 14 * unit, 14 * unit};
    const KXBezierPath outline = KXBezierPath::bezierPathWithRoundRect(plate, 3 * unit);
    painter.setClipPath(outline.path());
    KXBezierPath::linearGradientFill(painter, plate, QColor(90, 150, 250), QColor(30, 60, 190));
    KXBezierPath::arrowInRect(KXInsetRect(plate, 4 * unit, 3.5F * unit), KXArrowDirectionRight)
        .fill(painter, Qt::white);
    KXBezierPath edge = outline;
    edge.setLineWidth(unit / 2);
    edge.strokeInside(painter, KXColor::blackWithAlpha(0.4F));
    return image;
}

/// As a server sends it: straight B, G, R, A, lowest row first.
plist::Value rawIcon(int side) {
    const QImage upsideDown = drawnIcon(side).mirrored();
    return plist::Dictionary{
        {"format", "bgra"},
        {"width", side},
        {"height", side},
        {"data",
         SharedBytes::copyOf(upsideDown.constBits(), static_cast<std::size_t>(upsideDown.sizeInBytes()))}};
}

QImage iconSet() {
    const auto image =
        KXImage::imageWithRawIcons(plist::Array{rawIcon(16), rawIcon(32), rawIcon(48), rawIcon(128)});
    QImage picture = canvas(760, 330);
    QPainter painter(&picture);
    int x = 10;
    for (const auto& rep : image->representations()) {
        const KXSize size = rep->pixelSize();
        rep->drawInRect(painter, {static_cast<float>(x), 10, size.width, size.height});
        x += static_cast<int>(size.width) + 20;
    }
    painter.drawImage(x, 10, image->selectedImage()->squareImage(128));
    x = 10;
    for (int side : {16, 20, 24, 32, 40, 64, 96, 160}) {
        painter.drawImage(x, 155, image->squareImage(side));
        x += side + 20;
    }
    const auto enlarged = image->imageByScalingToSize({160, 80}, true, KXImageInterpolation::high);
    painter.drawImage(x, 155, enlarged->bitmapImageRep()->premultipliedImage());
    return picture;
}

QImage shapes() {
    QImage picture = canvas(760, 140);
    QPainter painter(&picture);
    painter.setRenderHint(QPainter::Antialiasing);
    KXRect cell{20, 20, 100, 100};
    KXBezierPath round = KXBezierPath::bezierPathWithRoundRect(cell, 20);
    round.stroke(painter, Qt::black);
    cell.x += 120;
    round = KXBezierPath::bezierPathWithRoundRect(cell, 20);
    round.setLineWidth(12);
    round.strokeInside(painter, QColor(30, 70, 243));
    round.setLineWidth(1);
    round.stroke(painter, Qt::black);
    cell.x += 120;
    for (int direction = KXArrowDirectionUp; direction <= KXArrowDirectionRight; ++direction) {
        const KXRect quarter{cell.x + static_cast<float>(direction % 2 * 52),
                             cell.y + static_cast<float>(direction / 2 * 52), 44, 44};
        KXBezierPath::arrowInRect(quarter, direction).fill(painter, KXColor::darkBorderForView(nullptr));
    }
    cell.x += 120;
    KXBezierPath::xSymbolInRect(cell, 0.8F).stroke(painter, Qt::darkRed);
    cell.x += 120;
    painter.save();
    painter.setClipPath(KXBezierPath::bezierPathWithRoundRect(cell, 20).path());
    KXBezierPath::linearGradientFill(painter, cell, QColor(72, 105, 246), QColor(30, 70, 243, 0));
    painter.restore();
    cell.x += 120;
    // An upright figure of 10 x 20 in a frame of 100 x 100: all of it is visible, centred.
    painter.setTransform(*KXAffineTransform::transformConservingAspectFromBounds({0, 0, 10, 20}, cell), true);
    KXBezierPath::bezierPathWithRoundRect({0, 0, 10, 20}, 3).fill(painter, Qt::darkGreen);
    painter.resetTransform();
    painter.setPen(Qt::gray);
    painter.drawRect(KXQtRect(cell));
    return picture;
}

} // namespace

int main(int argc, char** argv) {
    const QGuiApplication application(argc, argv);
    if (argc != 2) return std::fprintf(stderr, "usage: %s FOLDER\n", argv[0]), 2;
    const QString folder = QString::fromLocal8Bit(argv[1]);
    return iconSet().save(folder + "/imaging-icons.png") && shapes().save(folder + "/imaging-shapes.png") ? 0
                                                                                                          : 1;
}
