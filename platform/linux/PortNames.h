#pragma once

#include "platform/linux/Descriptor.h"

#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace platform {

/// Room in a socket for two packets of the inline size, where the system grants it.
void WidenSendBuffer(int socket);

/// A name that is ours, with the socket that listens under it. Its end gives the name up.
class OwnedName {
public:
    OwnedName(std::shared_ptr<const Descriptor> directory, std::string name, Descriptor lock,
              Descriptor listener);
    OwnedName(OwnedName&&) = default;
    OwnedName& operator=(OwnedName&&) = delete;
    ~OwnedName();
    OwnedName(const OwnedName&) = delete;
    OwnedName& operator=(const OwnedName&) = delete;

    const std::string& name() const { return m_name; }
    int listener() const { return m_listener.get(); }

private:
    std::shared_ptr<const Descriptor> m_directory;
    std::string m_name;
    Descriptor m_lock;
    Descriptor m_listener;
};

/// The names of ports in a private directory, and the sockets behind them. Any thread.
class PortNames {
public:
    explicit PortNames(const std::string& directory);

    /// Nothing when another has it.
    std::optional<OwnedName> take(const std::string& name) const;

    enum class Connecting { done, refused, busy };
    /// A connection to the owner of the name. Busy: there is one, who does not accept more connections for
    /// now.
    Connecting connect(const std::string& name, Descriptor& socket) const;

    bool isListening(const std::string& name) const;
    std::vector<std::string> listeningNames() const;

private:
    std::shared_ptr<const Descriptor> m_directory;
};

} // namespace platform
