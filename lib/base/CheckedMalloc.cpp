#include "lib/base/CheckedMalloc.h"

#include "lib/base/Panic.h"

#include <cstdlib>

void* CheckedMalloc(int bugNumber, std::size_t size, const char* file, int line) {
    void* block = std::malloc(size); // NOLINT(cppcoreguidelines-no-malloc): this is the one place for it
    if (block || size == 0) return block;
    if (bugNumber != -1)
        Panic("Unrecoverable memory allocation failure at %s:%d.  Bug number: %d\n", file, line, bugNumber);
    Panic("Unrecoverable memory allocation failure at %s:%d\n", file, line);
}
