// SPDX-License-Identifier: Apache-2.0
// Jobs, built but not started, or ended: time and memory per job to enumerate them, refresh included, and
// what whole requests for them cost, from message to message.
#include <benchmark/benchmark.h>
#include <malloc.h>

#include "CimXml/Request.h"
#include "CimXml/Response.h"
#include "ColdCaches.h"
#include "Framework/Classes/CimBroker.h"
#include "Framework/Requests/CimRequests.h"
#include "Host/Operations/Dispatcher.h"
#include "InstantAdapters.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJobClass.h"
#include "Providers/SoftwareUpdate/SoftwareUpdateAgent.h"

namespace {

class Jobs {
  public:
    explicit Jobs(std::size_t count, JobStateVal state = JobStateNew) {
        std::string uri = m_adapters.imageUri();
        std::vector<std::uint16_t> options = {5};
        std::vector<std::string> values;
        auto* registry = static_cast<Quenx_ConcreteJobClass*>(
            utils::Singleton<ConcreteJobFactory>::getInstance()->getCimClass());
        const std::size_t before = mallinfo2().uordblks;
        for (std::size_t i = 0; i < count; ++i) {
            Quenx_ConcreteJob::m_servicedAdapter = std::string();
            auto* job = new Quenx_ConcreteJob("port0", static_cast<int>(i), uri, options, values);
            registry->addJob(job);
            if (state != JobStateNew) job->setJobState(state);
            job->refresh();
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

using Given = std::vector<cimxml::Parameter>;

const host::Caller kCaller{"root", true, "localhost", "127.0.0.1"};

/// A front's part without its sockets. Not inlined: a profiler counts what is below it.
__attribute__((noinline)) std::size_t exchange(host::Dispatcher& dispatcher, const std::string& message) {
    host::AnswerCharge charge = dispatcher.charge(kCaller.user);
    return cimxml::sizeOf(dispatcher.answer(cimxml::readRequest(message), kCaller, charge));
}

/// A request among ended jobs, as most are.
void request(benchmark::State& state, const char* operation, Given parameters) {
    const Jobs jobs(static_cast<std::size_t>(state.range(0)), JobStateCompleted);
    host::Dispatcher dispatcher({std::make_shared<core::CimRequests>("root/cimv2")});
    const std::string message =
        cimxml::writeRequest({"1", cimxml::IntrinsicCall{operation, "root/cimv2", std::move(parameters)}});
    // The first of its kind finds out once and for all what instances look like.
    const cimxml::Request first = cimxml::readRequest(message);
    host::AnswerCharge charge = dispatcher.charge(kCaller.user);
    static_cast<void>(dispatcher.answer(first, kCaller, charge));
    std::size_t bytes = 0;
    for (auto _ : state)
        bytes = exchange(dispatcher, message);
    state.counters["bytes"] = static_cast<double>(bytes);
    report(state, jobs);
}

const cimxml::Parameter kJobs{"ClassName", cimxml::ClassName{"Quenx_ConcreteJob"}};

void enumerateAll(benchmark::State& state) {
    request(state, "EnumerateInstances", {kJobs});
}
void enumerateTenProperties(benchmark::State& state) {
    const std::vector<std::string> names{"InstanceID",       "Name",        "JobState",  "PercentComplete",
                                         "ErrorCode",        "ElapsedTime", "StartTime", "OperationalStatus",
                                         "ErrorDescription", "Caption"};
    request(state, "EnumerateInstances", {kJobs, {"PropertyList", names}});
}
void getOne(benchmark::State& state) {
    const core::CimPath path("Quenx_ConcreteJob", {{"InstanceID", "Quenx:FirmwareUpdate@Job#500"}});
    request(state, "GetInstance", {{"InstanceName", path}});
}
void enumerateService(benchmark::State& state) {
    request(state, "EnumerateInstances",
            {{"ClassName", cimxml::ClassName{"Quenx_SoftwareInstallationService"}}});
}

BENCHMARK(refreshAndEnumerate)
    ->Arg(1000)
    ->Arg(10000)
    ->Complexity(benchmark::oN)
    ->Unit(benchmark::kMillisecond);
BENCHMARK(enumerateAsValues)->Arg(1000)->Arg(10000)->Complexity(benchmark::oN)->Unit(benchmark::kMillisecond);
BENCHMARK(enumerateAll)->Arg(1000)->Arg(10000)->Complexity(benchmark::oN)->Unit(benchmark::kMillisecond);
BENCHMARK(enumerateTenProperties)->Arg(1000)->Unit(benchmark::kMillisecond);
BENCHMARK(getOne)->Arg(1000)->Arg(10000)->Unit(benchmark::kMicrosecond);
BENCHMARK(enumerateService)->Arg(1)->Unit(benchmark::kMicrosecond);

}  // namespace
