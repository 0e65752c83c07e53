// SPDX-License-Identifier: Apache-2.0
// The speed of the CIM-XML codec: bytes to values and values to bytes, without a socket.
#include <benchmark/benchmark.h>
#include <dlfcn.h>

#include "CimXml/Request.h"
#include "CimXml/Response.h"
#include "Framework/Requests/CimRequests.h"
#include "InstantAdapters.h"

namespace {

/// What a client gets that enumerates a thousand ports.
cimxml::Response thousandPorts() {
    const bench::InstantAdapters adapters(1000);
    void* const inventory = dlopen(QUENX_INVENTORY_LIBRARY, RTLD_NOW | RTLD_LOCAL);
    cimxml::IntrinsicResult result;
    result.kind = cimxml::ResultKind::NamedInstances;
    result.instances = core::CimRequests("root/cimv2").enumerateInstances("Quenx_EthernetPort");
    dlclose(inventory);
    return {"1", "EnumerateInstances", false, "localhost", std::move(result)};
}

void count(benchmark::State& state, std::size_t bytes) {
    state.SetBytesProcessed(static_cast<std::int64_t>(bytes) * state.iterations());
    state.counters["bytes"] = static_cast<double>(bytes);
}

void writeResponse(benchmark::State& state) {
    const cimxml::Response response = thousandPorts();
    std::size_t bytes = 0;
    for (auto _ : state)
        bytes = cimxml::writeResponse(response).size();
    count(state, bytes);
}

void readResponse(benchmark::State& state) {
    const std::string message = cimxml::writeResponse(thousandPorts());
    for (auto _ : state)
        benchmark::DoNotOptimize(cimxml::readResponse(message));
    count(state, message.size());
}

void readRequest(benchmark::State& state) {
    const auto bytes = test::readTestFile(QUENX_REQUEST_SAMPLE);
    const std::string message(bytes.begin(), bytes.end());
    for (auto _ : state)
        benchmark::DoNotOptimize(cimxml::readRequest(message));
    count(state, message.size());
}

BENCHMARK(writeResponse)->Unit(benchmark::kMillisecond);
BENCHMARK(readResponse)->Unit(benchmark::kMillisecond);
BENCHMARK(readRequest)->Unit(benchmark::kMicrosecond);

}  // namespace
