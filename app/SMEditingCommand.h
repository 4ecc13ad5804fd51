#pragma once

#include <cstdint>

/// What a key asks a text field to do, where the menu has its own answer to it.
enum class SMEditingCommand : std::uint8_t {
    cancelOperation,
    insertNewline,
    insertTab,
    moveLeft,
    moveRight,
    moveDown,
    moveUp,
};
