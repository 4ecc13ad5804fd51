#include "platform/linux/QtTranslations.h"

#include <QGuiApplication>
#include <QLibraryInfo>
#include <QLocale>
#include <QTranslator>
#include <memory>

namespace platform {
namespace {

bool install(const QLocale& locale, const QString& name, const QString& folder) {
    auto translator = std::make_unique<QTranslator>();
    if (!translator->load(locale, name, QStringLiteral("_"), folder)) return false;
    translator->setParent(qGuiApp);
    return QCoreApplication::installTranslator(translator.release());
}

} // namespace

void LoadTranslations(const QString& name) {
    const QLocale locale;
    const QString ours = QStringLiteral(":/i18n");
    install(locale, QStringLiteral("qtbase"), QLibraryInfo::path(QLibraryInfo::TranslationsPath));
    // English has plurals to tell apart, too.
    if (!install(locale, name, ours)) install(QLocale(QLocale::English), name, ours);
    // Of the language: the locale's own direction is that of its numbers and dates.
    const QStringList languages = locale.uiLanguages();
    QGuiApplication::setLayoutDirection(
        (languages.isEmpty() ? locale : QLocale(languages.first())).textDirection());
}

} // namespace platform
