#pragma once

#include "server/AgentKeeper.h"

namespace tessel {

/// Starts programs as children of this process, with its environment.
class SpawnedPrograms final : public ProgramStarter {
public:
    std::optional<int> start(const std::string& path) override;
    std::optional<std::string> reap(int pid) override;
};

} // namespace tessel
