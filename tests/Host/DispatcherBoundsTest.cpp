// SPDX-License-Identifier: Apache-2.0
// What clients of the dispatcher cannot lose, mix up or drown.
#include "Host/DispatcherFixture.h"
#include "Support/SyslogCapture.h"

namespace {

using namespace test;

TEST_F(DispatcherTest, GivesWhatItHasTakenOutOfAnEnumeration) {
    for (unsigned int i = 0; i < 40; ++i)
        m_agent.add(std::string(3000, '"'), i);
    const Given all{{"ClassName", ClassName{"Test_Gadget"}}};
    EXPECT_THROW(send("EnumerateInstances", all), host::OverBudget) << "a quote takes six bytes of text";
    const std::string context = output(call("OpenEnumerateInstances", all), "EnumerationContext");
    EXPECT_EQ(call("PullInstancesWithPath", {{"EnumerationContext", context}, {"MaxObjectCount", "100"}})
                  .instances.size(),
              43U);
}

TEST_F(DispatcherTest, RepeatsNoLongTextOfTheRequest) {
    const std::string quotes(200000, '"');
    for (const char* space : {"root/cimv2", "root/other"}) {
        CimPath path("test_gadget", {{"number", "1"}, {"id", quotes}});
        path.setNamespace(space);
        EXPECT_LT(description(send("GetInstance", {{"InstanceName", path}})).size(), 500U) << space;
    }
    std::string umlauts = "x";
    for (int i = 0; i < 3000; ++i)
        umlauts += "\u00e4";
    const auto unknown = send("EnumerateInstances", {{"ClassName", ClassName{umlauts}}});
    EXPECT_EQ(description(unknown).size(), 1999U) << "half a character would end the answer";
}

TEST_F(DispatcherTest, CarriesOutNothingForAnotherNamespace) {
    CimPath elsewhere = gadget("a", "1");
    elsewhere.setNamespace("root/other");
    // Where a message has a name alone, a client of another kind sends the whole path.
    const auto statusOf = [&](const char* operation, const char* parameter) {
        const cimxml::Request request{
            "1", cimxml::IntrinsicCall{operation, "ROOT/cimv2", {{parameter, elsewhere}}}};
        host::AnswerCharge charge = m_dispatcher.charge("admin");
        return statusIn(m_dispatcher.dispatch(request, m_caller, charge));
    };
    EXPECT_EQ(statusOf("GetInstance", "InstanceName"), 6);
    EXPECT_EQ(statusOf("DeleteInstance", "InstanceName"), 6);
    EXPECT_EQ(statusOf("Associators", "ObjectName"), 6);
    elsewhere.setNamespace("ROOT/CIMV2");
    EXPECT_EQ(statusOf("GetInstance", "InstanceName"), 0);
    elsewhere.setNamespace("root/other");
    const auto job = [&](const CimPath& path) {
        return statusIn(invoke(gadget("a", "1"), "Work",
                               {argument("Text", "x"), argument("Job", path, core::CimType::Reference)}));
    };
    EXPECT_EQ(job(elsewhere), 4);
    EXPECT_EQ(job(gadget("a", "1")), 0);
}

TEST_F(DispatcherTest, CountsTheRefusalsOfAFlood) {
    const test::LogLevelGuard level(1);
    test::SyslogCapture::clear();
    m_caller.isAdministrator = false;
    for (int i = 0; i < 25; ++i)
        invoke(gadget("a", "1"), "Work", {});
    m_caller = {"other", true, "localhost", "192.0.2.1"};
    invoke(gadget("a", "1"), "Work", {});
    EXPECT_EQ(test::SyslogCapture::count("[audit]"), 21U);
    host::AuditTrail trail;
    const auto now = host::AuditTrail::Clock::now();
    for (int i = 0; i < 25; ++i)
        trail.refused({"a", "192.0.2.1", "Work", "t", "denied: x"}, {}, now);
    trail.writeNumbers(now + std::chrono::seconds(59));
    EXPECT_EQ(test::SyslogCapture::count("[audit]"), 41U);
    trail.writeNumbers(now + std::chrono::seconds(60));
    EXPECT_EQ(test::SyslogCapture::lines().back().text,
              "[audit] user=\"a\" address=\"192.0.2.1\" operation=\"Work\" target=\"\" arguments=\"\" "
              "outcome=\"denied: 5 more within a minute\"");
}

}  // namespace
