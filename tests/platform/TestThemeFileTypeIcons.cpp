#include "platform/linux/ThemeFileTypeIcons.h"
#include "tests/support/GuiApplication.h"

#include <QDir>
#include <QIcon>
#include <QImage>
#include <QTemporaryDir>
#include <fstream>
#include <gtest/gtest.h>

namespace {

TEST(FileTypeIcons, ComeInTheSizesOfTheTheme) {
    ensureGuiApplication();
    const QTemporaryDir directory;
    const auto addPicture = [&](int side, const char* name, const QColor& colour) {
        const QString folder = directory.filePath(QStringLiteral("test/%1/").arg(side));
        QImage picture(side, side, QImage::Format_ARGB32);
        picture.fill(colour);
        EXPECT_TRUE(QDir().mkpath(folder) && picture.save(folder + name + ".png"));
    };
    addPicture(32, "text-plain", Qt::red);
    addPicture(16, "text-plain", Qt::red);
    addPicture(32, "dialog-warning", QColor(0, 255, 0, 128));
    std::ofstream(directory.filePath("test/index.theme").toStdString())
        << "[Icon Theme]\nName=test\nDirectories=32,16\n[16]\nSize=16\n[32]\nSize=32\n";
    QIcon::setThemeSearchPaths({directory.path()});
    QIcon::setThemeName("test");

    platform::ThemeFileTypeIcons icons;
    const auto text = icons.iconForFileType("txt");
    ASSERT_EQ(text.size(), 2u);
    EXPECT_EQ(text[0].width, 16);
    EXPECT_EQ(text[1].height, 32);
    EXPECT_EQ(text[1].rgba.size(), 32u * 32 * 4);
    EXPECT_EQ(text[0].rgba.slice(0, 4), SharedBytes::copyOf("\xFF\0\0\xFF", 4));
    const auto warning = icons.iconForFileType("'caut'");
    ASSERT_EQ(warning.size(), 1u);
    EXPECT_EQ(warning[0].rgba.slice(0, 4), SharedBytes::copyOf("\0\x80\0\x80", 4)) << "premultiplied";
    EXPECT_TRUE(icons.iconForFileType("'docu'").empty()) << "the theme has none";
}

} // namespace
