#include "app/SMMenuItem.h"
#include "fuzz/Quiet.h"
#include "lib/kxAppKit/KXImage.h"

// A menu item as a server sends it, in either form of property lists, and all that the menu asks of it.

namespace {

void use(SMMenuItem& item) {
    if (const auto icon = item.icon()) g_seen = g_seen + icon->representations().size();
    ReadAll(item.sendActionInfo());
    g_seen = g_seen + item.title().size() + item.submenuHasCheckmark();
    if (item.altMenuItem()) use(*item.altMenuItem());
    if (!item.submenu()) return;
    for (const auto& child : *item.submenu()) {
        if (child->parent().get() != &item || !item.hasChildItem(child.get())) std::abort();
        g_seen = g_seen + static_cast<std::size_t>(child->titleCompare(item));
        use(*child);
    }
}

} // namespace

extern "C" int LLVMFuzzerInitialize(int*, char***) {
    return BeQuiet();
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    std::string error;
    const auto value = plist::Parse(plist::Data::copyOf(data, size), error, {.objects = 20'000});
    if (const auto item = SMMenuItem::initWithDictionary(value)) use(*item);
    return 0;
}
