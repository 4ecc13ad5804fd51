#pragma once

#include <cstddef>
#include <string>

/// How the cost of our library grows: microseconds for a number of something. `place` is a directory of the
/// run's own.

/// From the call until the receiver's main thread has a message of so many bytes.
double CostOfSize(const std::string& place, std::size_t bytes);
/// A server's message to so many clients, each a process, until the last has handled it.
double CostOfClients(const std::string& place, std::size_t clients);
/// The dispatch of a message that so many observers want.
double CostOfObservers(const std::string& place, std::size_t observers);
/// A message and its answer while so many others flood the receiver, with small messages and those of 1 MB by
/// turns; and the slowest of 5,000.
double CostAmidFloods(const std::string& place, std::size_t floods);
double SlowestAmidFloods(const std::string& place, std::size_t floods);
/// So many bytes to another process, copied through the socket, or in sealed memory; one byte of each page is
/// read.
double CostOfInline(const std::string& place, std::size_t bytes);
double CostOfMemory(const std::string& place, std::size_t bytes);
