// Holds the menu to pictures that people have looked at: tests/data/menu. With KX_RENEW_PICTURES set it draws
// them anew instead; look at each before it is kept.

#include "platform/linux/QtWindowServer.h"
#include "tests/app/PanelFixtures.h"

#include <QFontDatabase>
#include <QPainter>
#include <QScreen>
#include <QTest>
#include <gtest/gtest.h>

namespace {

/// Text that comes out alike wherever the font is: the environment names a font configuration of its own.
void ensureFixedFont() {
    static int count = 1;
    static char name[] = "test";
    static char* arguments[] = {name, nullptr};
    static auto* application = new QApplication(count, arguments);
    const int id = QFontDatabase::addApplicationFont("/usr/share/fonts/truetype/dejavu/DejaVuSans.ttf");
    ASSERT_GE(id, 0);
    QFont font(QFontDatabase::applicationFontFamilies(id).constFirst());
    font.setPixelSize(12);
    font.setHintingPreference(QFont::PreferNoHinting);
    font.setStyleStrategy(QFont::NoSubpixelAntialias);
    QApplication::setFont(font);
    application->setCursorFlashTime(0);
}

/// At most one pixel in a thousand may differ by more than 2 in a channel.
void expectPicture(const QImage& drawn, const QString& name) {
    const QString path = QStringLiteral(KX_PICTURES "/") + name + ".png";
    const QImage picture = drawn.convertToFormat(QImage::Format_RGB32);
    if (qEnvironmentVariableIsSet("KX_RENEW_PICTURES")) {
        ASSERT_TRUE(picture.save(path));
        return;
    }
    const QImage golden = QImage(path).convertToFormat(QImage::Format_RGB32);
    ASSERT_EQ(golden.size(), picture.size()) << name.toStdString();
    int different = 0;
    for (int y = 0; y < golden.height(); ++y)
        for (int x = 0; x < golden.width(); ++x) {
            const QRgb a = golden.pixel(x, y), b = picture.pixel(x, y);
            const int distance = std::max({std::abs(qRed(a) - qRed(b)), std::abs(qGreen(a) - qGreen(b)),
                                           std::abs(qBlue(a) - qBlue(b))});
            different += distance > 2;
        }
    const bool alike = different * 1000 <= golden.width() * golden.height();
    EXPECT_TRUE(alike) << name.toStdString() << ": " << different << " pixels differ";
    if (!alike) picture.save(name + "-drawn.png");
}

/// A frame round a colour, so that a lost row or column shows.
plist::Value iconInfo(int side, std::uint8_t hue) {
    std::vector<std::uint8_t> pixels;
    for (int y = 0; y < side; ++y)
        for (int x = 0; x < side; ++x) {
            const bool edge = x == 0 || y == 0 || x == side - 1 || y == side - 1;
            const std::uint8_t grey = edge ? 0 : hue;
            pixels.insert(pixels.end(), {grey, static_cast<std::uint8_t>(edge ? 0 : 255 - hue),
                                         std::uint8_t{128}, std::uint8_t{255}});
        }
    return plist::Dictionary{{"format", "bgra"},
                             {"width", side},
                             {"height", side},
                             {"data", plist::Data::copyOf(pixels.data(), pixels.size())}};
}
plist::Value appInfo(const std::string& title, plist::Dictionary extra = {}) {
    const auto hue = static_cast<std::uint8_t>(title.size() * 16);
    return extra.set("title", title).set("rawIcons", plist::Array{iconInfo(16, hue), iconInfo(32, hue)});
}

SMMenuModel::List listOf(const std::vector<plist::Value>& infos) {
    auto items = std::make_shared<SMMenuItems>();
    for (const auto& info : infos)
        items->push_back(SMMenuItem::initWithDictionary(info));
    return items;
}

struct MenuPictures : testing::Test, PanelWorld {
    void SetUp() override {
        ensureFixedFont();
        auto& menu = owner.contents;
        menu.nameList = {"Windows, the machine with quite a long name"};
        menu.topMenu = listOf({leafInfo("Documents"), plist::Dictionary{{"separatorItem", true}},
                               folderInfo("Recent", {leafInfo("one")})});
        menu.bottomMenu = listOf({plist::Dictionary{{"title", "Run…"}, {"enabled", false}}});
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
    void choose(const SMMenuItem& folder) {
        auto& list = controller().rightMenuCollectionView();
        list.performLayout();
        list.findButtonForMenuItem(&folder)->sendAction();
        list.performLayout();
    }

    platform::QtWindowServer server;
};

QString named(const char* name, double scale) {
    return scale == 1 ? QString(name) : QStringLiteral("%1-%2").arg(name).arg(scale);
}

/// Once for every scale, and once with screens of two scales.
TEST_F(MenuPictures, OfThePanelOnEveryScreen) {
    for (const QScreen* screen : QGuiApplication::screens()) {
        view->windowHandle()->setScreen(const_cast<QScreen*>(screen));
        for (const int y : {150, 151})
            QTest::mouseMove(view, QPoint(300, y));
        expectPicture(picture(), named("home", screen->devicePixelRatio()));
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
    defaults.variant = 6;
    expectPicture(picture(), "graphite");
    defaults.variant = 0;
    QTest::keyClicks(field, "ma");
    expectPicture(picture(), "search");
    controller().actionButton()->sendAction();
    controller().actionButton()->sendAction();
    const auto outer = (*owner.contents.allProgramsMenu->submenu())[1];
    choose(*outer);
    choose(*(*outer->submenu())[0]);
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
        expectPicture(image, named("rows", scale));
    }
}

} // namespace
