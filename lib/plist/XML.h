#pragma once

#include "lib/plist/Binary.h"

#include <string>

/// The XML form of property lists, for files that people edit. A pure function, for any thread.
namespace plist {

/// The value, or nil and why, with the line, in `error`. A document that declares or uses entities of its own
/// is refused; nothing that it names is ever loaded. Of entries with the same key the last counts.
Value ParseXML(const Data& bytes, std::string& error, const Limits& limits = {});

} // namespace plist
