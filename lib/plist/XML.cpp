#include "lib/plist/XML.h"

#include "lib/plist/Binary.h"
#include "lib/plist/Document.h"
#include "lib/plist/Scalars.h"
#include "lib/plist/Value.h"

#include <algorithm>
#include <array>
#include <climits>
#include <cstddef>
#include <expat.h>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace plist {

namespace {

enum class Element { plist, array, dictionary, key, string, integer, real, date, data, yes, no };

struct Name {
    std::string_view name;
    Element element;
};
constexpr std::array kNames = {
    Name{"plist", Element::plist}, Name{"array", Element::array},   Name{"dict", Element::dictionary},
    Name{"key", Element::key},     Name{"string", Element::string}, Name{"integer", Element::integer},
    Name{"real", Element::real},   Name{"date", Element::date},     Name{"data", Element::data},
    Name{"true", Element::yes},    Name{"false", Element::no},
};

bool isContainer(Element element) {
    return element <= Element::dictionary;
}

/// Builds the value from the elements as they open and close. After a failure it stands still.
class Builder {
public:
    Builder(XML_Parser parser, const Limits& limits)
        : m_parser(parser)
        , m_objects(limits.objects)
        , m_nesting(std::min(limits.nesting, kDeepestNesting)) {}

    const std::string& error() const { return m_error; }
    Value& result() { return m_result; }

    void fail(const std::string& reason) {
        if (!m_error.empty()) return;
        m_error = "line " + std::to_string(XML_GetCurrentLineNumber(m_parser)) + ": " + reason;
        XML_StopParser(m_parser, XML_FALSE);
    }

    void open(std::string_view name) {
        const auto found = std::ranges::find(kNames, name, &Name::name);
        if (!m_error.empty()) return;
        if (found == kNames.end()) return fail("an element of unknown name");
        const Element element = found->element;
        if (m_leaf) return fail("an element inside a scalar");
        if (m_open.empty() != (element == Element::plist))
            return fail("plist is the outermost element, and no other");
        if (element != Element::plist && !mayHold(element)) return;
        m_text.clear();
        if (!isContainer(element))
            m_leaf = element;
        else
            m_open.push_back({element, {}, {}, {}});
    }

    void text(std::string_view text) {
        if (!m_error.empty()) return;
        if (m_leaf)
            m_text += text;
        else if (text.find_first_not_of(" \t\r\n") != std::string_view::npos)
            fail("text between elements");
    }

    void close() {
        if (!m_error.empty()) return;
        if (!m_leaf) return closeContainer();
        const Element leaf = *m_leaf;
        m_leaf.reset();
        if (!count(weightOfText(m_text.size()))) return;
        if (leaf == Element::key) {
            m_open.back().key = std::move(m_text);
            return;
        }
        Value value = scalar(leaf);
        if (value.isNil()) return fail("a scalar that cannot be read");
        add(std::move(value));
    }

private:
    /// A container that is not complete.
    struct Open {
        Element element;
        Array elements; ///< of an array, or the one of the whole list
        std::vector<Dictionary::Entry> entries;
        std::optional<std::string> key;
    };

    bool count(std::size_t objects) {
        m_counted += objects;
        if (m_counted > m_objects) fail("too many objects");
        return m_counted <= m_objects;
    }

    bool mayHold(Element element) {
        const Open& parent = m_open.back();
        const bool isKey = element == Element::key;
        const bool wantsKey = parent.element == Element::dictionary && !parent.key;
        if (isKey != wantsKey)
            fail(isKey ? "a key without its place" : "a value without a key");
        else if (parent.element == Element::plist && !parent.elements.empty())
            fail("more than one value");
        else if (isContainer(element) && m_open.size() > m_nesting)
            fail("nested too deeply");
        return m_error.empty() && count(1);
    }

    Value scalar(Element element) {
        switch (element) {
        case Element::integer:
            return integerFromText(m_text);
        case Element::real:
            return realFromText(m_text);
        case Element::date:
            return dateFromText(m_text);
        case Element::data:
            return dataFromText(m_text);
        case Element::yes:
        case Element::no:
            return element == Element::yes;
        default:
            return std::move(m_text);
        }
    }

    void add(Value value) {
        Open& parent = m_open.back();
        if (parent.element == Element::dictionary) {
            parent.entries.emplace_back(std::move(*parent.key), std::move(value));
            parent.key.reset();
        } else {
            parent.elements.push_back(std::move(value));
        }
    }

    void closeContainer() {
        Open closed = std::move(m_open.back());
        m_open.pop_back();
        if (closed.key) return fail("a key without a value");
        if (closed.element == Element::dictionary) return add(Dictionary(std::move(closed.entries)));
        if (closed.element == Element::array) return add(std::move(closed.elements));
        if (closed.elements.empty()) return fail("no value");
        m_result = std::move(closed.elements.front());
    }

    XML_Parser m_parser;
    std::size_t m_objects;
    unsigned m_nesting;
    std::size_t m_counted = 0;
    std::string m_error;
    std::vector<Open> m_open;
    std::optional<Element> m_leaf;
    std::string m_text; ///< of the scalar that is open
    Value m_result;
};

Builder& builderOf(void* data) {
    return *static_cast<Builder*>(data);
}

void attach(XML_Parser parser, Builder& builder) {
    XML_SetUserData(parser, &builder);
    XML_SetElementHandler(
        parser, [](void* data, const XML_Char* name, const XML_Char**) { builderOf(data).open(name); },
        [](void* data, const XML_Char*) { builderOf(data).close(); });
    XML_SetCharacterDataHandler(parser, [](void* data, const XML_Char* text, int size) {
        builderOf(data).text({text, static_cast<std::size_t>(size)});
    });
    XML_SetEntityDeclHandler(parser, [](void* data, const XML_Char*, int, const XML_Char*, int,
                                        const XML_Char*, const XML_Char*, const XML_Char*,
                                        const XML_Char*) { builderOf(data).fail("it declares an entity"); });
    XML_SetSkippedEntityHandler(
        parser, [](void* data, const XML_Char*, int) { builderOf(data).fail("an unknown entity"); });
}

} // namespace

Value ParseXML(const Data& bytes, std::string& error, const Limits& limits) {
    if (bytes.size() > std::min<std::size_t>({limits.bytes, limits.xmlBytes, INT_MAX})) {
        error = "the file is too large";
        return {};
    }
    const std::unique_ptr<XML_ParserStruct, decltype(&XML_ParserFree)> parser(XML_ParserCreate(nullptr),
                                                                              XML_ParserFree);
    Builder builder(parser.get(), limits);
    attach(parser.get(), builder);
    const auto* text = reinterpret_cast<const char*>(bytes.data());
    const bool parsed =
        XML_Parse(parser.get(), text, static_cast<int>(bytes.size()), XML_TRUE) == XML_STATUS_OK;
    if (!parsed) builder.fail(XML_ErrorString(XML_GetErrorCode(parser.get())));
    if (builder.error().empty()) return std::move(builder.result());
    error = builder.error();
    return {};
}

} // namespace plist
