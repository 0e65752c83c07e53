// SPDX-License-Identifier: Apache-2.0
#include "Framework/Classes/CimBroker.h"

#include <gtest/gtest.h>

#include <future>
#include <thread>

#include "Framework/Classes/RequestScope.h"
#include "Support/TestModel.h"

namespace {

std::size_t countGadgets() {
    return core::GetCimBroker()->getInstances("test_GADGET", "").size();
}

TEST(CimBrokerTest, LetsAnAgentGoOnlyAfterTheRequestsThatUseIt) {
    auto agent = std::make_unique<test::GadgetAgent>();
    const test::Gadget* gadget = agent->add("held");
    std::promise<void> enumerated;
    std::promise<void> proceed;
    auto request = std::async(std::launch::async, [&] {
        const core::RequestScope scope;
        EXPECT_EQ(countGadgets(), 1U);
        enumerated.set_value();
        proceed.get_future().wait();
        return gadget->ID.get();
    });
    enumerated.get_future().wait();
    auto leaving = std::async(std::launch::async, [&] { agent.reset(); });
    while (countGadgets() != 0)
        std::this_thread::yield();
    EXPECT_EQ(test::Gadget::living, 1);
    proceed.set_value();
    EXPECT_EQ(request.get(), "held");
    leaving.wait();
    EXPECT_EQ(test::Gadget::living, 0);
}

}  // namespace
