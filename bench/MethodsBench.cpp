// What the methods cost beyond the verification of the image: the image is one kilobyte, and accepted at
// once.
#include <benchmark/benchmark.h>
#include <dlfcn.h>

#include "Framework/CimRequests.h"
#include "Framework/Retirement.h"
#include "InstantAdapters.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJob.h"
#include "Providers/SoftwareUpdate/SoftwareUpdateAgent.h"

namespace {

using core::CimScalar;
using core::CimType;
using core::CimValue;

class Host {
  public:
    Host() = default;
    ~Host() { dlclose(m_inventory); }
    Host(const Host&) = delete;
    Host& operator=(const Host&) = delete;

    core::CimPath first(const char* className) const {
        return m_requests.enumerateInstanceNames(className).at(0);
    }
    const core::CimRequests& requests() const { return m_requests; }
    const std::string& imageUri() const { return m_adapters.imageUri(); }

  private:
    bench::InstantAdapters m_adapters{4};
    void* m_inventory = dlopen(QUENX_INVENTORY_LIBRARY, RTLD_NOW | RTLD_LOCAL);
    core::SoftwareUpdateAgent m_agent;
    core::CimRequests m_requests{"root/cimv2"};
};

void installFromUri(benchmark::State& state, const std::string& uri, unsigned expected) {
    const Host host;
    const core::CimPath service = host.first("Quenx_SoftwareInstallationService");
    const std::vector<core::Argument> arguments = {
        {"URI", CimValue::of(CimType::String, CimScalar(uri.empty() ? host.imageUri() : uri))},
        {"Target", CimValue::of(CimType::Reference, CimScalar(host.first("Quenx_EthernetPort")))},
        {"InstallOptions", CimValue::arrayOf(CimType::Uint16, {std::uint64_t{5}})}};
    for (auto _ : state) {
        Quenx_ConcreteJob::m_servicedAdapter = std::string();
        const auto result = host.requests().invokeMethod(service, "InstallFromURI", arguments);
        if (result.returnValue != expected) state.SkipWithError("unexpected return value");
        state.PauseTiming();
        for (const core::Argument& output : result.outputs) {
            host.requests().deleteInstance(std::get<core::CimPath>(*output.value.scalar()));
        }
        core::drainRetired();
        state.ResumeTiming();
    }
}

void installAccepted(benchmark::State& state) {
    installFromUri(state, "", 4096);
}
void installRefused(benchmark::State& state) {
    installFromUri(state, "https://host/image", 5);
}

BENCHMARK(installAccepted)->Unit(benchmark::kMicrosecond)->Iterations(50);
BENCHMARK(installRefused)->Unit(benchmark::kMicrosecond);

}  // namespace
