#include <lib/ipc/KXIPCClient.h>
#include <lib/ipc/KXIPCNames.h>
#include <platform/linux/LinuxSystem.h>

#include <iostream>
#include <string>

// Says hello under the name given, and prints the greeting. Waits for the server when there is none.

int main(int count, char* words[]) {
    const std::string name = count > 1 ? words[1] : "example";
    platform::LinuxSystem system;
    KXIPCContext context{system.ports(), system.notifications(), system.mainLoop(), system.processes(),
                         "com.example.visitor"};
    KXIPCClient client(context);

    const auto onConnected = [&](const KXNotification&) {
        client.postMessage(KXIPCMessage("example.hello", {}, plist::Dictionary{{"name", name}}), false);
    };
    const auto onGreeting = [&](const KXNotification& greeting) {
        std::cout << KXUserInfo(greeting)["text"].stringOr("") << std::endl;
        system.quit();
    };
    // Greetings have the visitor's name for their object: only ours are sent to us.
    const KXIPCObserverEntryRow table[] = {{KX_IPC_CONNECTED_TO_SERVER_NOTIFICATION, onConnected, {}},
                                           {"example.greeting", onGreeting, name}};
    client.addEntries(KXIPCObserverEntryArray(table, std::size(table)), &client);

    client.setAllowIncomingMessages(true);
    system.run();

    client.terminateWithDelegate([&] { system.quit(); });
    system.run();
}
