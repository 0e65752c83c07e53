// Stands before the C library's pthread_create, for the shared libraries' calls too.
#include "Reliability/ThreadRefusal.h"

#include <dlfcn.h>
#include <pthread.h>

#include <atomic>
#include <cerrno>

#include "Utils/Export.h"

namespace test {

namespace {

std::atomic<bool> refusing{false};
std::atomic<int> refused{0};

}  // namespace

ThreadRefusal::ThreadRefusal() {
    refused = 0;
    refusing = true;
}

ThreadRefusal::~ThreadRefusal() {
    refusing = false;
}

int ThreadRefusal::count() {
    return refused;
}

}  // namespace test

extern "C" QUENX_EXPORT int pthread_create(pthread_t* thread, const pthread_attr_t* attributes,
                                           void* (*body)(void*), void* argument) noexcept {
    if (test::refusing) {
        ++test::refused;
        return EAGAIN;
    }
    using Create = int (*)(pthread_t*, const pthread_attr_t*, void* (*)(void*), void*);
    static const auto next = reinterpret_cast<Create>(dlsym(RTLD_NEXT, "pthread_create"));
    return next(thread, attributes, body, argument);
}
