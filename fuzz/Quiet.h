#pragma once

#include "lib/plist/Binary.h"

#include <cstdint>
#include <cstdlib>
#include <string>

/// What is refused is logged; not on a disk, a million times.
inline int BeQuiet() {
    setenv("HOME", "/nonexistent", 1);
    return 0;
}

/// The answer matters to nobody, but the compiler must not know.
inline volatile std::size_t g_seen = 0;

/// Looks at every part of a value. Strings and data are touched where they lie.
inline void ReadAll(const plist::Value& value) {
    g_seen = g_seen + value.string().value_or("").size() + value.data().size() + value.boolValue() +
             static_cast<std::size_t>(value.longLongValue()) + (value.doubleValue() > 0);
    for (const std::byte byte : value.data().span())
        g_seen = g_seen + std::to_integer<std::size_t>(byte);
    for (std::size_t i = 0; i < value.size(); ++i) {
        if (value.isDictionary()) ReadAll(value[value.keyAt(i)]);
        ReadAll(value.at(i));
    }
}

/// What was read can be written, and reads the same again. Dates and reals that are not equal to themselves
/// make the second writing the judge.
inline void CheckRoundTrip(const plist::Value& value) {
    std::string error;
    const auto first = plist::WriteBinary(value, error).joined();
    if (!error.empty()) return; // a bound of the writer
    const auto again = plist::ParseBinary(first, error);
    if (!error.empty()) std::abort();
    if (plist::WriteBinary(again, error).joined() != first) std::abort();
}
