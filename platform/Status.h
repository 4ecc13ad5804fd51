#pragma once

namespace platform {

/// A status code of the system, as callers and logs see it.
using Status = int;

namespace status {
inline constexpr Status success = 0;
inline constexpr Status unsupported = -4; ///< nobody on this desktop tells or does it
inline constexpr Status badName = -37;    ///< no path of a file
inline constexpr Status fileNotFound = -43;
inline constexpr Status invalidParameter = -50;
inline constexpr Status processNotFound = -600;
inline constexpr Status processHasNoWindow = -606;
inline constexpr Status noWindowServer = -609;
inline constexpr Status launchFailed = -10810;
inline constexpr Status notAnApplication = -10811;
inline constexpr Status applicationNotFound = -10814;
} // namespace status

} // namespace platform
