#pragma once

#include <cstddef>

/// `size` bytes from `malloc`, to be given back with `free`; ends the process when there are none. Null only
/// for size 0. `bugNumber` -1: none.
[[nodiscard]] void* CheckedMalloc(int bugNumber, std::size_t size, const char* file, int line);
