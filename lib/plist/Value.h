#pragma once

#include "lib/base/SharedBytes.h"

#include <concepts>
#include <cstddef>
#include <cstdint>
#include <initializer_list>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <variant>
#include <vector>

/// Property lists: one immutable value type for everything that travels in messages and stands in settings.
namespace plist {

class Value;
class Document;

using Data = SharedBytes;
using Array = std::vector<Value>;
/// Seconds since 1 January 2001, 00:00 UTC, as the file formats count them.
struct Date {
    double secondsSince2001 = 0;
    friend bool operator==(const Date&, const Date&) = default;
};

enum class Type { nil, boolean, integer, real, date, data, string, array, dictionary };

/// A dictionary under construction, in insertion order. Setting a key again replaces its value in place;
/// setting nil leaves the key out. Setting looks through the entries: meant for dictionaries that code spells
/// out.
class Dictionary {
public:
    using Entry = std::pair<std::string, Value>;

    struct Field;

    Dictionary();
    Dictionary(std::initializer_list<Field> fields);
    explicit Dictionary(
        std::vector<Entry> entries); ///< any number; of equal keys the last one's value counts
    Dictionary& set(std::string_view key, Value value);
    std::size_t size() const;
    const std::vector<Entry>& entries() const { return m_entries; }

private:
    std::vector<Entry> m_entries;
};

/// A property-list value. Copying is cheap and shares. A value that was parsed is a view into the parsed
/// bytes: strings are made when asked for, data points into them and keeps them alive. Thread-safe to read.
///
/// Reading never fails: what is absent or of another type reads as nil, empty, zero or false.
class Value {
public:
    Value() = default;
    // NOLINTBEGIN(google-explicit-constructor): dictionaries are spelled out in code
    Value(std::nullptr_t) {}
    Value(std::same_as<bool> auto flag)
        : m_content(flag) {}
    template <std::integral Number>
    requires(!std::same_as<Number, bool>) Value(Number number)
        : m_content(Integer{static_cast<std::uint64_t>(number), std::signed_integral<Number> && number < 0}) {
    }
    Value(double number)
        : m_content(number) {}
    Value(Date date)
        : m_content(date) {}
    Value(Data data)
        : m_content(std::move(data)) {}
    Value(std::string string);
    Value(std::string_view string);
    Value(const char* string);
    Value(Array array);
    Value(Dictionary dictionary);
    // NOLINTEND(google-explicit-constructor)

    Type type() const;
    bool isNil() const { return type() == Type::nil; }
    bool isNumber() const; ///< boolean, integer or real
    bool isString() const { return type() == Type::string; }
    bool isArray() const { return type() == Type::array; }
    bool isDictionary() const { return type() == Type::dictionary; }

    /// Numbers convert as in C, out-of-range reals saturating; 64-bit integers keep their low bits.
    bool boolValue() const; ///< any non-zero number
    std::int32_t intValue() const;
    std::uint32_t unsignedIntValue() const;
    std::int64_t longLongValue() const;
    std::uint64_t unsignedLongLongValue() const;
    double doubleValue() const;
    Date dateValue() const;

    /// UTF-8.
    std::optional<std::string> string() const;
    std::string stringOr(std::string_view fallback) const;
    /// Compares without making a string.
    bool equalsString(std::string_view text) const;
    /// Points into what was parsed; empty for other types.
    Data data() const;

    /// Elements of an array, entries of a dictionary; 0 for everything else.
    std::size_t size() const;
    Value at(std::size_t index) const;            ///< an array's element or a dictionary's value, in order
    std::string keyAt(std::size_t index) const;   ///< a dictionary's key
    Value operator[](std::string_view key) const; ///< a dictionary's value; nil when absent

    class Iterator;
    Iterator begin() const; ///< over `at(0)` … `at(size() - 1)`
    Iterator end() const;

    /// Equal by type and content. Integers compare by value whatever their sign; a boolean equals no integer;
    /// dictionaries compare without regard to order; two nils are equal here.
    friend bool operator==(const Value& a, const Value& b);

    /// For people: strings as they are, nil as "(null)", containers in the old-style form. What is very deep
    /// or very long is cut.
    std::string description() const;

private:
    friend struct Access;

    struct Integer {
        std::uint64_t bits = 0;
        bool negative = false;
    };
    /// Data, a string, an array or a dictionary of a parsed document: where its object starts.
    struct View {
        std::shared_ptr<const Document> document;
        const std::byte* object = nullptr;
    };
    /// Owning alternatives stand in the order of `Type`.
    using Content =
        std::variant<std::monostate, bool, Integer, double, Date, Data, std::shared_ptr<const std::string>,
                     std::shared_ptr<const Array>, std::shared_ptr<const Dictionary>, View>;

    Content m_content;
};

/// An entry as code spells it out. Its value is moved from.
struct Dictionary::Field {
    std::string_view key;
    mutable Value value;
};

/// Valid as long as the value that it came from.
class Value::Iterator {
public:
    using value_type = Value;
    using difference_type = std::ptrdiff_t;

    Iterator() = default;
    Iterator(const Value& container, std::size_t index)
        : m_container(&container)
        , m_index(index) {}
    Value operator*() const { return m_container->at(m_index); }
    Iterator& operator++() {
        ++m_index;
        return *this;
    }
    Iterator operator++(int) {
        const Iterator before = *this;
        ++m_index;
        return before;
    }
    friend bool operator==(const Iterator&, const Iterator&) = default;

private:
    const Value* m_container = nullptr;
    std::size_t m_index = 0;
};

inline Value::Iterator Value::begin() const {
    return {*this, 0};
}
inline Value::Iterator Value::end() const {
    return {*this, size()};
}

} // namespace plist
