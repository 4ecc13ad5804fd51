#pragma once

#include "lib/base/SharedBytes.h"
#include "lib/plist/Value.h"

#include <cstddef>
#include <memory>
#include <span>
#include <string>
#include <vector>

/// The binary property-list format, "bplist00". Pure functions, for any thread.
namespace plist {

/// Deeper nesting is never read nor written, whatever the limits say.
inline constexpr unsigned kDeepestNesting = 512;

/// Bounds of one parse or one write. What passes one is refused before anything is allocated for it.
struct Limits {
    std::size_t bytes = std::size_t{256} << 20;
    /// Counted each time it is referred to; a string counts once more for every 64 bytes.
    std::size_t objects = 4'000'000;
    unsigned nesting = kDeepestNesting; ///< arrays and dictionaries within each other
    std::size_t xmlBytes = bytes;       ///< the same for XML, which takes ten times its size in memory
};

/// The value, or nil and why in `error`. Linear in the size of `bytes`; the result shares them. With `peek`
/// large data is left untouched.
Value ParseBinary(const Data& bytes, std::string& error, const Limits& limits = {},
                  const PeekBytes& peek = nullptr);

/// A written property list: pieces to be sent one after the other. Larger data values are not copied: a piece
/// points at them. `keepAlive` holds all that the pieces point at.
struct Encoded {
    std::vector<std::span<const std::byte>> pieces;
    std::size_t size = 0;
    std::shared_ptr<const void> keepAlive;
    SharedBytes joined() const; ///< one contiguous copy
};

/// No pieces and why in `error` when the value cannot be written: a nil in it, or past the limits. Equal
/// strings, numbers and data are written once, and so is an array or a dictionary that is shared. Large
/// data comes last. Invalid UTF-8 becomes U+FFFD.
Encoded WriteBinary(const Value& value, std::string& error, const Limits& limits = {});

/// Any format this library reads, told by its first bytes.
Value Parse(const Data& bytes, std::string& error, const Limits& limits = {},
            const PeekBytes& peek = nullptr);

} // namespace plist
