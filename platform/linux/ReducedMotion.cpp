#include "platform/linux/ReducedMotion.h"

#include "platform/linux/XcbCalls.h"
#include "platform/linux/XcbConnection.h"

#include <QSettings>
#include <QStandardPaths>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <string_view>
#include <xcb/xproto.h>

namespace platform {

namespace {

constexpr std::uint32_t longestSettings = 1 << 18; ///< in words

/// Reads what may end anywhere.
class SettingsReader {
public:
    explicit SettingsReader(std::span<const unsigned char> bytes)
        : m_bytes(bytes)
        , m_isBigEndian(!bytes.empty() && bytes[0] != 0) {}

    bool isBeyondEnd() const { return m_at > m_bytes.size(); }
    void skip(std::size_t count) { m_at += count; }

    std::uint32_t number(std::size_t size) {
        std::uint32_t value = 0;
        const std::size_t begin = m_at;
        m_at += size;
        for (std::size_t i = 0; i < size && !isBeyondEnd(); ++i)
            value = value << 8 | m_bytes[m_isBigEndian ? begin + i : m_at - 1 - i];
        return value;
    }

    /// Padded to whole words.
    std::string_view text(std::size_t length) {
        const std::size_t begin = m_at;
        m_at += (length + 3) / 4 * 4;
        if (isBeyondEnd()) return {};
        return {reinterpret_cast<const char*>(m_bytes.data()) + begin, length};
    }

private:
    std::span<const unsigned char> m_bytes;
    std::size_t m_at = 0;
    bool m_isBigEndian;
};

std::optional<int> publishedInteger(std::string_view name) {
    auto* c = XcbConnection();
    if (!c) return {};
    const auto selection = xcb_get_selection_owner(c, XcbAtom(c, "_XSETTINGS_S0"));
    const XcbReply<xcb_get_selection_owner_reply_t> owner(
        xcb_get_selection_owner_reply(c, selection, nullptr));
    if (!owner || owner->owner == XCB_WINDOW_NONE) return {};
    const auto atom = XcbAtom(c, "_XSETTINGS_SETTINGS");
    const XcbReply<xcb_get_property_reply_t> reply(xcb_get_property_reply(
        c, xcb_get_property(c, 0, owner->owner, atom, atom, 0, longestSettings), nullptr));
    if (!reply) return {};
    return XSettingsInteger({static_cast<const unsigned char*>(xcb_get_property_value(reply.get())),
                             static_cast<std::size_t>(xcb_get_property_value_length(reply.get()))},
                            name);
}

} // namespace

std::optional<int> XSettingsInteger(std::span<const unsigned char> settings, std::string_view name) {
    enum Type : std::uint32_t { integer = 0, string = 1, color = 2 };
    SettingsReader reader(settings);
    reader.skip(8); // byte order, serial number
    for (std::uint32_t left = reader.number(4); left > 0 && !reader.isBeyondEnd(); --left) {
        const std::uint32_t type = reader.number(1);
        reader.skip(1);
        const bool isWanted = reader.text(reader.number(2)) == name;
        reader.skip(4); // when it changed last
        if (type == integer) {
            const auto value = std::bit_cast<std::int32_t>(reader.number(4));
            if (isWanted && !reader.isBeyondEnd()) return value;
        } else if (type == string) {
            reader.text(reader.number(4));
        } else if (type == color) {
            reader.skip(8);
        } else {
            return {};
        }
    }
    return {};
}

bool DesktopReducesMotion() {
    if (publishedInteger("Gtk/EnableAnimations") == 0) return true;
    const QString file = QStandardPaths::locate(QStandardPaths::GenericConfigLocation, "kdeglobals");
    if (file.isEmpty()) return false;
    const QSettings settings(file, QSettings::IniFormat);
    return settings.value("KDE/AnimationDurationFactor", 1.0).toDouble() == 0;
}

} // namespace platform
