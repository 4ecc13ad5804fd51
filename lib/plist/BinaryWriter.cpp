#include "lib/plist/Binary.h"

#include "lib/plist/Document.h"
#include "lib/plist/Output.h"
#include "lib/plist/Pile.h"
#include "lib/plist/Unicode.h"
#include "lib/plist/Uniquer.h"
#include "lib/plist/Value.h"

#include <algorithm>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <span>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace plist {

namespace {

using Index = Uniquer::Index;

/// Data of this size or more is pointed at; below it, copying is cheaper than another piece.
constexpr std::size_t kPieceSize = 512;

/// Leaves are written as they are met; containers follow them, since the size of a reference is known only
/// then.
class Writer {
public:
    Writer(const Limits& limits, std::string& error)
        : m_objectLimit(std::min<std::size_t>(limits.objects, UINT32_MAX / 2))
        , m_byteLimit(limits.bytes)
        , m_nesting(std::min(limits.nesting, kDeepestNesting))
        , m_error(error) {}

    Encoded run(const Value& value) {
        m_out.put(std::as_bytes(std::span(std::string_view("bplist00"))));
        Index top = 0;
        if (!add(value, 0, top)) return {};
        writeContainers();
        for (const Index place : m_large)
            writePiece(m_places[place]);
        writeTable(top);
        if (m_out.size() <= m_byteLimit) return std::move(m_out).finish(value);
        m_error = "the property list is too large";
        return {};
    }

private:
    struct Object {
        std::size_t offset = 0; ///< in the file
        std::size_t mark = 0;   ///< of a leaf
    };
    /// What was met before, known by where it stands: data that is pointed at, and containers.
    struct Place {
        const void* start;
        std::size_t size; ///< of data; 0 for a container
        Index object;
        unsigned height = 0;      ///< of a container: how many there are below each other in it
        std::size_t expanded = 0; ///< objects in a container, counted each time that they are referred to
    };
    struct Container {
        Kind kind;
        Index object;
        std::size_t size;
        std::size_t references; ///< from `first` on
        std::size_t first;
    };

    bool fail(const char* reason) {
        m_error = reason;
        return false;
    }

    bool count(std::size_t objects) {
        m_visited += objects;
        return m_visited <= m_objectLimit || fail("too many objects");
    }

    bool add(const Value& value, unsigned depth, Index& index) {
        if (!count(1)) return false;
        switch (value.type()) {
        case Type::nil:
            return fail("nil cannot stand in a property list");
        case Type::array:
        case Type::dictionary:
            return addContainer(value, depth, index);
        case Type::data:
            index = addData(Access::bytes(value));
            return true;
        case Type::string:
            return addText(Access::text(value, m_scratch), index);
        default:
            index = addNumber(value);
            return true;
        }
    }

    /// A container that was met before is referred to again. None can hold itself: values do not change.
    bool addContainer(const Value& value, unsigned depth, Index& index) {
        if (depth == m_nesting) return fail("nested too deeply");
        if (Access::isAlone(value)) return addContents(value, depth, index);
        const auto visited = m_visited;
        const auto [place, isNew] = placeOf(Access::identity(value), 0);
        if (!isNew) return referAgain(m_places[place], depth, index);
        const auto deepest = std::exchange(m_deepest, depth);
        if (!addContents(value, depth, index)) return false;
        m_places[place].object = index;
        m_places[place].expanded = m_visited - visited;
        m_places[place].height = m_deepest - depth;
        m_deepest = std::max(m_deepest, deepest);
        return true;
    }

    bool referAgain(const Place& place, unsigned depth, Index& index) {
        index = place.object;
        m_deepest = std::max(m_deepest, depth + place.height);
        return m_deepest < m_nesting ? count(place.expanded) : fail("nested too deeply");
    }

    bool addContents(const Value& value, unsigned depth, Index& index) {
        index = newObject({});
        m_deepest = std::max(m_deepest, depth);
        const std::size_t size = value.size();
        const bool isDictionary = value.isDictionary();
        const std::size_t keys = isDictionary ? size : 0;
        std::size_t at = m_references.size();
        m_containers.push({isDictionary ? Kind::dictionary : Kind::array, index, size, keys + size, at});
        m_references.extend(keys + size, 0);

        if (!count(keys)) return false;
        for (std::size_t i = 0; i < keys; ++i)
            if (!addText(Access::keyAt(value, i, m_scratch), m_references[at++])) return false;
        return Access::all(value, [&](const Value& element) {
            // Not straight into the references: they move while the element adds its own.
            Index child = 0;
            if (!add(element, depth + 1, child)) return false;
            m_references[at++] = child;
            return true;
        });
    }

    bool addText(std::string_view text, Index& index) {
        if (!count(weightOfText(text.size()))) return false;
        const std::size_t mark = m_out.mark();
        const auto bytes = std::as_bytes(std::span(text));
        if (unicode::isASCII(bytes)) {
            m_out.putHead(Kind::ascii, bytes.size()).put(bytes);
        } else {
            m_units.clear();
            while (!text.empty())
                unicode::appendUTF16(m_units, unicode::takeUTF8(text));
            m_out.putHead(Kind::utf16, m_units.size() / 2).put(m_units);
        }
        index = leafSince(mark);
        return true;
    }

    Index addNumber(const Value& value) {
        const std::size_t mark = m_out.mark();
        switch (value.type()) {
        case Type::boolean:
            m_out.putNumber(value.boolValue() ? 0x09 : 0x08, 1);
            break;
        case Type::real:
            m_out.putNumber(0x23, 1).putNumber(std::bit_cast<std::uint64_t>(value.doubleValue()), 8);
            break;
        case Type::date:
            m_out.putNumber(0x33, 1).putNumber(
                std::bit_cast<std::uint64_t>(value.dateValue().secondsSince2001), 8);
            break;
        default:
            if (Access::isNegative(value))
                m_out.putNumber(0x13, 1).putNumber(value.unsignedLongLongValue(), 8);
            else
                m_out.putInteger(value.unsignedLongLongValue());
        }
        return leafSince(mark);
    }

    Index addData(std::span<const std::byte> bytes) {
        if (bytes.size() >= kPieceSize) return addPiece(bytes);
        const std::size_t mark = m_out.mark();
        m_out.putHead(Kind::data, bytes.size()).put(bytes);
        return leafSince(mark);
    }

    /// What was put last, from `mark` on. If the like of it was put before, that, and it is taken back.
    Index leafSince(std::size_t mark) {
        const std::span<const std::byte> leaf(m_out.at(mark), m_out.mark() - mark);
        const auto isSame = [&](Index known) {
            // The head tells the size, so whatever starts alike is alike.
            const std::size_t other = m_objects[known].mark;
            return mark - other >= leaf.size() && std::memcmp(m_out.at(other), leaf.data(), leaf.size()) == 0;
        };
        const Index known = m_leaves.findOrAdd(m_hash.of(leaf), nextObject(), Uniquer::kForEver, isSame);
        if (known == Uniquer::kNone) return newObject({m_out.size() - leaf.size(), mark});
        m_out.truncate(mark);
        return known;
    }

    /// The same for data that is pointed at.
    Index addPiece(std::span<const std::byte> bytes) {
        const auto [place, isNew] = placeOf(bytes.data(), bytes.size());
        if (isNew) m_places[place].object = addContent(bytes, place);
        return m_places[place].object;
    }

    Index addContent(std::span<const std::byte> bytes, Index place) {
        // Bounded: to write data twice does no harm, to compare megabytes with everything does.
        constexpr unsigned kPatience = 4;
        const auto isSame = [&](Index known) {
            const Place& other = m_places[known];
            return other.size == bytes.size() && std::memcmp(other.start, bytes.data(), bytes.size()) == 0;
        };
        const Index known = m_contents.findOrAdd(m_hash.ofSamples(bytes), place, kPatience, isSame);
        if (known != Uniquer::kNone) return m_places[known].object;
        m_places[place].object = newObject({});
        if (bytes.size() < kLargeData)
            writePiece(m_places[place]);
        else
            m_large.push(place);
        return m_places[place].object;
    }

    void writePiece(const Place& place) {
        m_objects[place.object].offset = m_out.size();
        m_out.putHead(Kind::data, place.size)
            .putElsewhere({static_cast<const std::byte*>(place.start), place.size});
    }

    /// Where it is in `m_places`, and whether only now.
    std::pair<Index, bool> placeOf(const void* start, std::size_t size) {
        const auto isThere = [&](Index known) {
            return m_places[known].start == start && m_places[known].size == size;
        };
        const auto next = static_cast<Index>(m_places.size());
        const Index known = m_knownPlaces.findOrAdd(m_hash.of(start, size), next, Uniquer::kForEver, isThere);
        if (known != Uniquer::kNone) return {known, false};
        m_places.push({start, size, 0});
        return {next, true};
    }

    Index nextObject() const { return static_cast<Index>(m_objects.size()); }
    Index newObject(const Object& object) {
        m_objects.push(object);
        return static_cast<Index>(m_objects.size() - 1);
    }

    void writeContainers() {
        const std::size_t width = referenceSize();
        for (const Container& container : m_containers) {
            m_objects[container.object].offset = m_out.size();
            m_out.putHead(container.kind, container.size);
            std::byte* to = m_out.extend(container.references * width);
            for (std::size_t i = 0; i < container.references; ++i)
                to = storeNumber(to, m_references[container.first + i], width);
        }
    }

    void writeTable(Index top) {
        const std::size_t table = m_out.size();
        const std::size_t width = widthFor(table);
        std::byte* to = m_out.extend(m_objects.size() * width + Document::kTrailer);
        for (const Object& object : m_objects)
            to = storeNumber(to, object.offset, width);
        to = storeNumber(to, width, 7);
        to = storeNumber(to, referenceSize(), 1);
        to = storeNumber(to, m_objects.size(), 8);
        to = storeNumber(to, top, 8);
        storeNumber(to, table, 8);
    }

    std::size_t referenceSize() const { return widthFor(m_objects.size() - 1); }

    const std::size_t m_objectLimit;
    const std::size_t m_byteLimit;
    const unsigned m_nesting;
    std::string& m_error;
    const Hash m_hash;
    Output m_out{512};
    std::string m_scratch;
    std::vector<std::byte> m_units;
    Pile<Object, 32> m_objects;
    Pile<Container, 8> m_containers;
    Pile<Index, 32> m_references; ///< of all containers; of dictionaries the keys, then the values
    Pile<Place, 8> m_places;
    Pile<Index, 8> m_large; ///< places of data that comes last
    Uniquer m_leaves;
    Uniquer m_knownPlaces;
    Uniquer m_contents;
    std::size_t m_visited = 0;
    unsigned m_deepest = 0; ///< container in the one that is being added
};

} // namespace

Encoded WriteBinary(const Value& value, std::string& error, const Limits& limits) {
    return Writer(limits, error).run(value);
}

} // namespace plist
