#include "lib/plist/Document.h"

#include "lib/plist/Unicode.h"
#include "lib/plist/Value.h"

#include <algorithm>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <string_view>
#include <variant>

namespace plist {

namespace {

/// Bytes of a fixed-size object, by the halves of its first byte.
std::size_t fixedSize(Kind kind, unsigned low) {
    switch (kind) {
    case Kind::boolean:
        return low == 8 || low == 9 ? 0 : Header::kMalformed;
    case Kind::integer:
        return low <= 4 ? std::size_t{1} << low : Header::kMalformed;
    case Kind::real:
        return low == 2 || low == 3 ? std::size_t{1} << low : Header::kMalformed;
    case Kind::date:
        return low == 3 ? 8 : Header::kMalformed;
    default:
        return Header::kMalformed;
    }
}

} // namespace

Header headerOfFixedSize(const std::byte* object) {
    const auto low = std::to_integer<unsigned>(*object & std::byte{0xF});
    return {kindAt(object), fixedSize(kindAt(object), low), object + 1, low == 9};
}

Value Access::make(const std::shared_ptr<const Document>& document, const std::byte* object) {
    const Header header = headerAt(object);
    Value value;
    switch (header.kind) {
    case Kind::boolean:
        return header.flag;
    case Kind::integer:
        // Shorter ones have no sign.
        if (header.count < 8) return readNumber(header.payload, header.count);
        if (header.count == 8) return static_cast<std::int64_t>(readNumber(header.payload, 8));
        value.m_content = Integer{readNumber(header.payload + 8, 8), readNumber(header.payload, 8) != 0};
        return value;
    case Kind::real:
        if (header.count == 8) return std::bit_cast<double>(readNumber(header.payload, 8));
        return double{std::bit_cast<float>(static_cast<std::uint32_t>(readNumber(header.payload, 4)))};
    case Kind::date:
        return Date{std::bit_cast<double>(readNumber(header.payload, 8))};
    default:
        value.m_content = View{document, object};
        return value;
    }
}

std::string_view Access::text(const Header& header, std::string& scratch) {
    if (header.kind == Kind::ascii) return header.ascii();
    scratch.clear();
    if (header.kind != Kind::utf16) return scratch;
    for (auto units = header.units(); !units.empty();)
        unicode::appendUTF8(scratch, unicode::takeUTF16(units));
    return scratch;
}

std::string_view Access::text(const Value& value, std::string& scratch) {
    if (const auto* owned = std::get_if<std::shared_ptr<const std::string>>(&value.m_content)) return **owned;
    if (const auto* view = std::get_if<View>(&value.m_content)) return text(headerAt(view->object), scratch);
    return {};
}

const void* Access::identity(const Value& container) {
    if (const auto* array = std::get_if<std::shared_ptr<const Array>>(&container.m_content))
        return array->get();
    if (const auto* entries = std::get_if<std::shared_ptr<const Dictionary>>(&container.m_content))
        return entries->get();
    const auto* view = std::get_if<View>(&container.m_content);
    return view ? view->object : nullptr;
}

bool Access::isAlone(const Value& container) {
    if (const auto* entries = std::get_if<std::shared_ptr<const Dictionary>>(&container.m_content))
        return entries->use_count() == 1;
    const auto* array = std::get_if<std::shared_ptr<const Array>>(&container.m_content);
    return array && array->use_count() == 1;
}

void Access::fetchAhead(const Array& array, std::size_t index) {
    constexpr std::size_t kFar = 4, kNear = 2;
    if (array.size() - index > kFar) __builtin_prefetch(identity(array[index + kFar]));
    if (array.size() - index <= kNear) return;
    const auto* near = std::get_if<std::shared_ptr<const Dictionary>>(&array[index + kNear].m_content);
    if (!near) return;
    const std::span entries = (*near)->entries(); // of about a cache line each
    for (const auto& entry : entries.first(std::min<std::size_t>(entries.size(), 5)))
        __builtin_prefetch(&entry);
}

std::span<const std::byte> Access::bytes(const Value& value) {
    if (const auto* data = std::get_if<Data>(&value.m_content)) return data->span();
    const auto* view = std::get_if<View>(&value.m_content);
    if (!view) return {};
    const Header header = headerAt(view->object);
    return header.kind == Kind::data ? header.bytes() : std::span<const std::byte>();
}

std::string_view Access::keyAt(const Value& dictionary, std::size_t index, std::string& scratch) {
    if (const auto* owned = std::get_if<std::shared_ptr<const Dictionary>>(&dictionary.m_content))
        return (*owned)->entries()[index].first;
    const View& view = std::get<View>(dictionary.m_content);
    return text(headerAt(view.document->child(headerAt(view.object), index)), scratch);
}

} // namespace plist
