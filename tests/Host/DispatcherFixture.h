// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <gtest/gtest.h>

#include "CimXml/Response.h"
#include "CimXml/WireCheck.h"
#include "Framework/Requests/CimRequests.h"
#include "Host/Operations/Dispatcher.h"
#include "Support/TestModel.h"

namespace test {

using cimxml::ClassName;
using cimxml::IntrinsicResult;
using cimxml::ParameterValue;
using core::CimPath;
using core::CimStatus;

using Given = std::vector<cimxml::Parameter>;

/// A path as a message holds it: keys are texts.
inline CimPath gadget(const std::string& id, const std::string& number) {
    return {"test_gadget", {{"number", number}, {"id", id}}};
}

inline CimPath link() {
    return {"Test_Link", {{"From", gadget("a", "1")}, {"To", gadget("b", "2")}}};
}

/// An argument as a client that states this type, or none, sends it.
inline core::Argument argument(const std::string& name, core::CimScalar value,
                               std::optional<core::CimType> stated = {}) {
    return {name, core::CimValue::of(stated.value_or(core::CimType::String), std::move(value)), !stated};
}
inline core::Argument arrayOf(const std::string& name, std::vector<core::CimScalar> values,
                              std::optional<core::CimType> stated = {}) {
    return {name, core::CimValue::arrayOf(stated.value_or(core::CimType::String), std::move(values)),
            !stated};
}

class DispatcherTest : public ::testing::Test {
  protected:
    DispatcherTest()
        : m_dispatcher({std::make_shared<core::CimRequests>("root/cimv2")},
                       {3, 2, std::chrono::seconds(60), std::chrono::seconds(100)}, 1U << 20) {
        m_agent.links().instances.add(new test::Link(m_a, m_b));
    }

    cimxml::Response answer(std::variant<cimxml::IntrinsicCall, cimxml::MethodCall> call) {
        // Over the wire, so that the texts of a message are typed as they are in the daemon.
        const cimxml::Request request = cimxml::readRequest(cimxml::writeRequest({"1", std::move(call)}));
        host::AnswerCharge charge = m_dispatcher.charge(m_caller.user);
        const cimxml::Response response = m_dispatcher.dispatch(request, m_caller, charge);
        const std::string text = cimxml::writeResponse(cimxml::Response(response),
                                                       [&](std::size_t bytes) { charge.cover(bytes); });
        EXPECT_EQ(test::faultsOf(text), "");
        return response;
    }

    cimxml::Response send(const std::string& operation, Given parameters) {
        return answer(cimxml::IntrinsicCall{operation, m_namespace, std::move(parameters)});
    }

    IntrinsicResult call(const std::string& operation, Given parameters) {
        const cimxml::Response response = send(operation, std::move(parameters));
        EXPECT_EQ(statusIn(response), 0) << operation;
        return std::get<IntrinsicResult>(response.content);
    }

    static int statusIn(const cimxml::Response& response) {
        const auto* failure = std::get_if<cimxml::ErrorResult>(&response.content);
        if (failure == nullptr) return 0;
        EXPECT_NE(failure->description, "");
        return static_cast<int>(failure->status);
    }

    static std::string description(const cimxml::Response& response) {
        return std::get<cimxml::ErrorResult>(response.content).description;
    }

    int status(const std::string& operation, Given parameters) {
        return statusIn(send(operation, std::move(parameters)));
    }

    cimxml::Response invoke(CimPath object, const std::string& method,
                            std::vector<core::Argument> arguments) {
        object.setNamespace(m_namespace);
        return answer(cimxml::MethodCall{method, object, std::move(arguments)});
    }

    template <class Result>
    static std::string output(const Result& result, const std::string& name) {
        for (const core::Argument& each : result.outputs) {
            if (each.name == name) return core::scalarText(*each.value.scalar());
        }
        return "none";
    }

    std::string m_namespace = "root/cimv2";
    host::Caller m_caller{"admin", true, "localhost", "192.0.2.1"};
    test::GadgetAgent m_agent;
    test::Gadget& m_a = *m_agent.add("a", 1);
    test::Gadget& m_b = *m_agent.add("b", 2);
    test::Gadget& m_c = *m_agent.add("c", 3);
    host::Dispatcher m_dispatcher;
};

}  // namespace test
