#include "server/catalogues/SampleMachine.h"

#include "lib/base/Log.h"
#include "server/catalogues/Catalogue.h"
#include "server/catalogues/Machine.h"
#include "server/catalogues/SampleGuest.h"

#include <fstream>
#include <ios>
#include <memory>
#include <optional>
#include <sstream>
#include <string>
#include <utility>

namespace tessel {

std::unique_ptr<SampleMachine> SampleMachine::open(std::string id, const std::string& folder) {
    const std::string path = folder + "/guest.toml";
    std::ifstream file(path, std::ios::binary);
    std::ostringstream text;
    text << file.rdbuf();
    std::string error = "it cannot be read";
    std::optional<SampleGuest> guest;
    if (file) guest = ParseSampleGuest(text.view(), error);
    if (!guest) {
        Log("Sample guest \"%s\": %s\n", path.c_str(), error.c_str());
        return nullptr;
    }
    return std::make_unique<SampleMachine>(std::move(id), std::move(*guest), folder);
}

SampleMachine::SampleMachine(std::string id, SampleGuest guest, const std::string& folder)
    : Machine(std::move(id), std::move(guest.name))
    , m_catalogue(std::move(guest.catalogue))
    , m_icons(folder + "/icons") {}

void SampleMachine::launch(const CatalogueItem& item, LaunchHandler done) {
    Log("Sample guest: \"%s\" was chosen; there is nothing to start\n", item.id.c_str());
    done(std::nullopt);
}

} // namespace tessel
