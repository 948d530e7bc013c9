// Heap allocation for the whole library. Every block the library owns comes
// from here, so a test build can make the n-th allocation fail.
#ifndef TPLEX_BASE_MEMORY_H
#define TPLEX_BASE_MEMORY_H

#include <cstddef>

namespace tplex {

// malloc, or null when it fails (or when the test hook says it fails).
void *mem_alloc(std::size_t size) noexcept;
// free; null is allowed.
void mem_free(void *block) noexcept;

#ifdef TPLEX_ALLOC_HOOK
// Test builds only: allocation number n (counting from 1 after the call)
// fails; 0 switches failures off. Returns the number of allocations made
// since the last call.
unsigned long mem_fail_at(unsigned long n) noexcept;
#endif

}  // namespace tplex

#endif
