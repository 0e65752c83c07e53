// SPDX-License-Identifier: Apache-2.0
// This program's own operator new and delete, pthread_create and gettimeofday: they serve the shared
// libraries, too.
#include "Reliability/Interposed.h"

#include <dlfcn.h>
#include <pthread.h>
#include <sys/time.h>

#include <cerrno>
#include <cstddef>
#include <cstdlib>
#include <ctime>
#include <new>

#include "Utils/Export.h"

namespace test {

namespace {

std::atomic<std::int64_t> live{0};
/// How many allocations are left until one fails; 0 or less for none.
std::atomic<std::int64_t> remaining{0};
std::atomic<pthread_t> armingThread{};
std::atomic<bool> strikesArmingThread{false};

bool failsNow() {
    if (remaining.load(std::memory_order_acquire) <= 0) return false;
    const bool isArming = pthread_equal(pthread_self(), armingThread.load()) != 0;
    return isArming == strikesArmingThread.load() && remaining.fetch_sub(1) == 1;
}

/// Stands before each block: its size, since not every operator delete is told it.
constexpr std::size_t kHeader = alignof(std::max_align_t);

}  // namespace

std::atomic<bool> refusesThreads{false};
std::atomic<std::int64_t> clockOffset{0};

std::int64_t liveBytes() {
    return live.load();
}

AllocationFailure::AllocationFailure(On on, std::uint64_t n) {
    armingThread = pthread_self();
    strikesArmingThread = on == On::ThisThread;
    remaining.store(static_cast<std::int64_t>(n), std::memory_order_release);
}

AllocationFailure::~AllocationFailure() {
    remaining = 0;
}

bool AllocationFailure::hasStruck() const {
    return remaining.load() <= 0;
}

}  // namespace test

// The forms for arrays call these, but for those of a sanitizer's library, which keep to themselves.
QUENX_EXPORT void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
    if (test::failsNow()) return nullptr;
    void* const block = std::malloc(size + test::kHeader);
    if (block == nullptr) return nullptr;
    *static_cast<std::size_t*>(block) = size;
    test::live.fetch_add(static_cast<std::int64_t>(size), std::memory_order_relaxed);
    return static_cast<std::byte*>(block) + test::kHeader;
}
QUENX_EXPORT void* operator new(std::size_t size) {
    if (void* const memory = operator new(size, std::nothrow)) return memory;
    throw std::bad_alloc();
}
QUENX_EXPORT void operator delete(void* memory) noexcept {
    if (memory == nullptr) return;
    void* const block = static_cast<std::byte*>(memory) - test::kHeader;
    test::live.fetch_sub(static_cast<std::int64_t>(*static_cast<std::size_t*>(block)),
                         std::memory_order_relaxed);
    std::free(block);
}
QUENX_EXPORT void operator delete(void* memory, std::size_t) noexcept {
    operator delete(memory);
}

extern "C" QUENX_EXPORT int gettimeofday(timeval* now, void*) noexcept {
    timespec time{};
    clock_gettime(CLOCK_REALTIME, &time);
    now->tv_sec = time.tv_sec + static_cast<std::time_t>(test::clockOffset);
    now->tv_usec = time.tv_nsec / 1000;
    return 0;
}

using Create = int(pthread_t*, const pthread_attr_t*, void* (*)(void*), void*);

/// What a sanitizer, if there is one, does for pthread_create.
extern "C" __attribute__((weak)) Create __interceptor_pthread_create;

extern "C" QUENX_EXPORT int pthread_create(pthread_t* thread, const pthread_attr_t* attributes,
                                           void* (*body)(void*), void* argument) noexcept {
    if (test::refusesThreads) return EAGAIN;
    static const auto next = __interceptor_pthread_create != nullptr
                                 ? &__interceptor_pthread_create
                                 : reinterpret_cast<Create*>(dlsym(RTLD_NEXT, "pthread_create"));
    return next(thread, attributes, body, argument);
}
