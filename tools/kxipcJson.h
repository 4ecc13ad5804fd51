#pragma once

#include "lib/plist/Value.h"

#include <string>

/// A property list as JSON on one line. Data becomes a string that tells its size, "<16384 bytes>"; a date,
/// seconds since 2001; what is no number, null.
std::string KxipcJson(const plist::Value& value);
