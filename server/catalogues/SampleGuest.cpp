#include "server/catalogues/SampleGuest.h"

#include "lib/base/Log.h"
#include "server/catalogues/Catalogue.h"

#include <cstddef>
#include <optional>
#include <set>
#include <string>
#include <utility>
#include <vector>

#define TOML_EXCEPTIONS 0
#define TOML_HEADER_ONLY 1
#include <toml++/toml.h>

namespace tessel {
namespace {

class Reader {
public:
    Reader(const toml::table& root, const SampleLimits& limits)
        : m_root(root)
        , m_limits(limits) {}

    std::optional<SampleGuest> read(std::string& error) {
        SampleGuest guest;
        guest.name = m_root["name"].value_or(std::string("Sample guest"));
        Catalogue& catalogue = guest.catalogue;
        catalogue.genericIcon = m_root["generic-icon"].value_or(std::string());
        catalogue.programs = rows("programs", ItemKind::application);
        m_programs = CatalogueIndex(catalogue);
        catalogue.topMenu = rows("top", ItemKind::command);
        catalogue.bottomMenu = rows("bottom", ItemKind::command);
        catalogue.pinned = ids("pinned");
        catalogue.frequent = ids("frequent");
        if (guest.name.size() > m_limits.title) m_error = "the name is too long";
        if (m_error.empty()) return guest;
        error = m_error;
        return std::nullopt;
    }

private:
    std::vector<CatalogueItem> rows(const char* key, ItemKind leaf) {
        return rows(m_root[key].as_array(), leaf,
                    key == std::string_view("programs") ? "" : std::string(key) + "/", 1);
    }

    std::vector<CatalogueItem> rows(const toml::array* list, ItemKind leaf, const std::string& path,
                                    std::size_t depth) {
        std::vector<CatalogueItem> items;
        if (!list) return items;
        if (depth > m_limits.depth) m_error = "folders are nested too deeply";
        for (const toml::node& node : *list) {
            if (!m_error.empty()) return {};
            if (++m_count > m_limits.items) m_error = "there are too many rows";
            const toml::table* table = node.as_table();
            auto item = table ? row(*table, leaf, path, depth) : std::nullopt;
            if (item)
                items.push_back(std::move(*item));
            else
                Log("Sample guest: row in line %u left out\n", unsigned{node.source().begin.line});
        }
        return items;
    }

    std::optional<CatalogueItem> row(const toml::table& table, ItemKind leaf, const std::string& path,
                                     std::size_t depth) {
        CatalogueItem item;
        if (table["separator"].value_or(false)) {
            item.kind = ItemKind::separator;
            return item;
        }
        if (const auto application = table["application"].value<std::string>()) {
            const CatalogueItem* named = m_programs.find(*application);
            return named ? std::optional(*named) : std::nullopt;
        }
        item.kind = leaf;
        item.title = table["title"].value_or(std::string());
        item.icon = table["icon"].value_or(std::string());
        item.enabled = table["enabled"].value_or(true);
        item.state = table["state"].value_or(0);
        item.hideTriangle = table["hide-triangle"].value_or(false);
        item.id = path + item.title;
        if (item.title.empty() || item.title.size() > m_limits.title || !m_ids.insert(item.id).second)
            return std::nullopt;
        if (const toml::array* children = table["items"].as_array()) {
            item.kind = ItemKind::folder;
            item.children = rows(children, leaf, item.id + "/", depth + 1);
        }
        if (const toml::table* alternate = table["alternate"].as_table();
            alternate && depth <= m_limits.depth)
            if (auto other = row(*alternate, leaf, item.id + "/alternate/", depth + 1))
                item.alternate.push_back(std::move(*other));
        return item;
    }

    std::vector<std::string> ids(const char* key) const {
        std::vector<std::string> result;
        if (const toml::array* list = m_root[key].as_array())
            for (const toml::node& node : *list) {
                const std::string id = node.value_or(std::string());
                if (m_programs.find(id))
                    result.push_back(id);
                else
                    Log("Sample guest: no application \"%s\" for \"%s\"\n", id.c_str(), key);
            }
        return result;
    }

    const toml::table& m_root;
    const SampleLimits& m_limits;
    CatalogueIndex m_programs;
    std::set<std::string> m_ids;
    std::size_t m_count = 0;
    std::string m_error;
};

} // namespace

std::optional<SampleGuest> ParseSampleGuest(std::string_view text, std::string& error,
                                            const SampleLimits& limits) {
    if (text.size() > limits.bytes) {
        error = "the file is too large";
        return std::nullopt;
    }
    const toml::parse_result parsed = toml::parse(text);
    if (!parsed) {
        error = "line " + std::to_string(parsed.error().source().begin.line) + ": ";
        error += parsed.error().description();
        return std::nullopt;
    }
    return Reader(parsed.table(), limits).read(error);
}

} // namespace tessel
