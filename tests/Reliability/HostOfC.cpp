// SPDX-License-Identifier: Apache-2.0
// A host without the C++ library, which therefore comes and goes with the providers: nothing that a thread of
// theirs does for the first time has been done for it before. It has never logged a line either.
//
//   HostOfC INVENTORY UPDATE STARTER flash URI   unloads while the flash runs
//   HostOfC INVENTORY UPDATE STARTER calls URI   unloads while many threads call, wrongly
#include <dlfcn.h>
#include <pthread.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <unistd.h>

namespace {

constexpr int kThreads = 16;
constexpr unsigned int kHangsAfterSeconds = 60;
int (*startFlash)(const char*);
volatile int stopCalling = 0;

void* load(const char* path) {
    void* const handle = dlopen(path, RTLD_NOW | RTLD_LOCAL);
    if (handle != nullptr) return handle;
    puts(dlerror());
    exit(1);
}

void* callWrongly(void*) {
    while (__atomic_load_n(&stopCalling, __ATOMIC_ACQUIRE) == 0)
        startFlash("nonsense");
    return nullptr;
}

}  // namespace

int main(int argc, char** argv) {
    if (argc != 6) return 2;
    alarm(kHangsAfterSeconds);
    void* const inventory = load(argv[1]);
    void* const update = load(argv[2]);
    void* const starter = load(argv[3]);
    reinterpret_cast<void (*)()>(dlsym(starter, "beginSession"))();
    startFlash = reinterpret_cast<int (*)(const char*)>(dlsym(starter, "startFlash"));

    const bool calls = strcmp(argv[4], "calls") == 0;
    pthread_t threads[kThreads];
    for (int i = 0; calls && i < kThreads; ++i)
        pthread_create(&threads[i], nullptr, callWrongly, nullptr);
    if (!calls && startFlash(argv[5]) != 1) return 3;
    dlclose(update);
    dlclose(inventory);
    __atomic_store_n(&stopCalling, 1, __ATOMIC_RELEASE);
    for (int i = 0; calls && i < kThreads; ++i)
        pthread_join(threads[i], nullptr);

    reinterpret_cast<void (*)()>(dlsym(starter, "endSession"))();
    puts("unloaded");
    return 0;
}
