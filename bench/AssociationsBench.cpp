// SPDX-License-Identifier: Apache-2.0
// Rebuilding the associations between jobs, service and adapters.
#include <benchmark/benchmark.h>

#include "ColdCaches.h"
#include "Framework/Classes/CimBroker.h"
#include "Model.h"

namespace {

void rebuild(benchmark::State& state, const char* className, bool withJobs) {
    const auto count = static_cast<std::size_t>(state.range(0));
    // As many ports as jobs, one job for each port.
    const bench::Model model(count, withJobs ? count : 0);
    // The first rebuild fetches the memory that the later ones use again.
    std::size_t size = core::GetCimBroker()->getInstances(className, "").size();
    for (auto _ : state) {
        bench::emptyCaches(state);
        size = core::GetCimBroker()->getInstances(className, "").size();
    }
    state.counters["associations"] = static_cast<double>(size);
    state.SetComplexityN(state.range(0));
}

void affectedJobElement(benchmark::State& state) {
    rebuild(state, "Quenx_AffectedJobElement", true);
}
void serviceAffectsElement(benchmark::State& state) {
    rebuild(state, "Quenx_ServiceAffectsElement", false);
}

BENCHMARK(affectedJobElement)
    ->Arg(1000)
    ->Arg(10000)
    ->Complexity(benchmark::oN)
    ->Unit(benchmark::kMillisecond);
BENCHMARK(serviceAffectsElement)
    ->Arg(1000)
    ->Arg(10000)
    ->Complexity(benchmark::oN)
    ->Unit(benchmark::kMillisecond);

}  // namespace
