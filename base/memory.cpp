#include "base/memory.h"

#include <cstdlib>

namespace tplex {

#ifdef TPLEX_ALLOC_HOOK
namespace {
unsigned long alloc_count = 0;
unsigned long alloc_fail_at = 0;
}  // namespace

unsigned long mem_fail_at(unsigned long n) noexcept {
    unsigned long made = alloc_count;
    alloc_count = 0;
    alloc_fail_at = n;
    return made;
}
#endif

void *mem_alloc(std::size_t size) noexcept {
#ifdef TPLEX_ALLOC_HOOK
    if (++alloc_count == alloc_fail_at) return nullptr;
#endif
    return std::malloc(size);
}

void mem_free(void *block) noexcept {
    std::free(block);
}

}  // namespace tplex
