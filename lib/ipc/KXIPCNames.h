#pragma once

#include "lib/kxAppKit/system/KXProcess.h"

#include <string>

/// Names of the protocol. Pure functions and constants, for any thread.

/// The value of each is its own name.
inline constexpr const char KX_IPC_ADD_LISTENER_NOTIFICATION[] = "KX_IPC_ADD_LISTENER_NOTIFICATION";
inline constexpr const char KX_IPC_REMOVE_LISTENER_NOTIFICATION[] = "KX_IPC_REMOVE_LISTENER_NOTIFICATION";
inline constexpr const char KX_IPC_CONNECTED_TO_SERVER_NOTIFICATION[] =
    "KX_IPC_CONNECTED_TO_SERVER_NOTIFICATION";
inline constexpr const char KX_IPC_SERVER_DID_LAUNCH_NOTIFICATION[] = "KX_IPC_SERVER_DID_LAUNCH_NOTIFICATION";
inline constexpr const char KX_IPC_SERVER_DID_TERMINATE_NOTIFICATION[] =
    "KX_IPC_SERVER_DID_TERMINATE_NOTIFICATION";

inline constexpr const char KX_IPC_PARAM_PSN[] = "KX_IPC_PARAM_PSN";
inline constexpr const char KX_IPC_PARAM_MSG_TABLE[] = "KX_IPC_PARAM_MSG_TABLE";
inline constexpr const char KX_IPC_PARAM_ALL_MESSAGES[] = "KX_IPC_PARAM_ALL_MESSAGES";

std::string KX_IPC_ServerPortName();
/// Null names the port of no process, which nobody ever listens on.
std::string KX_IPC_PortNameForProcess(const KXProcess* process);
