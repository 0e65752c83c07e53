// SPDX-License-Identifier: Apache-2.0
// Enumerating jobs that were built but not started, refresh included: time and memory per job.
#include <benchmark/benchmark.h>
#include <malloc.h>

#include "ColdCaches.h"
#include "Framework/Classes/CimBroker.h"
#include "Framework/Requests/CimRequests.h"
#include "InstantAdapters.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJobClass.h"
#include "Providers/SoftwareUpdate/SoftwareUpdateAgent.h"

namespace {

class Jobs {
  public:
    explicit Jobs(std::size_t count) {
        std::string uri = m_adapters.imageUri();
        std::vector<std::uint16_t> options = {5};
        std::vector<std::string> values;
        auto* registry = static_cast<Quenx_ConcreteJobClass*>(
            utils::Singleton<ConcreteJobFactory>::getInstance()->getCimClass());
        const std::size_t before = mallinfo2().uordblks;
        for (std::size_t i = 0; i < count; ++i) {
            Quenx_ConcreteJob::m_servicedAdapter = std::string();
            registry->addJob(new Quenx_ConcreteJob("port0", static_cast<int>(i), uri, options, values));
        }
        m_bytesPerJob = static_cast<double>(mallinfo2().uordblks - before) / static_cast<double>(count);
    }
    ~Jobs() { Quenx_ConcreteJob::m_servicedAdapter = std::string(); }
    Jobs(const Jobs&) = delete;
    Jobs& operator=(const Jobs&) = delete;

    double bytesPerJob() const { return m_bytesPerJob; }

  private:
    bench::InstantAdapters m_adapters{1};
    core::SoftwareUpdateAgent m_agent;
    double m_bytesPerJob = 0;
};

void report(benchmark::State& state, const Jobs& jobs) {
    state.counters["per_job"] = benchmark::Counter(static_cast<double>(state.range(0) * state.iterations()),
                                                   benchmark::Counter::kIsRate | benchmark::Counter::kInvert);
    state.counters["bytes_per_job"] = jobs.bytesPerJob();
    state.SetComplexityN(state.range(0));
}

/// The provider's part: every job refreshed and handed out.
void refreshAndEnumerate(benchmark::State& state) {
    const Jobs jobs(static_cast<std::size_t>(state.range(0)));
    for (auto _ : state) {
        bench::emptyCaches(state);
        auto instances = core::GetCimBroker()->getInstances("Quenx_ConcreteJob", "Software Update");
        benchmark::DoNotOptimize(instances.size());
    }
    report(state, jobs);
}

/// What a front gets: the same, with every property as a value.
void enumerateAsValues(benchmark::State& state) {
    const Jobs jobs(static_cast<std::size_t>(state.range(0)));
    core::CimRequests requests("root/cimv2");
    for (auto _ : state) {
        bench::emptyCaches(state);
        benchmark::DoNotOptimize(requests.enumerateInstances("Quenx_ConcreteJob"));
    }
    report(state, jobs);
}

BENCHMARK(refreshAndEnumerate)
    ->Arg(1000)
    ->Arg(10000)
    ->Complexity(benchmark::oN)
    ->Unit(benchmark::kMillisecond);
BENCHMARK(enumerateAsValues)->Arg(1000)->Arg(10000)->Complexity(benchmark::oN)->Unit(benchmark::kMillisecond);

}  // namespace
