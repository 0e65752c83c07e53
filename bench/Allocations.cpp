// SPDX-License-Identifier: Apache-2.0
#include "Allocations.h"

#include <atomic>
#include <cstdlib>
#include <new>

namespace {

std::atomic<std::size_t> counted{0};

}  // namespace

namespace bench {

std::size_t allocations() noexcept {
    return counted.load(std::memory_order_relaxed);
}

}  // namespace bench

// Counted for the libraries, too.
[[gnu::noinline]] void* operator new(std::size_t size) {
    counted.fetch_add(1, std::memory_order_relaxed);
    if (void* memory = std::malloc(size)) return memory;
    throw std::bad_alloc();
}
[[gnu::noinline]] void operator delete(void* memory) noexcept {
    std::free(memory);
}
[[gnu::noinline]] void operator delete(void* memory, std::size_t) noexcept {
    std::free(memory);
}
