#include "lib/ipc/KXIPCEnvelope.h"
#include "lib/ipc/KXIPCNames.h"
#include "lib/ipc/KXIPCServer.h"
#include "lib/plist/Binary.h"
#include "platform/linux/ProcProcessTable.h"
#include "tests/platform/PortWorlds.h"
#include "tests/support/RawPeer.h"

#include <cstddef>
#include <gtest/gtest.h>

// Small messages, cut short everywhere and changed everywhere, over a real socket into a server's observers.

namespace {

using platform::PacketHeader;

struct HostilePackets : testing::Test {
    HostilePackets() { restart(); }

    /// A server that knows of no message numbers and no clients.
    void restart() {
        peer.reset();
        server.emplace(context);
        const KXIPCObserverEntryRow row{"n", [this](const KXNotification&) { ++dispatched; }, {}};
        server->addEntries(KXIPCObserverEntryArray(&row, 1), &server);
        server->setAllowIncomingMessages(true);
        peer.emplace(world.directory, server->portName());
    }

    static std::string bytesOf(const KXIPCMessage& message, platform::ProcessSerialNumber sender) {
        std::string error;
        const auto bytes = plist::WriteBinary(KXIPCEnvelope(message, sender, 1, false), error).joined();
        return {reinterpret_cast<const char*>(bytes.data()), bytes.size()};
    }
    static std::string bytesOfControl(const char* name, platform::ProcessSerialNumber claimed,
                                      platform::ProcessSerialNumber sender) {
        return bytesOf(
            {name,
             {},
             plist::Dictionary{{KX_IPC_PARAM_MSG_TABLE, plist::Array{plist::Dictionary{{"name", "m"}}}},
                               {KX_IPC_PARAM_PSN, KXNumberFromProcessSerialNumber(claimed)}}},
            sender);
    }
    static std::string packetOf(const std::string& payload) {
        return RawHeader({.payloadLength = payload.size()}) + payload;
    }

    /// Sends the packets, and another that is answered after them. Whether the connection outlived them.
    bool survives(const std::vector<std::string>& packets) {
        constexpr PacketHeader last{.flags = PacketHeader::wantsAnswer, .sequence = 99};
        for (const auto& packet : packets)
            peer->trySend({.bytes = packet});
        peer->trySend({.bytes = RawHeader(last)});
        PacketHeader answer;
        ssize_t length = 0;
        do
            length = peer->receive(&answer, sizeof answer);
        while (length > 0 && answer.sequence != last.sequence);
        world.loop.runPending();
        if (length <= 0) peer.emplace(world.directory, server->portName());
        return length > 0;
    }

    /// A changed header ends the connection, unless it only asks for an answer or has another number.
    void sendAllChanges(const std::string& packet, std::size_t at) {
        std::vector<std::string> accepted;
        for (unsigned change = 1; change < 256; ++change) {
            auto changed = packet;
            changed[at] = static_cast<char>(static_cast<unsigned char>(changed[at]) ^ change);
            const bool isFlag = at == offsetof(PacketHeader, flags) && change == PacketHeader::wantsAnswer;
            if (isFlag || at >= offsetof(PacketHeader, sequence))
                accepted.push_back(std::move(changed));
            else
                ASSERT_FALSE(survives({changed})) << at << " by " << change;
            if (accepted.size() < 15 && change < 255) continue; // with the last, as many as are let in
            ASSERT_TRUE(survives(std::exchange(accepted, {}))) << at;
        }
    }

    UnixWorld world;
    platform::ProcProcessTable processes{world.loop, world.clock};
    KXIPCContext context{world.server, world.serverNotices, world.loop, processes, "com.corvane.test"};
    std::optional<KXIPCServer> server;
    std::optional<RawPeer> peer;
    int dispatched = 0;
};

TEST_F(HostilePackets, EveryCutAndEveryChangeOfAByteIsDroppedOrUnderstood) {
    const auto self = *processes.currentProcess();
    const std::string payloads[] = {bytesOf(KXIPCMessage("n", {}, {}), self),
                                    bytesOfControl(KX_IPC_ADD_LISTENER_NOTIFICATION, self, self)};
    for (const auto& payload : payloads) {
        const auto packet = packetOf(payload);
        for (std::size_t size = 0; size < packet.size(); ++size)
            ASSERT_FALSE(survives({packet.substr(0, size)})) << size;
        for (std::size_t size = 0; size < payload.size(); ++size)
            ASSERT_TRUE(survives({packetOf(payload.substr(0, size))})) << size;
        EXPECT_EQ(dispatched, 0);
        EXPECT_TRUE(server->clientsForMessage(KXIPCMessage("m", {}, {})).empty());
        const auto first = &payload == payloads ? 0 : sizeof(PacketHeader); // headers are all alike
        for (std::size_t at = first; at < packet.size(); ++at) {
            ASSERT_NO_FATAL_FAILURE(sendAllChanges(packet, at));
            // Nobody but the sender was ever registered.
            for (const auto& client : server->clientsForMessage(KXIPCMessage("m", {}, {})))
                ASSERT_EQ(client->processSerialNumber(), self);
            restart();
        }
        EXPECT_EQ(dispatched > 0, &payload == payloads) << "numbers and flags may differ";
        EXPECT_TRUE(survives({packet}));
        dispatched = 0;
    }
    EXPECT_EQ(server->clientsForMessage(KXIPCMessage("m", {}, {})).size(), 1U) << "the whole one works";
    EXPECT_EQ(ScratchHome::logged("IPC: ") - ScratchHome::logged("unable to create port"), 10)
        << "in a minute";
    EXPECT_EQ(ScratchHome::logged("unable to create port"), 10) << "to confirm to";
}

TEST_F(HostilePackets, WhatClaimsToBeAnothersCostsAnEntryEach) {
    const auto self = *processes.currentProcess(), parent = *platform::SerialNumberOfPeer(getppid());
    const std::string payloads[] = {bytesOf(KXIPCMessage("n", {}, {}), parent),
                                    bytesOfControl(KX_IPC_ADD_LISTENER_NOTIFICATION, parent, parent),
                                    bytesOfControl(KX_IPC_ADD_LISTENER_NOTIFICATION, parent, self),
                                    bytesOfControl(KX_IPC_REMOVE_LISTENER_NOTIFICATION, parent, self)};
    int entries = 0;
    for (const auto& payload : payloads) {
        EXPECT_TRUE(survives({packetOf(payload)}));
        EXPECT_EQ(ScratchHome::logged("sent in another's name"), ++entries);
    }
    EXPECT_EQ(dispatched, 0);
    EXPECT_TRUE(server->clientsForMessage(KXIPCMessage("m", {}, {})).empty());
}

} // namespace
