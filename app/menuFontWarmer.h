#pragma once

#include "app/SMMenuModel.h"

#include <deque>
#include <functional>
#include <memory>
#include <string>
#include <unordered_set>

namespace platform {
class Handle;
class MainLoop;
} // namespace platform

/// Has a text of every script that an update brings shaped while the menu is hidden, one in each turn of the
/// loop: the first text in a script loads a font, which takes most of a frame. Main thread only.
class MenuFontWarmer {
public:
    struct Services {
        platform::MainLoop& mainLoop;
        std::function<bool()> isMenuHidden;
        /// Text is UTF-8.
        std::function<void(const std::string& text)> shape;
    };

    explicit MenuFontWarmer(Services services);
    ~MenuFontWarmer();
    MenuFontWarmer(const MenuFontWarmer&) = delete;
    MenuFontWarmer& operator=(const MenuFontWarmer&) = delete;

    /// Looks for scripts that were in no model before.
    void take(const SMMenuModel& model);
    /// To be called when the menu was hidden: goes on with what waits.
    void resume();

private:
    void look(const SMMenuModel::List& items);
    void look(const std::string& title);
    void shapeNext();

    Services m_services;
    std::unordered_set<char32_t> m_known; ///< scripts, and blocks of signs
    std::deque<std::string> m_waiting;
    std::unique_ptr<platform::Handle> m_turn; ///< null while none is due
};
