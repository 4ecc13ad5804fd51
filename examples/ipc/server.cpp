#include <lib/ipc/KXIPCServer.h>
#include <platform/linux/LinuxSystem.h>

#include <iostream>

// Greets whoever says hello. There is one server in a user's session; the clients find it by themselves.

int main() {
    platform::LinuxSystem system;
    KXIPCContext context{system.ports(), system.notifications(), system.mainLoop(), system.processes(),
                         "com.example.greeter"};
    KXIPCServer server(context);

    const auto onHello = [&](const KXNotification& hello) {
        const auto name = KXUserInfo(hello)["name"].stringOr("stranger");
        std::cout << name << " says hello" << std::endl;
        // Goes to the clients that asked for messages of this name, and does not wait for them.
        server.postMessage(
            KXIPCMessage("example.greeting", name, plist::Dictionary{{"text", "Hello, " + name}}), false);
    };
    const KXIPCObserverEntryRow table[] = {{"example.hello", onHello, {}}};
    server.addEntries(KXIPCObserverEntryArray(table, std::size(table)), &server);

    server.setAllowIncomingMessages(true);
    system.run();

    // The port is closed in order, and the clients hear that the server has gone.
    server.terminateWithDelegate([&] { system.quit(); });
    system.run();
}
