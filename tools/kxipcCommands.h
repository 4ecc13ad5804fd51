#pragma once

#include "lib/ipc/KXIPCClient.h"
#include "tools/kxipcArguments.h"

#include <functional>
#include <iosfwd>
#include <string>
#include <vector>

/// The commands of kxipc. Their results are exit statuses: 0 done, 1 failed. Failures are told on `errors`.

int KxipcPorts(platform::MessagePorts& ports, std::ostream& output);

int KxipcPost(KXIPCContext& context, const KxipcArguments& arguments, std::istream& input,
              std::ostream& errors);

/// A client that prints what it is sent.
class KxipcListener {
public:
    KxipcListener(KXIPCContext& context, const std::vector<std::string>& names, std::ostream& output);
    int start(std::ostream& errors);
    /// Deregisters; `whenStopped` is called once the port is closed.
    void stop(std::function<void()> whenStopped);

private:
    void print(const KXNotification& notification);

    std::ostream& m_output;
    KXIPCClient m_client;
};
