#include "app/SMMenuProxy.h"

#include "app/SMMenuItem.h"
#include "lib/base/KXNotificationCenter.h"
#include "lib/ipc/KXIPCCommon.h"
#include "lib/ipc/KXIPCNames.h"
#include "lib/ipc/KXIPCObserverEntry.h"
#include "lib/plist/Value.h"

#include <array>
#include <cstdint>
#include <string>
#include <utility>
#include <vector>

SMMenuProxy::SMMenuProxy(SMMenuProxyDelegate& delegate, KXIPCCommon& sharedClient)
    : m_delegate(delegate)
    , m_sharedClient(sharedClient) {}

void SMMenuProxy::listenForMessages(bool listen) {
    const std::array<KXIPCObserverEntryRow, 4> table{{
        {"menu.update", [this](const KXNotification& notification) { onMenuUpdate(notification); }, {}},
        {"menu.show", [this](const KXNotification&) { m_delegate.onStartMenuShow(); }, {}},
        {"menu.hide", [this](const KXNotification&) { m_delegate.onStartMenuHide(); }, {}},
        {KX_IPC_CONNECTED_TO_SERVER_NOTIFICATION,
         [this](const KXNotification&) { m_delegate.onStartMenuConnectedToServer(); },
         {}},
    }};
    const auto entries = KXIPCObserverEntryArray(table.data(), table.size());
    if (listen)
        m_sharedClient.addEntries(entries, this);
    else
        m_sharedClient.removeEntries(entries, this);
}

void SMMenuProxy::onMenuUpdate(const KXNotification& notification) {
    const plist::Value& info = KXUserInfo(notification);
    std::vector<std::string> nameList;
    // A name of the wrong type keeps its place: the index that goes back counts in the sender's list.
    if (const auto names = info["nameList"]; names.isArray())
        for (const auto& name : names)
            nameList.push_back(name.stringOr(""));
    m_delegate.onStartMenuUpdate(info["menu"], std::move(nameList), info["selectedIndex"].intValue());
}

void SMMenuProxy::refresh() {
    post("menu.refresh", {});
}

void SMMenuProxy::performMenuItemAction(const SMMenuItem& item) {
    post("menu.onAction", item.sendActionInfo());
}

void SMMenuProxy::showMenuSettings() {
    post("menu.settings", {});
}

void SMMenuProxy::selectIndex(std::int32_t index) {
    post("menu.selectIndex", plist::Dictionary{{"selectedIndex", index}});
}

void SMMenuProxy::post(const char* name, plist::Value userInfo) {
    m_sharedClient.postMessage(KXIPCMessage(name, {}, std::move(userInfo)), false);
}
