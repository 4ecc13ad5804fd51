#pragma once

#include "lib/base/SharedBytes.h"
#include "platform/linux/Descriptor.h"

#include <optional>
#include <span>

/// Large payloads: memory without a name, which the sender can no longer change once it has been sent.
namespace platform {

using BytePieces = std::span<const std::span<const std::byte>>;

/// The pieces one after another, sealed. None when the system has no room; errno says why.
Descriptor WriteSealedMemory(BytePieces pieces);

/// The contents, read as they are touched; nothing unless it is `size` bytes of memory that nobody can
/// change.
std::optional<SharedBytes> MapSealedMemory(const Descriptor& memory, std::size_t size);

/// Keeps the descriptor.
PeekBytes PeekIntoMemory(Descriptor memory);

} // namespace platform
