#pragma once

/// Whether both are there and equal: strings by their text, pointers when they point at the same object. Two
/// absent ones are not equal: nobody is asked, so nobody says yes.
template <class Optional>
bool KXIsEqual(const Optional& a, const Optional& b) {
    return a && a == b;
}
