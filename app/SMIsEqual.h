#pragma once

/// The same object; two that are absent are not the same one.
template <typename Pointer>
bool SMIsEqual(const Pointer& a, const Pointer& b) {
    return a && a == b;
}
