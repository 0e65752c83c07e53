// SPDX-License-Identifier: Apache-2.0
// A host without the C++ library, which therefore comes and goes with the providers: nothing that a thread of
// theirs does for the first time has been done for it before. It has never logged a line either. It loads two
// providers, unloads the one with the index CLOSED first, and prints what is left after each step.
//
//   HostOfC ONE OTHER STARTER CLOSED flash URI   unloads while the flash runs, twice
//   HostOfC ONE OTHER STARTER CLOSED calls URI   unloads while the flash runs and many threads call
//   HostOfC ONE OTHER STARTER CLOSED leave URI   the main thread leaves while the flash runs
//   HostOfC ONE OTHER STARTER CLOSED fork URI    the same, after a child has ended
//   HostOfC ONE OTHER STARTER CLOSED exit URI    exits while the flash runs
#include <dlfcn.h>
#include <pthread.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/wait.h>
#include <syslog.h>
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

int isMapped(const char* library) {
    void* const handle = dlopen(library, RTLD_NOW | RTLD_NOLOAD);
    if (handle != nullptr) dlclose(handle);
    return handle == nullptr ? 0 : 1;
}

/// Mostly refused, since one flash runs already.
void* callOften(void* uri) {
    while (__atomic_load_n(&stopCalling, __ATOMIC_ACQUIRE) == 0)
        startFlash(static_cast<const char*>(uri));
    return nullptr;
}

}  // namespace

int main(int argc, char** argv) {
    if (argc != 7) return 2;
    alarm(kHangsAfterSeconds);
    void* providers[] = {load(argv[1]), load(argv[2])};
    void* const starter = load(argv[3]);
    startFlash = reinterpret_cast<int (*)(const char*)>(dlsym(starter, "startFlash"));
    const auto agentCount = reinterpret_cast<int (*)()>(dlsym(starter, "agentCount"));
    const auto report = [&] {
        printf("%d agents, mapped: %d %d\n", agentCount(), isMapped(argv[1]), isMapped(argv[2]));
    };
    report();

    printf("job %d\n", startFlash(argv[6]));
    const bool calls = strcmp(argv[5], "calls") == 0;
    pthread_t threads[kThreads];
    for (int i = 0; calls && i < kThreads; ++i)
        pthread_create(&threads[i], nullptr, callOften, argv[6]);
    const bool forks = strcmp(argv[5], "fork") == 0;
    const bool isLeaving = forks || strcmp(argv[5], "leave") == 0;
    if (forks) {
        int status = 0;
        fflush(stdout);
        const pid_t child = fork();
        if (child == 0) {
            alarm(kHangsAfterSeconds);
            dlclose(providers[1]);
            report();
            load(argv[2]);
            report();
            exit(0);
        }
        waitpid(child, &status, 0);
        printf("child: %d\n", status);
    }
    if (strcmp(argv[5], "exit") == 0) exit(0);
    // The worker is the last thread then, and what it runs into is the end of the process.
    if (isLeaving) pthread_exit(nullptr);
    const int closedFirst = atoi(argv[4]);
    dlclose(providers[closedFirst]);
    report();
    dlclose(providers[1 - closedFirst]);
    report();
    if (!calls) {
        providers[0] = load(argv[1]);
        providers[1] = load(argv[2]);
        printf("job %d\n", startFlash(argv[6]));
        dlclose(providers[0]);
        dlclose(providers[1]);
    }
    __atomic_store_n(&stopCalling, 1, __ATOMIC_RELEASE);
    for (int i = 0; calls && i < kThreads; ++i)
        pthread_join(threads[i], nullptr);

    // The rest goes with its last user.
    dlclose(starter);
    // A host goes on logging; the system has kept what it was told at the opening of the log.
    syslog(LOG_DEBUG, "unloaded");
    printf("any: %d\n", isMapped("libQuenx_CimFramework.so") + isMapped("libQuenx_Utils.so"));
    return 0;
}
