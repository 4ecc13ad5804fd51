// Holds the menu to pictures that people have looked at: tests/data/menu. With KX_RENEW_PICTURES set it draws
// them anew instead; look at each before it is kept.

#include "platform/linux/QtWindowServer.h"
#include "tests/app/PanelFixtures.h"
#include "tests/support/GuiApplication.h"

#include <QFontDatabase>
#include <QPainter>
#include <QScreen>
#include <QTest>
#include <gtest/gtest.h>

namespace {

/// Text that comes out alike wherever the font is: the environment names a font configuration of its own.
void ensureFixedFont() {
    ensureGuiApplication().setCursorFlashTime(0);
    const int id = QFontDatabase::addApplicationFont("/usr/share/fonts/truetype/dejavu/DejaVuSans.ttf");
    ASSERT_GE(id, 0);
    QFont font(QFontDatabase::applicationFontFamilies(id).constFirst());
    font.setPixelSize(12);
    font.setHintingPreference(QFont::PreferNoHinting);
    font.setStyleStrategy(QFont::NoSubpixelAntialias);
    QApplication::setFont(font);
}

/// At most one pixel in a thousand may differ by more than 2 in a channel.
void expectPicture(const QImage& drawn, const char* stem, double scale = 1) {
    const QString name = scale == 1 ? QString(stem) : QStringLiteral("%1-%2").arg(stem).arg(scale);
    const QString path = QStringLiteral(KX_PICTURES "/") + name + ".png";
    const QImage picture = drawn.convertToFormat(QImage::Format_RGB32);
    if (qEnvironmentVariableIsSet("KX_RENEW_PICTURES")) {
        ASSERT_TRUE(picture.save(path));
        return;
    }
    const QImage golden = QImage(path).convertToFormat(QImage::Format_RGB32);
    ASSERT_EQ(golden.size(), picture.size()) << name.toStdString();
    const int pixels = golden.width() * golden.height();
    int different = 0;
    for (int i = 0; i < pixels; ++i) {
        const QColor a = golden.pixelColor(i % golden.width(), i / golden.width());
        const QColor b = picture.pixelColor(i % golden.width(), i / golden.width());
        different += std::max({std::abs(a.red() - b.red()), std::abs(a.green() - b.green()),
                               std::abs(a.blue() - b.blue())}) > 2;
    }
    const bool alike = different * 1000 <= pixels;
    EXPECT_TRUE(alike) << name.toStdString() << ": " << different << " pixels differ";
    if (!alike) picture.save(name + "-drawn.png");
}

/// A frame round a colour, so that a lost row or column shows.
plist::Value iconInfo(int side, int hue) {
    QImage icon(side, side, QImage::Format_ARGB32);
    icon.fill(QColor(128, 0, 0));
    QPainter(&icon).fillRect(1, 1, side - 2, side - 2, QColor(128, 255 - hue, hue));
    const auto pixels = plist::Data::copyOf(icon.constBits(), static_cast<std::size_t>(icon.sizeInBytes()));
    return plist::Dictionary{{"format", "bgra"}, {"width", side}, {"height", side}, {"data", pixels}};
}
plist::Value appInfo(const std::string& title, plist::Dictionary extra = {}) {
    const auto hue = static_cast<int>(title.size() * 16 % 256);
    return extra.set("title", title).set("rawIcons", plist::Array{iconInfo(16, hue), iconInfo(32, hue)});
}

struct MenuPictures : testing::Test, PanelWorld {
    void SetUp() override {
        ensureFixedFont();
        auto& menu = owner.contents;
        menu.nameList = {"Windows, the machine with quite a long name"};
        menu.topMenu = listOf({leafInfo("Documents"), leafInfo("", {{"separatorItem", true}}),
                               folderInfo("Recent", {leafInfo("one")})});
        menu.bottomMenu = listOf({leafInfo("Run…", {{"enabled", false}})});
        menu.pinnedApps = listOf({appInfo("Mail"), appInfo("Веб-обозреватель"), appInfo("بريد")});
        menu.frequentlyUsedApps =
            listOf({appInfo("An application whose title is much too long for its row in the list")});
        menu.searchableApps = listOf({appInfo("Mail"), appInfo("Terminal"), appInfo("Settings")});
        const auto inner = folderInfo("Games", {appInfo("Dice"), appInfo("Cards", {{"itemState", 1}}),
                                                appInfo("Chess", {{"itemState", 2}})});
        const auto outer = folderInfo("Leisure", {inner, appInfo("Music")});
        menu.allProgramsMenu =
            SMMenuItem::initWithSubmenu(*listOf({appInfo("Editor"), outer, appInfo("Zip")}));
        open();
    }
    /// As high on a low screen as on others.
    void open() {
        makeWindow(server);
        window->setFrame({0, 0, 480, 550});
        window->showMenuWindow();
    }
    QImage picture() {
        controller().leftMenuCollectionView().viewWillDraw();
        controller().rightMenuCollectionView().viewWillDraw();
        return view->grab().toImage();
    }

    platform::QtWindowServer server;
};

/// Once for every scale, and once with screens of two scales.
TEST_F(MenuPictures, OfThePanelOnEveryScreen) {
    for (const QScreen* screen : QGuiApplication::screens()) {
        view->windowHandle()->setScreen(const_cast<QScreen*>(screen));
        for (const int y : {150, 151})
            QTest::mouseMove(view, QPoint(300, y));
        expectPicture(picture(), "home", screen->devicePixelRatio());
    }
}

TEST_F(MenuPictures, OfThePanelMirrored) {
    QGuiApplication::setLayoutDirection(Qt::RightToLeft);
    open();
    expectPicture(picture(), "mirrored");
    QGuiApplication::setLayoutDirection(Qt::LeftToRight);
}

TEST_F(MenuPictures, OfThePanelInItsOtherStatesAndInGraphite) {
    for (const int y : {150, 151})
        QTest::mouseMove(view, QPoint(300, y));
    defaults.values["AppleAquaColorVariant"] = 6;
    expectPicture(picture(), "graphite");
    defaults.values.clear();
    QTest::keyClicks(field, "ma");
    expectPicture(picture(), "search");
    controller().actionButton()->sendAction();
    controller().actionButton()->sendAction();
    const auto outer = owner.contents.allProgramsMenu->submenu()->at(1);
    controller().rightMenuCollectionView().setExpandedMenuItem(outer->submenu()->at(0));
    expectPicture(picture(), "folder");
}

TEST_F(MenuPictures, OfEveryStyleOfRowAtEveryScale) {
    const auto row = listOf({appInfo("Row"), plist::Dictionary{{"separatorItem", true}},
                             folderInfo("Folder", {leafInfo("one")})});
    for (const double scale : {1.0, 1.25, 1.5, 2.0, 3.0}) {
        MenuPainter tools(defaults);
        QImage image((QSizeF(200, 550) * scale).toSize(), QImage::Format_ARGB32_Premultiplied);
        image.setDevicePixelRatio(scale);
        image.fill(Qt::white);
        QPainter painter(&image);
        for (std::int32_t style = SMMenuButtonStyleLeftPane; style <= SMMenuButtonStyleScrollDown; ++style)
            for (const auto& item : *row) {
                auto button = std::make_shared<SMMenuButton>(keys);
                button->setStyle(style);
                button->setMenuItem(item);
                button->setIndentation(style == SMMenuButtonStyleList ? 1 : 0);
                button->setHighlighted(item->submenu() != nullptr);
                const float height = button->preferredHeight();
                button->draw(painter, {200, height}, tools);
                painter.translate(0, static_cast<double>(height) + 3);
            }
        painter.end();
        expectPicture(image, "rows", scale);
    }
}

} // namespace
