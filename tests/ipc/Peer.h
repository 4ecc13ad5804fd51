#pragma once

#include "lib/ipc/KXIPCEnvelope.h"
#include "lib/ipc/KXIPCMessageReceiver.h"
#include "lib/kxAppKit/system/KXProcess.h"
#include "lib/plist/Binary.h"
#include "tests/support/InMemoryNotificationCenter.h"
#include "tests/support/InMemoryPorts.h"
#include "tests/support/InMemoryProcessTable.h"
#include "tests/support/ManualMainLoop.h"
#include "tests/support/ScratchHome.h"

#include <gmock/gmock.h>

/// What the processes of a test share.
struct World {
    ScratchHome home;
    ManualMainLoop loop;
    InMemoryPortNetwork ports;
    InMemoryNotificationNetwork notices;

    static int logged(const std::string& entry) { return ScratchHome::logged(entry); }
};

/// One process of a test: its services, its identity and its message counter. All know of the same processes.
struct Peer {
    static constexpr int server = 2000, client = 3000, other = 4000;

    Peer(World& world, int pid)
        : Peer(world, pid, world.notices) {}
    Peer(World& world, int pid, InMemoryNotificationNetwork& network)
        : psn([&] {
            for (const int each : {server, client, other})
                processes.start(each);
            processes.setCurrentProcess(processes.serialNumberOf(pid));
            return *processes.currentProcess();
        }())
        , ports(world.ports, world.loop, {pid, psn})
        , notices(network, world.loop)
        , context{ports, notices, world.loop, processes, "com.corvane.test"} {}

    void sendRaw(const std::string& portName, const plist::Data& bytes) {
        const std::span<const std::byte> pieces[] = {bytes};
        ports.connect(portName)->send(pieces, false, {});
    }
    void sendRaw(const std::string& portName, const plist::Value& value) {
        std::string error;
        sendRaw(portName, plist::WriteBinary(value, error).joined());
    }
    plist::Value number() const { return KXNumberFromProcessSerialNumber(psn); }

    InMemoryProcessTable processes;
    platform::ProcessSerialNumber psn;
    InMemoryPorts ports;
    InMemoryNotificationCenter notices;
    KXIPCContext context;
};

/// A receiver's delegate that notes the message numbers it is told, and 0 for an end notice.
struct Collector : KXIPCMessageReceiverDelegate {
    void onRemoteMessageReceived(const plist::Value& envelope) override {
        last = envelope;
        noted.push_back(envelope["messageID"].longLongValue());
        if (onMessage) onMessage();
    }
    void onMessageReceiverDidTerminate() override { noted.push_back(0); }

    plist::Value last;
    std::vector<std::int64_t> noted;
    std::function<void()> onMessage;
};
