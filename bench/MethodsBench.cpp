// SPDX-License-Identifier: Apache-2.0
// What the methods cost beyond the verification of the image: the image is small, and accepted at once.
#include <benchmark/benchmark.h>
#include <dlfcn.h>

#include "Framework/Classes/InstanceList.h"
#include "Framework/Requests/CimRequests.h"
#include "InstantAdapters.h"
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

    core::CimPath first(const char* className) { return m_requests.enumerateInstanceNames(className).at(0); }
    CimValue firstReference(const char* className) {
        return CimValue::of(CimType::Reference, CimScalar(first(className)));
    }
    core::CimRequests& requests() { return m_requests; }
    const std::string& imageUri() const { return m_adapters.imageUri(); }

  private:
    bench::InstantAdapters m_adapters{4};
    void* m_inventory = dlopen(QUENX_INVENTORY_LIBRARY, RTLD_NOW | RTLD_LOCAL);
    core::SoftwareUpdateAgent m_agent;
    core::CimRequests m_requests{"root/cimv2"};
};

/// Calls the method again and again. The jobs that come of it are deleted outside the time, and their end
/// is waited for.
void call(benchmark::State& state, Host& host, const char* method,
          const std::vector<core::Argument>& arguments, unsigned expected) {
    const core::CimPath service = host.first("Quenx_SoftwareInstallationService");
    for (auto _ : state) {
        const auto result = host.requests().invokeMethod(service, method, arguments);
        if (result.returnValue != expected) state.SkipWithError("unexpected return value");
        state.PauseTiming();
        for (const core::Argument& output : result.outputs) {
            if (output.name != "Job") continue;
            host.requests().deleteInstance(std::get<core::CimPath>(*output.value.scalar()));
        }
        core::drainReaper([] {});
        state.ResumeTiming();
    }
}

void installFromUri(benchmark::State& state, const std::string& uri, unsigned expected) {
    Host host;
    call(state, host, "InstallFromURI",
         {{"URI", CimValue::of(CimType::String, CimScalar(uri.empty() ? host.imageUri() : uri))},
          {"Target", host.firstReference("Quenx_EthernetPort")},
          {"InstallOptions", CimValue::arrayOf(CimType::Uint16, {std::uint64_t{5}})}},
         expected);
}

void installAccepted(benchmark::State& state) {
    installFromUri(state, "", 4096);
}
void installRefused(benchmark::State& state) {
    installFromUri(state, "https://host/image", 5);
}

void installFromIdentity(benchmark::State& state) {
    Host host;
    call(state, host, "InstallFromSoftwareIdentity",
         {{"Source", host.firstReference("Quenx_SoftwareIdentity")},
          {"Target", host.firstReference("Quenx_EthernetPort")},
          {"InstallOptions", CimValue::arrayOf(CimType::Uint16, {std::uint64_t{5}})}},
         4096);
}

void checkIdentity(benchmark::State& state) {
    Host host;
    call(state, host, "CheckSoftwareIdentity",
         {{"Source", host.firstReference("Quenx_SoftwareIdentity")},
          {"Target", host.firstReference("Quenx_EthernetPort")}},
         0);
}

BENCHMARK(installAccepted)->Unit(benchmark::kMicrosecond)->Iterations(50);
BENCHMARK(installRefused)->Unit(benchmark::kMicrosecond);
BENCHMARK(installFromIdentity)->Unit(benchmark::kMicrosecond)->Iterations(50);
BENCHMARK(checkIdentity)->Unit(benchmark::kMicrosecond);

}  // namespace
