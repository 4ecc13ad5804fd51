#include "lib/ipc/KXIPCMessageReceiver.h"

#include "lib/base/Log.h"
#include "lib/ipc/KXIPCEnvelope.h"
#include "lib/plist/Binary.h"
#include "lib/plist/Value.h"
#include "platform/MessagePort.h"

#include <algorithm>
#include <cstddef>
#include <deque>
#include <iterator>
#include <memory>
#include <mutex>
#include <span>
#include <string>
#include <system_error>
#include <thread>
#include <utility>
#include <vector>

namespace {

// A port counts what has arrived by its bytes, which stand for what binary ones take in memory.
constexpr plist::Limits limits{.xmlBytes = std::size_t{1} << 20};

} // namespace

/// One port from start to end notice. What arrived waits here; a task posted to the main loop takes a few
/// things out, and posts the next: so all of it goes when the worker goes, whatever is still posted.
class KXIPCMessageReceiver::Worker : public std::enable_shared_from_this<Worker> {
public:
    explicit Worker(KXIPCMessageReceiver& receiver)
        : m_receiver(receiver)
        , m_ports(receiver.m_context.ports)
        , m_mainLoop(receiver.m_context.mainLoop) {}

    void start(std::unique_ptr<platform::LocalPort> port) {
        m_port = std::move(port);
        if (m_port && startThread()) return;
        m_port.reset();
        Log("%s, listening for messages failed\n", "-[KXIPCMessageReceiver workerThreadStartReceiving:]");
        forwardEnd();
    }

    void close() {
        if (m_port) m_port->close();
    }

    /// Nothing is delivered any more. A handler further up the stack may still hold this worker.
    void withdraw() {
        close();
        join();
        m_inbox.clear();
        m_ready.clear();
    }

    bool hasPort() const { return m_port != nullptr; }
    bool hasTerminated() const { return m_hasTerminated; }

private:
    /// Handled in one turn of the main loop, whose turn costs about as much as handling one.
    static constexpr int largestGroup = 16;

    struct Delivery {
        plist::Value envelope; ///< nil: the end
        std::unique_ptr<platform::Receipt> receipt;
    };

    bool startThread() {
        try {
            m_thread = std::thread([this] { workerThreadStartReceiving(); });
        } catch (const std::system_error&) { // the system has no more threads for us
            return false;
        }
        return true;
    }

    void workerThreadStartReceiving() {
        std::vector<Delivery> group;
        m_port->run([&](std::span<platform::Arrival> arrivals) {
            for (auto& arrival : arrivals)
                WorkerThreadOnMessageReceived(arrival, group);
            forward(group);
            // Now the receipts of what was dropped end: no answer overtakes what came before.
        });
        forwardEnd();
    }

    void WorkerThreadOnMessageReceived(platform::Arrival& arrival, std::vector<Delivery>& group) {
        constexpr auto routine = "WorkerThreadOnMessageReceived";
        std::string error;
        auto envelope = plist::Parse(arrival.bytes, error, limits, arrival.peek);
        const auto fault =
            error.empty() ? KXIPCCheckEnvelope(envelope, arrival.sender) : KXIPCEnvelopeFault{error.c_str()};
        if (!fault.any()) {
            group.push_back({std::move(envelope), std::move(arrival.receipt)});
            return;
        }
        if (!m_ports.mayLogAbout(std::to_string(arrival.sender.processID))) return;
        if (fault.isForged)
            Log("IPC: %s: dropping message that process %d sent in another's name\n", routine,
                arrival.sender.processID);
        else
            Log("IPC: %s: unable to parse remote message. Error: %s\n", routine, fault.error);
    }

    void forwardEnd() {
        std::vector<Delivery> end(1);
        forward(end);
    }

    /// Empties the group.
    void forward(std::vector<Delivery>& group) {
        if (group.empty()) return;
        {
            const std::lock_guard lock(m_mutex);
            std::ranges::move(group, std::back_inserter(m_inbox));
            group.clear();
            if (std::exchange(m_isPosted, true)) return;
        }
        postDelivery();
    }

    void postDelivery() {
        m_mainLoop.post([weak = weak_from_this()] {
            if (const auto worker = weak.lock()) worker->deliver();
        });
    }

    void deliver() {
        {
            const std::lock_guard lock(m_mutex);
            if (m_ready.empty()) m_ready.swap(m_inbox);
            std::ranges::move(m_inbox, std::back_inserter(m_ready));
            m_inbox.clear();
            m_isPosted = m_ready.size() > 1;
        }
        if (m_ready.size() > 1) postDelivery(); // before any is handled: its handler may turn the loop
        for (int i = 0; i < largestGroup && !m_ready.empty(); ++i) {
            const auto delivery = std::move(m_ready.front());
            m_ready.pop_front();
            handle(delivery);
        }
    }

    void handle(const Delivery& delivery) {
        auto& delegate = m_receiver.m_delegate;
        if (!delivery.envelope.isNil()) return delegate.onRemoteMessageReceived(delivery.envelope);
        join();
        m_hasTerminated = true;
        std::erase(m_receiver.m_stoppingThreads, shared_from_this());
        delegate.onMessageReceiverDidTerminate();
    }

    void join() {
        if (m_thread.joinable()) m_thread.join();
    }

    KXIPCMessageReceiver& m_receiver;
    platform::MessagePorts& m_ports;
    platform::MainLoop& m_mainLoop;
    std::unique_ptr<platform::LocalPort> m_port;
    std::thread m_thread;
    bool m_hasTerminated = false;
    std::deque<Delivery> m_ready; ///< main thread
    std::mutex m_mutex;           ///< guards what follows
    std::deque<Delivery> m_inbox;
    bool m_isPosted = false; ///< a task that will look into the inbox
};

KXIPCMessageReceiver::KXIPCMessageReceiver(KXIPCContext& context, KXIPCMessageReceiverDelegate& delegate)
    : m_context(context)
    , m_delegate(delegate) {}

KXIPCMessageReceiver::~KXIPCMessageReceiver() {
    if (m_messageReceiverThread) m_messageReceiverThread->withdraw();
    for (const auto& worker : m_stoppingThreads)
        worker->withdraw();
}

void KXIPCMessageReceiver::startReceivingWithPortName(const std::string& portName) {
    if (m_messageReceiverThread) return;
    m_messageReceiverThread = std::make_shared<Worker>(*this);
    m_messageReceiverThread->start(m_context.ports.open(portName));
}

void KXIPCMessageReceiver::stopReceiving() {
    if (!m_messageReceiverThread) return;
    m_messageReceiverThread->close();
    if (willTerminate()) m_stoppingThreads.push_back(m_messageReceiverThread);
    m_messageReceiverThread.reset();
}

bool KXIPCMessageReceiver::isPortOpen() const {
    return m_messageReceiverThread && m_messageReceiverThread->hasPort();
}

bool KXIPCMessageReceiver::willTerminate() const {
    return m_messageReceiverThread && !m_messageReceiverThread->hasTerminated();
}
