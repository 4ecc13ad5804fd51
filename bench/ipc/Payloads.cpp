#include "bench/ipc/Payloads.h"

#include "lib/ipc/KXIPCEnvelope.h"
#include "lib/plist/Binary.h"

#include <algorithm>
#include <random>

namespace {

plist::Data Pixels(int width, std::mt19937_64& random) {
    const auto size = static_cast<std::size_t>(width) * static_cast<std::size_t>(width) * 4;
    auto pixels = std::make_shared<std::vector<std::uint64_t>>(size / sizeof(std::uint64_t));
    std::ranges::generate(*pixels, std::ref(random));
    return {std::as_bytes(std::span(*pixels)), pixels};
}

plist::Value Icons(const std::vector<int>& widths, std::mt19937_64& random) {
    plist::Array icons;
    for (const int width : widths)
        icons.push_back(plist::Dictionary{
            {"format", "bgra"}, {"width", width}, {"height", width}, {"data", Pixels(width, random)}});
    return icons;
}

Payload Message(const char* name, plist::Dictionary userInfo) {
    const KXIPCMessage message(name, {}, userInfo);
    std::string error;
    const auto encoded = plist::WriteBinary(KXIPCEnvelope(message, {123456, 4321}, 1, false), error);
    const auto joined = encoded.joined();
    return {std::move(userInfo), {joined.span().begin(), joined.span().end()}};
}

} // namespace

Payload MenuUpdate(int applications, const std::vector<int>& widths) {
    std::mt19937_64 random(1);
    plist::Array items;
    for (int i = 0; i < applications; ++i) {
        const auto number = std::to_string(i);
        const plist::Dictionary represented{
            {"path", "C:\\Program Files\\Application " + number + "\\run.exe"}};
        items.push_back(plist::Dictionary{{"title", "Application " + number},
                                          {"action", "launchApplication:"},
                                          {"representedObject", represented},
                                          {"rawIcons", Icons(widths, random)}});
    }
    const auto count = static_cast<std::ptrdiff_t>(items.size());
    const plist::Array pinned(items.begin(), items.begin() + std::min<std::ptrdiff_t>(8, count));
    plist::Array folders;
    for (std::ptrdiff_t from = 0; from < count; from += 12)
        folders.push_back(plist::Dictionary{
            {"title", "Folder " + std::to_string(from / 12)},
            {"submenuInfoArray",
             plist::Array(items.begin() + from, items.begin() + std::min(from + 12, count))}});
    plist::Dictionary menu{{"pinnedApps", pinned}, {"searchableApps", items}, {"allPrograms", folders}};
    return Message("menu.update", plist::Dictionary{{"menu", std::move(menu)},
                                                    {"nameList", plist::Array{"Windows 11", "Debian 12"}},
                                                    {"selectedIndex", 0}});
}

Payload MenuRefresh(std::size_t padding) {
    plist::Dictionary userInfo;
    if (padding > 0) userInfo.set("padding", std::string(padding, 'x'));
    return Message("menu.refresh", std::move(userInfo));
}
