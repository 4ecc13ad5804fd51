#pragma once

#include <optional>
#include <span>
#include <string_view>

namespace platform {

/// Whether the desktop's settings ask programs to do without animations. Asked afresh at every call.
bool DesktopReducesMotion();

/// A number among the settings that a desktop publishes on the X server. Null when they hold none of that
/// name, or are damaged before it.
std::optional<int> XSettingsInteger(std::span<const unsigned char> settings, std::string_view name);

} // namespace platform
