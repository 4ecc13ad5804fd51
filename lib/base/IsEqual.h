#pragma once

#include <optional>

/// Whether both are there and equal. Two absent values are not equal: nobody is asked, so nobody says yes.
template <class T>
bool KXIsEqual(const std::optional<T>& a, const std::optional<T>& b) {
    return a && b && *a == *b;
}
