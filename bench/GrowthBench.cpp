// SPDX-License-Identifier: Apache-2.0
// What requests cost, from message to message, for each element of their answers: with ten times the jobs,
// the ports or the image files nothing may cost more for each.
#include "Exchange.h"
#include "Model.h"
#include "Utils/Log.h"

namespace {

using bench::Exchange;
using bench::Model;
using core::CimPath;
using core::CimScalar;
using core::CimType;
using core::CimValue;

/// The class of which there are as many as the benchmark says, and how the service is associated with them.
struct Kind {
    const char* className;
    const char* association;
};
constexpr Kind kJobs{"Quenx_ConcreteJob", "Quenx_OwningJobElement"};
constexpr Kind kPorts{"Quenx_EthernetPort", "Quenx_ServiceAffectsElement"};
constexpr Kind kImages{"Quenx_SoftwareIdentityResource", ""};
constexpr const char* kService = "Quenx_SoftwareInstallationService";
/// Beside which the other kinds are few.
constexpr std::size_t kFewPorts = 8;

cimxml::Parameter className(const char* name) {
    return {"ClassName", cimxml::ClassName{name}};
}

class Bench {
  public:
    Bench(benchmark::State& state, const Kind& kind)
        : m_state(state),
          m_kind(kind),
          m_model(is(kPorts) ? count() : kFewPorts, is(kJobs) ? count() : 0, JobStateCompleted,
                  is(kImages) ? count() : 1) {}

    CimPath path(const char* name) { return m_requests.enumerateInstanceNames(name).at(0); }
    CimValue reference(const char* name) { return CimValue::of(CimType::Reference, CimScalar(path(name))); }

    void enumerate() { whole("EnumerateInstances", {className(m_kind.className)}); }
    void get(const char* name) { one(m_exchange.message("GetInstance", {{"InstanceName", path(name)}})); }
    void associate() {
        whole("Associators",
              {{"ObjectName", path(kService)}, {"AssocClass", cimxml::ClassName{m_kind.association}}});
    }
    /// All of them, a hundred at a time.
    void pull() {
        std::size_t bytes = pullAll();
        const std::size_t before = bench::allocations();
        for (auto _ : m_state)
            bytes = pullAll();
        Exchange::report(m_state, bytes, bench::allocations() - before, m_state.range(0));
    }
    void call(const char* method, std::vector<core::Argument> arguments) {
        one(m_exchange.message(path(kService), method, std::move(arguments)));
    }
    /// A refusal for its URI, its lines in the log included.
    void refuse() {
        utils::logLevel = 1;
        call("InstallFromURI", {{"URI", CimValue::of(CimType::String, CimScalar(std::string("https://a/b")))},
                                {"Target", reference(kPorts.className)},
                                {"InstallOptions", CimValue::arrayOf(CimType::Uint16, {std::uint64_t{5}})}});
        utils::logLevel = 0;
    }

  private:
    bool is(const Kind& kind) const { return m_kind.className == kind.className; }
    std::size_t count() const { return static_cast<std::size_t>(m_state.range(0)); }

    void whole(const char* operation, std::vector<cimxml::Parameter> parameters) {
        m_exchange.measure(m_state, m_exchange.message(operation, std::move(parameters)), m_state.range(0));
    }
    void one(const std::string& message) { m_exchange.measure(m_state, message); }

    std::size_t pullAll() {
        const cimxml::Parameter atMost{"MaxObjectCount", std::string("100")};
        std::string answer = m_exchange.answer(
            m_exchange.message("OpenEnumerateInstances", {className(m_kind.className), atMost}));
        std::size_t bytes = answer.size();
        for (std::string open = contextIn(answer); !open.empty(); open = contextIn(answer)) {
            answer = m_exchange.answer(
                m_exchange.message("PullInstancesWithPath", {{"EnumerationContext", open}, atMost}));
            bytes += answer.size();
        }
        return bytes;
    }
    /// Of the enumeration that is still open; looked for from the end, since all else stands before it.
    static std::string contextIn(const std::string& answer) {
        constexpr std::string_view kBegin = "<VALUE>";
        const std::size_t name = answer.rfind("\"EnumerationContext\"");
        if (name == std::string::npos) return {};
        const std::size_t begin = answer.find(kBegin, name);
        if (begin == std::string::npos) return {};
        const std::size_t text = begin + kBegin.size();
        return answer.substr(text, answer.find('<', text) - text);
    }

    benchmark::State& m_state;
    const Kind& m_kind;
    Model m_model;
    core::CimRequests m_requests{"root/cimv2"};
    Exchange m_exchange;
};

void enumerateInstances(benchmark::State& state, const Kind& kind) {
    Bench(state, kind).enumerate();
}
void getInstance(benchmark::State& state, const Kind& kind) {
    Bench(state, kind).get(kind.className);
}
void associators(benchmark::State& state, const Kind& kind) {
    Bench(state, kind).associate();
}
void openAndPull(benchmark::State& state, const Kind& kind) {
    Bench(state, kind).pull();
}
void getService(benchmark::State& state) {
    Bench(state, kJobs).get(kService);
}
void installRefused(benchmark::State& state) {
    Bench(state, kJobs).refuse();
}
void checkIdentity(benchmark::State& state) {
    Bench bench(state, kImages);
    bench.call("CheckSoftwareIdentity", {{"Source", bench.reference("Quenx_SoftwareIdentity")},
                                         {"Target", bench.reference(kPorts.className)}});
}

// NOLINTNEXTLINE(cppcoreguidelines-macro-usage): the library registers by macros
#define GROWTH(FUNCTION, NAME, KIND, LITTLE, MUCH) \
    BENCHMARK_CAPTURE(FUNCTION, NAME, KIND)->Arg(LITTLE)->Arg(MUCH)->Unit(benchmark::kMillisecond)

GROWTH(enumerateInstances, jobs, kJobs, 1000, 10000);
GROWTH(getInstance, job, kJobs, 1000, 10000);
GROWTH(associators, jobs, kJobs, 1000, 10000);
GROWTH(openAndPull, jobs, kJobs, 1000, 10000);
GROWTH(enumerateInstances, ports, kPorts, 100, 1000);
GROWTH(getInstance, port, kPorts, 100, 1000);
GROWTH(associators, ports, kPorts, 100, 1000);
GROWTH(openAndPull, ports, kPorts, 100, 1000);
GROWTH(enumerateInstances, images, kImages, 100, 1000);
GROWTH(getInstance, image, kImages, 1, 1000);
BENCHMARK(checkIdentity)->Arg(1)->Arg(1000)->Unit(benchmark::kMillisecond);
BENCHMARK(getService)->Arg(1)->Unit(benchmark::kMillisecond);
BENCHMARK(installRefused)->Arg(1)->Unit(benchmark::kMillisecond);

}  // namespace
