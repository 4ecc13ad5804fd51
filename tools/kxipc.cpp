#include "lib/base/Log.h"
#include "lib/ipc/KXIPCContext.h"
#include "lib/ipc/KXIPCNames.h"
#include "platform/MessagePort.h"
#include "platform/PortWatch.h"
#include "platform/linux/LinuxPorts.h"
#include "platform/linux/PollMainLoop.h"
#include "platform/linux/PrivateDirectory.h"
#include "platform/linux/ProcProcessTable.h"
#include "platform/linux/SystemClock.h"
#include "platform/linux/TerminationSignals.h"
#include "platform/linux/UnixPortWatches.h"
#include "tools/kxipcArguments.h"
#include "tools/kxipcCommands.h"
#include "tools/kxipcRecording.h"
#include "tools/kxipcWatch.h"

#include <algorithm>
#include <cstddef>
#include <fstream>
#include <iostream>
#include <string>
#include <utility>

namespace {

constexpr int wrongUsage = 2;

using Command = KxipcArguments::Command;

/// What a program of ports has. Its loop runs until a signal, or until the command is done.
struct System {
    platform::SystemClock clock;
    platform::PollMainLoop loop{clock};
    platform::ProcProcessTable processes{loop, clock};
    platform::LinuxPorts system{loop};
    KXIPCContext context{system.ports(), system.notifications(), loop, processes, "com.corvane.kxipc"};
};

std::string portOf(const KxipcArguments& arguments, std::size_t index) {
    return arguments.names.size() > index ? arguments.names[index] : KX_IPC_ServerPortName();
}

int fail(const std::string& why) {
    std::cerr << "kxipc: " << why << '\n';
    return 1;
}

int listen(System& system, const KxipcArguments& arguments) {
    KxipcListener listener(system.context, arguments.names, std::cout);
    const platform::TerminationSignals signals(system.loop,
                                               [&] { listener.stop([&] { system.loop.quit(); }); });
    const int status = listener.start(std::cerr);
    if (status == 0) system.loop.run();
    return status;
}

int watch(System& system, const KxipcArguments& arguments) {
    platform::UnixPortWatches watches(system.loop, platform::DefaultPortDirectory());
    const auto end = [&] { system.loop.quit(); };
    const platform::TerminationSignals signals(system.loop, end);
    std::ofstream file;
    const auto print = [&](const platform::PassingMessage& message, double seconds) {
        std::cout << KxipcLine(message, seconds, arguments.json) << std::flush;
    };
    const auto record = [&](const platform::PassingMessage& message, double seconds) {
        KxipcRecord(file, message, seconds);
        if (!file) end();
    };
    const bool isRecord = arguments.command == Command::record;
    const auto port = portOf(arguments, isRecord ? 1 : 0);
    if (isRecord) {
        file.open(arguments.names[0], std::ios::binary);
        KxipcStartRecording(file, port);
        if (!file) return fail(arguments.names[0] + ": cannot be written");
    }
    auto watch = arguments.command == Command::stats
                     ? KxipcWatch(watches, system.clock, std::cout, end)
                     : KxipcWatch(watches, system.clock, isRecord ? KxipcMessageHandler(record) : print, end);
    if (const int status = watch.start(port, std::cerr); status != 0) return status;
    system.loop.run();
    return isRecord && !file ? fail(arguments.names[0] + ": cannot be written") : 0;
}

int replay(System& system, const KxipcArguments& arguments) {
    std::ifstream file(arguments.names[0], std::ios::binary);
    const auto port = portOf(arguments, 1);
    auto messages = KxipcReadRecording(file, port == KX_IPC_ServerPortName());
    if (!messages) return fail(arguments.names[0] + ": no recording");
    if (!system.context.ports.isListening(port)) return fail("nobody listens on " + port);
    const auto end = [&] { system.loop.quit(); };
    bool hasHungUp = false;
    system.context.ports.setHangUpHandler([&](const std::string&) {
        hasHungUp = true;
        end();
    });
    KxipcReplay replay(system.context, std::move(*messages), port, end);
    replay.start(arguments.speed);
    system.loop.run();
    if (hasHungUp) return fail(port + " was closed");
    const auto dropped = system.context.ports.queued().dropped;
    return dropped > 0 ? fail(std::to_string(dropped) + " messages were dropped") : 0;
}

int run(const KxipcArguments& arguments) {
    System system;
    switch (arguments.command) {
    case Command::ports:
        return KxipcPorts(system.context.ports, std::cout);
    case Command::post:
        return KxipcPost(system.context, arguments, std::cin, std::cerr);
    case Command::listen:
        return listen(system, arguments);
    case Command::replay:
        return replay(system, arguments);
    default:
        return watch(system, arguments);
    }
}

} // namespace

int main(int count, char* words[]) {
    SetLogBaseName("kxipc");
    std::string error;
    const auto arguments = KxipcArguments::parse({words + std::min(1, count), words + count}, error);
    if (!arguments) {
        std::cerr << "kxipc: " << error << "; see kxipc --help\n";
        return wrongUsage;
    }
    switch (arguments->command) {
    case KxipcArguments::Command::help:
        std::cout << KxipcArguments::helpText();
        return 0;
    case KxipcArguments::Command::version:
        std::cout << "kxipc " KX_VERSION "\n";
        return 0;
    default:
        RotateLargeLogFile();
        return run(*arguments);
    }
}
