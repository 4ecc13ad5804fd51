#include "lib/plist/Value.h"

#include "lib/plist/Document.h"
#include "lib/plist/Unicode.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <initializer_list>
#include <limits>
#include <memory>
#include <numeric>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <utility>
#include <variant>
#include <vector>

namespace plist {

namespace {

template <class To>
To fromReal(double number) {
    using Limits = std::numeric_limits<To>;
    if (std::isnan(number)) return 0;
    if (number >= static_cast<double>(Limits::max())) return Limits::max();
    if (number <= static_cast<double>(Limits::min())) return Limits::min();
    return static_cast<To>(number);
}

template <class To>
To numberOf(const Value& value) {
    const auto& content = Access::content(value);
    if (const auto* flag = std::get_if<bool>(&content)) return *flag ? 1 : 0;
    if (const auto* integer = std::get_if<Access::Integer>(&content)) return static_cast<To>(integer->bits);
    if (const auto* real = std::get_if<double>(&content)) return fromReal<To>(*real);
    return 0;
}

Type typeOf(Kind kind) {
    switch (kind) {
    case Kind::data:
        return Type::data;
    case Kind::array:
        return Type::array;
    case Kind::dictionary:
        return Type::dictionary;
    default:
        return Type::string;
    }
}

bool utf16Equals(std::span<const std::byte> units, std::string_view text) {
    while (!units.empty() && !text.empty()) {
        // A real U+FFFD and malformed text would meet here as one: the length of what was taken tells them
        // apart.
        const std::size_t before = text.size();
        const char32_t character = unicode::takeUTF8(text);
        if (unicode::takeUTF16(units) != character) return false;
        if (character == unicode::kReplacement && before - text.size() != 3) return false;
    }
    return units.empty() && text.empty();
}

bool textEquals(const std::byte* object, std::string_view text) {
    const Header header = headerAt(object);
    if (header.kind == Kind::ascii) return header.ascii() == text;
    return header.kind == Kind::utf16 && utf16Equals(header.units(), text);
}

/// Compares what most keys are: ASCII of less than 15 bytes, whose size stands in the first byte.
class ShortText {
public:
    explicit ShortText(std::string_view text)
        : m_text(text)
        , m_head(static_cast<std::byte>(headOf | std::min<std::size_t>(text.size(), 0xF))) {}

    bool canTell(const std::byte* object) const {
        return *object >= std::byte{headOf} && *object < std::byte{headOf | 0xF};
    }
    bool is(const std::byte* object) const {
        const auto* const start = reinterpret_cast<const char*>(object + 1);
        return *object == m_head && std::string_view(start, m_text.size()) == m_text;
    }

private:
    static constexpr unsigned headOf = static_cast<unsigned>(Kind::ascii) << 4;
    const std::string_view m_text;
    const std::byte m_head;
};

/// A dictionary's keys in order, each with its place.
std::vector<std::pair<std::string, std::size_t>> sortedKeys(const Value& dictionary) {
    std::vector<std::pair<std::string, std::size_t>> keys;
    keys.reserve(dictionary.size());
    for (std::size_t i = 0; i < dictionary.size(); ++i)
        keys.emplace_back(dictionary.keyAt(i), i);
    std::ranges::sort(keys);
    return keys;
}

/// Sorts instead of looking up, so that the cost stays near linear for dictionaries of any size.
bool dictionariesEqual(const Value& a, const Value& b) {
    if (a.size() != b.size()) return false;
    const auto areEqual = [&](const auto& left, const auto& right) {
        return left.first == right.first && a.at(left.second) == b.at(right.second);
    };
    return std::ranges::equal(sortedKeys(a), sortedKeys(b), areEqual);
}

} // namespace

Dictionary::Dictionary() = default;

Dictionary::Dictionary(std::initializer_list<Field> fields) {
    m_entries.reserve(fields.size());
    for (const Field& field : fields)
        set(field.key, std::move(field.value));
}

Dictionary::Dictionary(std::vector<Entry> entries)
    : m_entries(std::move(entries)) {
    const auto isRepeated = [&](const Entry& entry) {
        return std::any_of(&entry + 1, std::to_address(m_entries.cend()),
                           [&](const Entry& later) { return later.first == entry.first; });
    };
    const auto isNil = [](const Entry& entry) { return entry.second.isNil(); };
    constexpr std::size_t few = 8; // compared faster than sorted
    if (m_entries.size() <= few && std::ranges::none_of(m_entries, isRepeated)) {
        std::erase_if(m_entries, isNil);
        return;
    }
    std::vector<std::size_t> order(m_entries.size());
    std::iota(order.begin(), order.end(), std::size_t{0});
    std::ranges::stable_sort(order, {},
                             [&](std::size_t i) -> const std::string& { return m_entries[i].first; });
    for (std::size_t i = order.size(); i > 1; --i) {
        Entry& last = m_entries[order[i - 1]];
        Entry& before = m_entries[order[i - 2]];
        if (last.first == before.first) before.second = std::exchange(last.second, nullptr);
    }
    std::erase_if(m_entries, isNil);
}

Dictionary& Dictionary::set(std::string_view key, Value value) {
    const auto found = std::ranges::find(m_entries, key, &Entry::first);
    if (value.isNil()) {
        if (found != m_entries.end()) m_entries.erase(found);
    } else if (found != m_entries.end()) {
        found->second = std::move(value);
    } else {
        m_entries.emplace_back(key, std::move(value));
    }
    return *this;
}

std::size_t Dictionary::size() const {
    return m_entries.size();
}

Value::Value(std::string string)
    : m_content(std::make_shared<const std::string>(std::move(string))) {}
Value::Value(std::string_view string)
    : Value(std::string(string)) {}
Value::Value(const char* string)
    : Value(std::string(string)) {}
Value::Value(Array array)
    : m_content(std::make_shared<const Array>(std::move(array))) {}
Value::Value(Dictionary dictionary)
    : m_content(std::make_shared<const Dictionary>(std::move(dictionary))) {}

Type Value::type() const {
    if (const auto* view = std::get_if<View>(&m_content)) return typeOf(kindAt(view->object));
    return static_cast<Type>(m_content.index());
}

bool Value::isNumber() const {
    const Type is = type();
    return is == Type::boolean || is == Type::integer || is == Type::real;
}

bool Value::boolValue() const {
    if (const auto* real = std::get_if<double>(&m_content)) return *real != 0;
    return numberOf<std::uint64_t>(*this) != 0;
}

std::int32_t Value::intValue() const {
    return numberOf<std::int32_t>(*this);
}
std::uint32_t Value::unsignedIntValue() const {
    return numberOf<std::uint32_t>(*this);
}
std::int64_t Value::longLongValue() const {
    return numberOf<std::int64_t>(*this);
}
std::uint64_t Value::unsignedLongLongValue() const {
    return numberOf<std::uint64_t>(*this);
}

double Value::doubleValue() const {
    if (const auto* real = std::get_if<double>(&m_content)) return *real;
    const auto* integer = std::get_if<Integer>(&m_content);
    if (integer && integer->negative) return static_cast<double>(longLongValue());
    return static_cast<double>(unsignedLongLongValue());
}

Date Value::dateValue() const {
    const auto* date = std::get_if<Date>(&m_content);
    return date ? *date : Date{};
}

std::optional<std::string> Value::string() const {
    if (!isString()) return std::nullopt;
    std::string scratch;
    const std::string_view text = Access::text(*this, scratch);
    return text.data() == scratch.data() ? std::move(scratch) : std::string(text);
}

std::string Value::stringOr(std::string_view fallback) const {
    return string().value_or(std::string(fallback));
}

bool Value::equalsString(std::string_view text) const {
    if (const auto* view = std::get_if<View>(&m_content)) return textEquals(view->object, text);
    const auto* owned = std::get_if<std::shared_ptr<const std::string>>(&m_content);
    return owned && **owned == text;
}

Data Value::data() const {
    if (const auto* data = std::get_if<Data>(&m_content)) return *data;
    const auto bytes = Access::bytes(*this);
    if (bytes.empty()) return {};
    const Data& whole = std::get<View>(m_content).document->bytes;
    return whole.slice(static_cast<std::size_t>(bytes.data() - whole.data()), bytes.size());
}

std::size_t Value::size() const {
    if (const auto* array = std::get_if<std::shared_ptr<const Array>>(&m_content)) return (*array)->size();
    if (const auto* entries = std::get_if<std::shared_ptr<const Dictionary>>(&m_content))
        return (*entries)->size();
    const auto* view = std::get_if<View>(&m_content);
    if (!view) return 0;
    const Header header = headerAt(view->object);
    return header.kind == Kind::array || header.kind == Kind::dictionary ? header.count : 0;
}

Value Value::at(std::size_t index) const {
    if (index >= size()) return {};
    if (const auto* array = std::get_if<std::shared_ptr<const Array>>(&m_content)) return (**array)[index];
    if (const auto* entries = std::get_if<std::shared_ptr<const Dictionary>>(&m_content))
        return (*entries)->entries()[index].second;
    const View& view = std::get<View>(m_content);
    const Header header = headerAt(view.object);
    const std::size_t values = header.kind == Kind::dictionary ? header.count : 0;
    return Access::make(view.document, view.document->child(header, values + index));
}

std::string Value::keyAt(std::size_t index) const {
    if (!isDictionary() || index >= size()) return {};
    std::string scratch;
    return std::string(Access::keyAt(*this, index, scratch));
}

Value Value::operator[](std::string_view key) const {
    if (const auto* dictionary = std::get_if<std::shared_ptr<const Dictionary>>(&m_content)) {
        const auto& entries = (*dictionary)->entries();
        const auto found = std::ranges::find(entries, key, &Dictionary::Entry::first);
        return found == entries.end() ? Value() : found->second;
    }
    const auto* view = std::get_if<View>(&m_content);
    if (!view || kindAt(view->object) != Kind::dictionary) return {};
    const Document& document = *view->document;
    const Header header = headerAt(view->object);
    const ShortText shortKey(key);
    for (std::size_t i = 0; i < header.count; ++i) {
        const std::byte* each = document.child(header, i);
        if (shortKey.canTell(each) ? shortKey.is(each) : textEquals(each, key))
            return Access::make(view->document, document.child(header, header.count + i));
    }
    return {};
}

bool operator==(const Value& a, const Value& b) {
    const Type type = a.type();
    if (type != b.type()) return false;
    switch (type) {
    case Type::nil:
        return true;
    case Type::boolean:
        return a.boolValue() == b.boolValue();
    case Type::integer: {
        const auto& left = std::get<Value::Integer>(a.m_content);
        const auto& right = std::get<Value::Integer>(b.m_content);
        return left.bits == right.bits && left.negative == right.negative;
    }
    case Type::real:
        return a.doubleValue() == b.doubleValue();
    case Type::date:
        return a.dateValue() == b.dateValue();
    case Type::data:
        return a.data() == b.data();
    case Type::string: {
        std::string scratch;
        return a.equalsString(Access::text(b, scratch));
    }
    case Type::array:
        return std::equal(a.begin(), a.end(), b.begin(), b.end());
    case Type::dictionary:
        return dictionariesEqual(a, b);
    }
    return false;
}

} // namespace plist
