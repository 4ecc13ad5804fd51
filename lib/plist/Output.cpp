#include "lib/plist/Output.h"

#include "lib/base/SharedBytes.h"
#include "lib/plist/Binary.h"
#include "lib/plist/Value.h"

#include <algorithm>
#include <cstddef>
#include <cstring>
#include <memory>
#include <span>
#include <utility>
#include <vector>

namespace plist {

void Output::grow(std::size_t size) {
    m_capacity = std::max(2 * m_capacity, m_used + size);
    auto larger = std::make_shared_for_overwrite<std::byte[]>(m_capacity);
    std::memcpy(larger.get(), m_own.get(), m_used);
    m_own = std::move(larger);
}

Encoded Output::finish(const Value& holder) && {
    Encoded encoded;
    encoded.size = size();
    encoded.pieces.reserve(2 * m_breaks.size() + 1);
    const std::span<const std::byte> own(m_own.get(), m_used);
    std::size_t from = 0;
    for (const Break& each : m_breaks) {
        encoded.pieces.push_back(own.subspan(from, each.at - from));
        encoded.pieces.push_back(each.bytes);
        from = each.at;
    }
    encoded.pieces.push_back(own.subspan(from));
    encoded.keepAlive = std::move(m_own);
    if (!m_breaks.empty())
        encoded.keepAlive = std::make_shared<std::pair<std::shared_ptr<const void>, Value>>(
            std::move(encoded.keepAlive), holder);
    return encoded;
}

SharedBytes Encoded::joined() const {
    auto buffer = std::make_shared<std::vector<std::byte>>();
    buffer->reserve(size);
    for (const auto& piece : pieces)
        buffer->insert(buffer->end(), piece.begin(), piece.end());
    return {*buffer, buffer};
}

} // namespace plist
