#pragma once

#include "server/catalogues/Catalogue.h"

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

namespace tessel {

/// A guest that is described by a data file.
struct SampleGuest {
    std::string name;
    Catalogue catalogue;
};

/// Bounds of a description; what passes one is refused.
struct SampleLimits {
    std::size_t bytes = std::size_t{1} << 20;
    std::size_t items = 10'000;
    std::size_t depth = 16;
    std::size_t title = 512; ///< bytes
};

/// Reads the description (TOML; the keys are explained at the head of the shipped one). Nothing, and why in
/// `error`, when it is no TOML or passes a bound. A row that makes no sense is logged and left out.
std::optional<SampleGuest> ParseSampleGuest(std::string_view text, std::string& error,
                                            const SampleLimits& limits = {});

} // namespace tessel
