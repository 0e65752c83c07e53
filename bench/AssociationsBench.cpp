// SPDX-License-Identifier: Apache-2.0
// Rebuilding the associations between jobs, service and adapters.
#include <benchmark/benchmark.h>
#include <dlfcn.h>

#include "ColdCaches.h"
#include "Framework/Classes/CimBroker.h"
#include "InstantAdapters.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJobClass.h"
#include "Providers/SoftwareUpdate/SoftwareUpdateAgent.h"

namespace {

/// As many ports as jobs, one job for each port.
class Model {
  public:
    Model(std::size_t ports, std::size_t jobs) : m_adapters(ports) {
        std::string uri = m_adapters.imageUri();
        std::vector<std::uint16_t> options = {5};
        std::vector<std::string> values;
        auto* registry = static_cast<Quenx_ConcreteJobClass*>(
            utils::Singleton<ConcreteJobFactory>::getInstance()->getCimClass());
        for (std::size_t i = 0; i < jobs; ++i) {
            Quenx_ConcreteJob::m_servicedAdapter = std::string();
            registry->addJob(new Quenx_ConcreteJob(bench::InstantAdapters::portName(i % ports),
                                                   static_cast<int>(i), uri, options, values));
        }
        Quenx_ConcreteJob::m_servicedAdapter = std::string();
    }
    ~Model() { dlclose(m_inventory); }
    Model(const Model&) = delete;
    Model& operator=(const Model&) = delete;

  private:
    bench::InstantAdapters m_adapters;
    void* m_inventory = dlopen(QUENX_INVENTORY_LIBRARY, RTLD_NOW | RTLD_LOCAL);
    core::SoftwareUpdateAgent m_agent;
};

void rebuild(benchmark::State& state, const char* className, bool withJobs) {
    const auto count = static_cast<std::size_t>(state.range(0));
    const Model model(count, withJobs ? count : 0);
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
