#include "app/menuFontWarmer.h"

#include "app/SMMenuItem.h" // IWYU pragma: keep
#include "app/SMMenuModel.h"
#include "platform/MainLoop.h"

#include <QChar>
#include <QList>
#include <QString>
#include <algorithm>
#include <string>
#include <utility>

namespace {

constexpr qsizetype shapedLength = 8; ///< enough for a font to be loaded

bool isAscii(char32_t c) {
    return c < 0x80;
}

/// What is written in a font of its own: a script, or a block of signs that belong to none, as emoji do.
char32_t fontGroup(char32_t c) {
    constexpr char32_t beyondScripts = 0x1000;
    if (isAscii(c)) return QChar::Script_Latin;
    const QChar::Script script = QChar::script(c);
    if (script == QChar::Script_Inherited) return QChar::Script_Latin; // written in the font of what it is on
    return script > QChar::Script_Common ? static_cast<char32_t>(script) : beyondScripts + (c >> 8);
}

} // namespace

MenuFontWarmer::MenuFontWarmer(Services services)
    : m_services(std::move(services)) {}

MenuFontWarmer::~MenuFontWarmer() = default;

void MenuFontWarmer::take(const SMMenuModel& model) {
    for (const auto& list :
         {model.topMenu, model.bottomMenu, model.pinnedApps, model.frequentlyUsedApps, model.searchableApps})
        look(list);
    if (model.allProgramsMenu) look(model.allProgramsMenu->submenu());
    std::ranges::for_each(model.nameList, [this](const std::string& name) { look(name); });
    resume();
}

void MenuFontWarmer::look(const SMMenuModel::List& items) {
    if (!items) return;
    for (const auto& item : *items) {
        look(item->title());
        look(item->submenu());
        if (item->altMenuItem()) look(item->altMenuItem()->title());
    }
}

void MenuFontWarmer::look(const std::string& title) {
    const bool plain =
        std::ranges::all_of(title, [](char c) { return isAscii(static_cast<unsigned char>(c)); });
    if (title.empty() || (plain && m_known.contains(QChar::Script_Latin))) return;
    const QString text = QString::fromStdString(title);
    qsizetype at = 0;
    for (const char32_t c : text.toUcs4()) {
        if (m_known.insert(fontGroup(c)).second)
            m_waiting.push_back(text.mid(at, shapedLength).toStdString());
        at += QChar::requiresSurrogates(c) ? 2 : 1;
    }
}

void MenuFontWarmer::resume() {
    if (m_turn || m_waiting.empty() || !m_services.isMenuHidden()) return;
    using Milliseconds = platform::MainLoop::Milliseconds;
    m_turn = m_services.mainLoop.startTimer(Milliseconds{0}, Milliseconds{0}, [this] { shapeNext(); });
}

void MenuFontWarmer::shapeNext() {
    m_turn.reset();
    if (!m_services.isMenuHidden()) return;
    const std::string text = std::move(m_waiting.front());
    m_waiting.pop_front();
    m_services.shape(text);
    resume();
}
