// SPDX-License-Identifier: Apache-2.0
// What an enumeration costs through the CMPI front, beyond the same in process. The object manager is that of
// the tests, which forgets what it is given here: what it would do with it is not the front's cost.
#include <benchmark/benchmark.h>

#include "Allocations.h"
#include "Cmpi/LoadedFront.h"
#include "Framework/Requests/CimRequests.h"
#include "InstantAdapters.h"

namespace {

constexpr const char* kClass = "Quenx_EthernetPort";

class Host {
  public:
    explicit Host(std::size_t ports, test::Dialect dialect = test::Dialect::Sfcb)
        : m_adapters(ports), m_front(QUENX_CMPI_LIBRARY, dialect) {
        m_front.broker.instances.setProperty = [](const cmpi::Instance*, const char*, const cmpi::Value*,
                                                  cmpi::Type) { return cmpi::Status{}; };
        m_front.broker.results.returnInstance = [](const cmpi::Result*, const cmpi::Instance*) {
            ++returned;
            return cmpi::Status{};
        };
        throughFront();  // which loads the providers
    }
    std::size_t throughFront() {
        returned = 0;
        m_front.ask({"instances", core::CimPath(kClass, {})});
        return returned;
    }
    std::size_t inProcess() { return m_requests.enumerateInstances(kClass).size(); }

  private:
    static inline std::size_t returned = 0;
    bench::InstantAdapters m_adapters;
    test::LoadedFront m_front;
    core::CimRequests m_requests{"root/cimv2"};
};

template <class Enumerate>
void enumerate(benchmark::State& state, Host& host, Enumerate enumerateOnce) {
    const auto ports = static_cast<double>(state.range(0));
    const std::size_t before = bench::allocations();
    for (auto _ : state) {
        if (enumerateOnce(host) != static_cast<std::size_t>(state.range(0)))
            state.SkipWithError("ports are missing");
    }
    state.counters["allocations/instance"] =
        static_cast<double>(bench::allocations() - before) / static_cast<double>(state.iterations()) / ports;
}

void inProcess(benchmark::State& state) {
    Host host(static_cast<std::size_t>(state.range(0)));
    enumerate(state, host, [](Host& each) { return each.inProcess(); });
}
void throughFront(benchmark::State& state, test::Dialect dialect) {
    Host host(static_cast<std::size_t>(state.range(0)), dialect);
    enumerate(state, host, [](Host& each) { return each.throughFront(); });
}

BENCHMARK(inProcess)->Arg(1)->Arg(1000)->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(throughFront, sfcb, test::Dialect::Sfcb)->Arg(1)->Arg(1000)->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(throughFront, pegasus, test::Dialect::Pegasus)
    ->Arg(1)
    ->Arg(1000)
    ->Unit(benchmark::kMicrosecond);

}  // namespace
