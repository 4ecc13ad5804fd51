#pragma once

#include "lib/ipc/KXIPCObserverEntry.h"
#include "lib/plist/Value.h"

#include <cstdint>
#include <string>
#include <vector>

class KXIPCCommon;
class SMMenuItem;

/// Whom the proxy tells what the main application wants.
class SMMenuProxyDelegate {
public:
    /// `menu` is nil when the message had none.
    virtual void onStartMenuUpdate(const plist::Value& menu, std::vector<std::string> nameList,
                                   std::int32_t selectedIndex) = 0;
    virtual void onStartMenuShow() = 0;
    virtual void onStartMenuHide() = 0;
    virtual void onStartMenuConnectedToServer() = 0;

protected:
    ~SMMenuProxyDelegate() = default;
};

/// The start menu's only way to the main application: messages become calls on the delegate, requests become
/// messages, posted without waiting. Main thread only; delegate and client must outlive it.
class SMMenuProxy {
public:
    SMMenuProxy(SMMenuProxyDelegate& delegate, KXIPCCommon& sharedClient);
    ~SMMenuProxy() = default;
    SMMenuProxy(const SMMenuProxy&) = delete;
    SMMenuProxy& operator=(const SMMenuProxy&) = delete;

    /// From here on the delegate may be called whenever the main loop turns; to be undone before the proxy
    /// ends.
    void connect() { listenForMessages(true); }
    void disconnect() { listenForMessages(false); }

    void refresh();
    void performMenuItemAction(const SMMenuItem& item);
    void showMenuSettings();
    void selectIndex(std::int32_t index);

private:
    void listenForMessages(bool listen);
    void onMenuUpdate(const KXNotification& notification);
    void post(const char* name, plist::Value userInfo);

    SMMenuProxyDelegate& m_delegate;
    KXIPCCommon& m_sharedClient;
};
