// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <benchmark/benchmark.h>

#include <string>
#include <utility>
#include <vector>

#include "Allocations.h"
#include "CimXml/Request.h"
#include "Framework/Requests/CimRequests.h"
#include "Host/Operations/Dispatcher.h"
#include "Utils/Utils.h"

namespace bench {

/// A front without its sockets: a message in, a message out.
class Exchange {
  public:
    std::string message(const char* operation, std::vector<cimxml::Parameter> parameters) const {
        return cimxml::writeRequest(
            {"1", cimxml::IntrinsicCall{operation, kNamespace, std::move(parameters)}});
    }
    std::string message(const core::CimPath& object, const char* method,
                        std::vector<core::Argument> arguments) const {
        core::CimPath local = object;
        local.setNamespace(kNamespace);
        return cimxml::writeRequest({"1", cimxml::MethodCall{method, local, std::move(arguments)}});
    }
    /// Not inlined: a profiler counts what is below it.
    __attribute__((noinline)) std::string answer(const std::string& message) {
        host::AnswerCharge charge = m_dispatcher.charge(kCaller.user);
        return utils::joined(m_dispatcher.answer(cimxml::readRequest(message), kCaller, charge), "");
    }

    /// Counts what one message costs, the first of its kind aside, which finds out once and for all what
    /// instances look like. For an answer with `elements` of a kind, for each of them.
    void measure(benchmark::State& state, const std::string& message, std::int64_t elements = 1) {
        std::size_t bytes = answer(message).size();
        const std::size_t before = allocations();
        for (auto _ : state)
            bytes = answer(message).size();
        report(state, bytes, allocations() - before, elements);
    }
    static void report(benchmark::State& state, std::size_t bytes, std::size_t allocated,
                       std::int64_t elements) {
        const auto all = static_cast<double>(elements * state.iterations());
        state.counters["each"] =
            benchmark::Counter(all, benchmark::Counter::kIsRate | benchmark::Counter::kInvert);
        state.counters["bytes/each"] = static_cast<double>(bytes) / static_cast<double>(elements);
        state.counters["allocations/each"] = static_cast<double>(allocated) / all;
        state.SetComplexityN(state.range(0));
    }

  private:
    static constexpr const char* kNamespace = "root/cimv2";
    static inline const host::Caller kCaller{"root", true, "localhost", "127.0.0.1"};

    host::Dispatcher m_dispatcher{{std::make_shared<core::CimRequests>(kNamespace)}};
};

}  // namespace bench
