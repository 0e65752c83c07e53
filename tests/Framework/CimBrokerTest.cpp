#include "Framework/CimBroker.h"

#include <gtest/gtest.h>

#include <future>
#include <thread>

#include "Framework/RequestScope.h"
#include "Support/TestModel.h"

namespace {

using core::GetCimBroker;

std::size_t countGadgets(const std::string& provider) {
    auto instances = GetCimBroker()->getInstances("test_GADGET", provider);
    std::size_t count = 0;
    for (auto* each = instances.first(); each != nullptr; each = instances.next())
        ++count;
    EXPECT_EQ(count, instances.size());
    return count;
}

TEST(CimBroker, JoinsTheAgentsThatServeAClass) {
    test::GadgetAgent one("One");
    test::GadgetAgent two("Two");
    one.add("a");
    two.add("b");
    two.add("c");
    EXPECT_EQ(countGadgets(""), 3U);
    EXPECT_EQ(countGadgets("Two"), 2U);
    EXPECT_EQ(countGadgets("Three"), 0U);
    EXPECT_EQ(GetCimBroker()->getInstances("Test_Thing", "").size(), 0U);
    EXPECT_EQ(one.getInstances("Unknown").first(), nullptr);

    core::CimPath path(std::string("root/cimv2:TEST_GADGET.number=0,id=\"c\""));
    const core::CimInstance* found = GetCimBroker()->getInstanceByPath(path);
    ASSERT_NE(found, nullptr);
    EXPECT_TRUE(path.names(*found));
    for (const char* text : {"Test_Gadget.ID=\"d\",Number=0", "Test_Gadget.ID=\"c\"", "!"}) {
        core::CimPath absent{std::string(text)};
        EXPECT_EQ(GetCimBroker()->getInstanceByPath(absent), nullptr) << text;
    }
}

TEST(CimBroker, AnAgentWaitsForTheRequestsThatUseIt) {
    auto agent = std::make_unique<test::GadgetAgent>();
    const test::Gadget* gadget = agent->add("held");
    std::promise<void> enumerated;
    std::promise<void> proceed;
    auto request = std::async(std::launch::async, [&] {
        const core::RequestScope scope;
        EXPECT_EQ(countGadgets(""), 1U);
        enumerated.set_value();
        proceed.get_future().wait();
        return gadget->ID.get();
    });
    enumerated.get_future().wait();
    auto leaving = std::async(std::launch::async, [&] { agent.reset(); });
    while (countGadgets("") != 0)
        std::this_thread::yield();
    EXPECT_EQ(test::Gadget::living, 1);
    proceed.set_value();
    EXPECT_EQ(request.get(), "held");
    leaving.wait();
    EXPECT_EQ(test::Gadget::living, 0);
}

}  // namespace
