#include "app/menuSearchIndex.h"

#include "app/SMMenuItem.h" // IWYU pragma: keep
#include "app/SMMenuModel.h"

#include <QChar>
#include <QList>
#include <QString>
#include <algorithm>
#include <array>
#include <cstring>
#include <string.h>
#include <string>
#include <string_view>
#include <utility>

namespace {

struct Letter {
    char32_t from;
    const char* to;
};
/// Letters that do not decompose, but that people type without their stroke or ligature.
constexpr std::array<Letter, 13> letters{{
    {U'\u00DF', "ss"}, // ß
    {U'\u00E6', "ae"}, // æ
    {U'\u00F0', "d"},  // ð
    {U'\u00F8', "o"},  // ø
    {U'\u00FE', "th"}, // þ
    {U'\u0111', "d"},  // đ
    {U'\u0127', "h"},  // ħ
    {U'\u0131', "i"},  // ı
    {U'\u0142', "l"},  // ł
    {U'\u0153', "oe"}, // œ
    {U'\u0167', "t"},  // ŧ
    {U'\u03C2', "σ"},  // ς
    {U'\u1E9E', "ss"}, // ẞ
}};

bool isAccent(char32_t c) {
    constexpr char32_t tatweel = 0x640;
    constexpr char32_t graphemeJoiner = 0x34F;
    const bool variationSelector = (c >= 0xFE00 && c <= 0xFE0F) || (c >= 0xE0100 && c <= 0xE01EF);
    if (c == 0 || c == tatweel || c == graphemeJoiner || variationSelector) return true;
    switch (QChar::category(c)) {
    case QChar::Mark_Enclosing:
    case QChar::Other_Format:
        return true;
    case QChar::Mark_NonSpacing: {
        // 0, 7, 8 and 9 are vowels, nuktas, voicing and viramas, around 100 the vowels of Thai and Lao.
        const int combining = QChar::combiningClass(c);
        return combining == 1 || (combining >= 10 && combining <= 36) || combining >= 200;
    }
    default:
        return false;
    }
}

bool isPlain(std::string_view text) {
    return std::ranges::all_of(text, [](char c) { return static_cast<unsigned char>(c - 1) < 0x7F; });
}

/// A title as it is searched, in UTF-8 without NUL.
std::string foldForSearch(std::string_view title) {
    if (isPlain(title)) {
        std::string folded(title);
        for (char& c : folded) {
            if (c >= 'A' && c <= 'Z') c = static_cast<char>(c + ('a' - 'A'));
        }
        return folded;
    }
    // Folding after decomposing and before it again: it neither reaches into ligatures nor keeps what it
    // makes decomposed.
    const QString text = QString::fromUtf8(title.data(), static_cast<qsizetype>(title.size()))
                             .normalized(QString::NormalizationForm_KD)
                             .toCaseFolded()
                             .normalized(QString::NormalizationForm_KD);
    QString folded;
    folded.reserve(text.size());
    for (const char32_t c : text.toUcs4()) {
        if (isAccent(c)) continue;
        const auto letter = std::ranges::lower_bound(letters, c, {}, &Letter::from);
        if (letter != letters.end() && letter->from == c) {
            folded += QString::fromUtf8(letter->to);
        } else {
            folded += QChar::fromUcs4(c);
        }
    }
    return folded.toStdString();
}

} // namespace

MenuSearchIndex::MenuSearchIndex(SMMenuModel::List items)
    : m_items(std::move(items)) {
    if (!m_items) return;
    m_ends.reserve(m_items->size());
    for (const auto& item : *m_items) {
        m_keys += foldForSearch(item->title());
        m_keys += '\0';
        m_ends.push_back(m_keys.size());
    }
}

SMMenuItems MenuSearchIndex::itemsContaining(std::string_view text) const {
    SMMenuItems found;
    if (!m_items || text.find('\0') != std::string_view::npos) return found;
    const std::string key = foldForSearch(text);
    if (key.empty()) return found;
    std::size_t from = 0;
    while (from < m_keys.size()) {
        const void* hit = ::memmem(m_keys.data() + from, m_keys.size() - from, key.data(), key.size());
        if (!hit) break;
        const auto at = static_cast<std::size_t>(static_cast<const char*>(hit) - m_keys.data());
        const auto end = std::ranges::upper_bound(m_ends, at);
        found.push_back((*m_items)[static_cast<std::size_t>(end - m_ends.begin())]);
        from = *end;
    }
    return found;
}
