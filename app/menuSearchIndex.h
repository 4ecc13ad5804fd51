#pragma once

#include "app/SMMenuModel.h"

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

/// The titles of a list, folded once and searched many times: compatibility forms, case and accents do not
/// count. Marks that readers do not take for accents (vowels of Indic scripts and Thai, voicing of kana) do.
class MenuSearchIndex {
public:
    MenuSearchIndex() = default;
    explicit MenuSearchIndex(SMMenuModel::List items);

    /// Null when made over no list.
    const SMMenuModel::List& items() const { return m_items; }

    /// The items whose title contains the text, in the list's order. The text is taken literally; one that
    /// holds a NUL, or nothing that can be searched for, is in no title.
    SMMenuItems itemsContaining(std::string_view text) const;

private:
    SMMenuModel::List m_items;
    std::string m_keys;              ///< each followed by a NUL
    std::vector<std::size_t> m_ends; ///< of each key with its NUL
};
