#pragma once

#include "platform/linux/Descriptor.h"

#include <string>

namespace platform {

/// Where the user's ports are: the name that both ends of a connection agree on.
std::string DefaultPortDirectory();

/// Opens a directory that nobody but this user can enter, making it when there is none; none, with a log
/// entry, when what stands there is a link, another user's or open to others. `path` is absolute, or relative
/// to `at`.
Descriptor OpenPrivateDirectory(int at, const std::string& path);

/// What keeps `OpenPrivateDirectory` from opening what stands there; empty when nothing does, or nothing
/// stands there.
std::string PrivateDirectoryFault(const std::string& path);

/// Whether ports and notices may have that name: it becomes a file's.
bool IsPortName(const std::string& name);

/// The short path of a file in an open directory. The directory's own path may be too long for a socket's
/// address, and may lead elsewhere by now.
std::string PathInDirectory(int directory, const std::string& name);

} // namespace platform
