// SPDX-License-Identifier: Apache-2.0
// From dlopen to the first enumerated service instance, and the process's resident memory then.
#include <benchmark/benchmark.h>
#include <dlfcn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <fstream>

#include "Framework/Classes/CimBroker.h"

namespace {

struct Measured {
    double seconds;
    double residentMiB;
};

double residentMiB() {
    std::size_t size = 0;
    std::size_t resident = 0;
    std::ifstream("/proc/self/statm") >> size >> resident;
    return static_cast<double>(resident) * static_cast<double>(sysconf(_SC_PAGESIZE)) / (1024.0 * 1024.0);
}

Measured loadAndEnumerate() {
    const auto begin = std::chrono::steady_clock::now();
    void* library = dlopen(QUENX_UPDATE_LIBRARY, RTLD_NOW | RTLD_LOCAL);
    if (library == nullptr) _exit(1);
    if (core::GetCimBroker()->getInstances("Quenx_SoftwareInstallationService", "").first() == nullptr)
        _exit(2);
    const std::chrono::duration<double> elapsed = std::chrono::steady_clock::now() - begin;
    return {elapsed.count(), residentMiB()};
}

/// Each measurement in a process of its own, where nothing is loaded yet.
void loading(benchmark::State& state) {
    double memory = 0;
    for (auto _ : state) {
        int ends[2];
        if (pipe(ends) != 0) return;
        const pid_t child = fork();
        if (child == 0) {
            const Measured measured = loadAndEnumerate();
            _exit(write(ends[1], &measured, sizeof measured) == sizeof measured ? 0 : 3);
        }
        Measured measured{};
        close(ends[1]);
        if (read(ends[0], &measured, sizeof measured) != sizeof measured)
            state.SkipWithError("the child failed");
        waitpid(child, nullptr, 0);
        close(ends[0]);
        state.SetIterationTime(measured.seconds);
        memory = measured.residentMiB;
    }
    state.counters["resident_MiB"] = memory;
}

BENCHMARK(loading)->UseManualTime()->Unit(benchmark::kMillisecond)->Iterations(100);

}  // namespace
