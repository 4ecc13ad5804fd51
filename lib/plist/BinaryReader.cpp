#include "lib/base/SharedBytes.h"
#include "lib/plist/Binary.h"
#include "lib/plist/Document.h"
#include "lib/plist/Pile.h"
#include "lib/plist/Unicode.h"
#include "lib/plist/Value.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace plist {

namespace {

constexpr std::string_view kMagic = "bplist00";

/// Looks at the first bytes of objects. Who touches a page of a mapping gets those around it too, and has
/// them to give back: the first look at each stretch is made by a call, and the last where large data stands.
class Heads {
public:
    Heads(const Data& bytes, const PeekBytes& peek)
        : m_bytes(bytes)
        , m_peek(peek)
        , m_touched(peek ? bytes.size() / kStretch + 1 : 0) {}

    Header at(std::size_t offset) {
        const std::byte* object = m_bytes.data() + offset;
        if (!m_peek || m_touched[offset / kStretch]) return headerAt(object);
        std::byte head[16];
        if (m_peek(offset, head)) {
            Header header = headerAt(head);
            header.payload = object + (header.payload - head);
            if (header.kind == Kind::data && header.count >= kLargeData) return header;
        }
        m_touched[offset / kStretch] = true;
        return headerAt(object);
    }

private:
    static constexpr std::size_t kStretch = std::size_t{64} << 10; ///< what Linux brings in around a page

    const Data& m_bytes;
    const PeekBytes& m_peek;
    std::vector<bool> m_touched;
};

/// Walks everything that can be reached from the top object, each object once.
class Validator {
public:
    Validator(const Document& document, const Limits& limits, const PeekBytes& peek, std::string& error)
        : m_document(document)
        , m_heads(document.bytes, peek)
        , m_objects(std::min<std::size_t>(limits.objects, UINT32_MAX / 2))
        , m_nesting(std::min(limits.nesting, kDeepestNesting))
        , m_error(error)
        , m_unclaimed(document.table - Document::kPrologue) {
        m_nodes.extend(document.objectCount, {});
    }

    bool run(std::uint64_t top) { return visit(top, 0); }

private:
    /// What is known of an object once it has been seen.
    struct Node {
        std::uint32_t expanded = 0; ///< objects in it with all that it refers to; 0 when not seen
        std::uint16_t height = 0;   ///< containers from here down; `kOpen` while they are being walked
        bool isText = false;
    };
    static constexpr std::uint16_t kOpen = UINT16_MAX;

    bool fail(const char* reason) {
        m_error = reason;
        return false;
    }

    bool visit(std::uint64_t index, unsigned depth) {
        if (index >= m_nodes.size()) return fail("a reference points past the last object");
        Node& node = m_nodes[index];
        if (node.height == kOpen) return fail("a container holds itself");
        if (node.expanded == 0 && !inspect(m_document.offsetOf(index), depth, node)) return false;
        if (node.expanded > m_objects) return fail("too many objects");
        if (depth + node.height > m_nesting) return fail("nested too deeply");
        return true;
    }

    bool inspect(std::uint64_t offset, unsigned depth, Node& node) {
        if (offset < Document::kPrologue || offset >= m_document.table)
            return fail("an object lies outside the file");
        const std::byte* file = m_document.bytes.data();
        const Header header = m_heads.at(offset);
        if (header.count == Header::kMalformed) return fail("an object is malformed");
        const auto start = static_cast<std::size_t>(header.payload - file);
        const std::size_t unit = unitSize(header.kind);
        const std::size_t room = m_document.table - start;
        // A count that fits is far too small for its product to wrap.
        if (start > m_document.table || header.count > room || header.count * unit > room)
            return fail("an object is longer than the file");
        return claim(start - offset + header.count * unit) && inspectPayload(header, depth, node);
    }

    bool inspectPayload(const Header& header, unsigned depth, Node& node) {
        node.isText = header.isText();
        node.expanded = 1;
        switch (header.kind) {
        case Kind::ascii:
            node.expanded += static_cast<std::uint32_t>(weightOfText(header.bytes().size()));
            return unicode::isASCII(header.bytes()) || fail("a string is not ASCII");
        case Kind::utf16:
            node.expanded += static_cast<std::uint32_t>(weightOfText(header.units().size()));
            return true;
        case Kind::integer:
            return header.count <= 8 || fitsLongLong(header.payload) ||
                   fail("an integer of more than 64 bits");
        case Kind::array:
            return inspectContainer(header, 0, header.count, depth, node);
        case Kind::dictionary:
            return inspectContainer(header, header.count, 2 * header.count, depth, node);
        default:
            return true;
        }
    }

    bool inspectContainer(const Header& header, std::size_t keys, std::size_t count, unsigned depth,
                          Node& node) {
        if (depth == m_nesting) return fail("nested too deeply");
        std::size_t expanded = 1;
        std::uint16_t height = 0;
        node.height = kOpen;
        for (std::size_t i = 0; i < count; ++i) {
            const std::uint64_t index = m_document.references.at(header.payload, i);
            if (!visit(index, depth + 1)) return false;
            const Node& child = m_nodes[index];
            if (i < keys && !child.isText) return fail("a key is not a string");
            expanded += child.expanded;
            if (expanded > m_objects) return fail("too many objects");
            height = std::max(height, child.height);
        }
        node.expanded = static_cast<std::uint32_t>(expanded);
        node.height = static_cast<std::uint16_t>(height + 1);
        return true;
    }

    std::size_t unitSize(Kind kind) const {
        switch (kind) {
        case Kind::utf16:
            return 2;
        case Kind::array:
            return m_document.references.size();
        case Kind::dictionary:
            return 2 * m_document.references.size();
        default:
            return 1;
        }
    }

    /// From -2^63 to 2^64 - 1.
    static bool fitsLongLong(const std::byte* payload) {
        const std::uint64_t high = readNumber(payload, 8);
        const std::uint64_t low = readNumber(payload + 8, 8);
        return high == 0 || (high == UINT64_MAX && low >> 63 == 1);
    }

    /// No writer lets objects overlap. Refusing it keeps the walk linear, whatever the table of offsets says.
    bool claim(std::size_t size) {
        if (size > m_unclaimed) return fail("objects overlap");
        m_unclaimed -= size;
        return true;
    }

    const Document& m_document;
    Heads m_heads;
    const std::size_t m_objects;
    const unsigned m_nesting;
    std::string& m_error;
    std::size_t m_unclaimed;
    Pile<Node, 32> m_nodes;
};

/// Why the trailer cannot be right; null and the document's layout when it can.
const char* readTrailer(Document& document, std::uint64_t& top, const Limits& limits) {
    const Data& bytes = document.bytes;
    if (bytes.size() > limits.bytes) return "the file is too large";
    if (bytes.size() < Document::kPrologue + Document::kTrailer) return "the file is too short";
    if (std::memcmp(bytes.data(), kMagic.data(), kMagic.size()) != 0) return "not a binary property list";

    const std::size_t end = bytes.size() - Document::kTrailer;
    const std::byte* trailer = bytes.data() + end;
    const auto offsetSize = std::to_integer<std::size_t>(trailer[6]);
    const auto referenceSize = std::to_integer<std::size_t>(trailer[7]);
    document.objectCount = readNumber(trailer + 8, 8);
    document.table = readNumber(trailer + 24, 8);
    top = readNumber(trailer + 16, 8);

    const auto isWidth = [](std::size_t size) { return size >= 1 && size <= 8; };
    if (!isWidth(offsetSize) || !isWidth(referenceSize)) return "the trailer is malformed";
    document.offsets = Document::Numbers(offsetSize);
    document.references = Document::Numbers(referenceSize);
    if (document.table < Document::kPrologue || document.table > end)
        return "the table of offsets lies outside the file";
    if (document.objectCount > (end - document.table) / offsetSize)
        return "the table of offsets is longer than the file";
    if (document.objectCount > limits.objects) return "too many objects";
    return nullptr;
}

} // namespace

Value ParseBinary(const Data& bytes, std::string& error, const Limits& limits, const PeekBytes& peek) {
    auto document = std::make_shared<Document>();
    document->bytes = bytes;
    std::uint64_t top = 0;
    if (const char* reason = readTrailer(*document, top, limits)) {
        error = reason;
        return {};
    }
    if (!Validator(*document, limits, peek, error).run(top)) return {};
    const std::byte* object = bytes.data() + document->offsetOf(top);
    return Access::make(document, object);
}

} // namespace plist
