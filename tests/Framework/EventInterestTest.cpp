// SPDX-License-Identifier: Apache-2.0
#include "Framework/Events/EventInterest.h"

#include <gmock/gmock.h>

#include <optional>

#include "Framework/Events/EventSink.h"
#include "Framework/Model/CimError.h"
#include "Support/SyslogCapture.h"
#include "Support/TestModel.h"

namespace {

using test::Gadget;

/// Notes what it is told.
class TalkativeClass : public test::ListedClass<Gadget> {
  public:
    void enableIndications() override {
        if (refuses) throw std::runtime_error("no indications today");
        told += '+';
    }
    void disableIndications() override {
        told += '-';
        if (refusesTheEnd) throw std::runtime_error("not yet");
    }

    std::string told;
    bool refuses = false;
    bool refusesTheEnd = false;
};

class TalkativeAgent : public core::CimAgent {
  public:
    TalkativeAgent() : CimAgent("Talkative") {
        core::GetCimBroker()->addAgent(this);
        m_classes.add(gadgets);
    }
    ~TalkativeAgent() override { leaveBroker(); }
    TalkativeClass* const gadgets = new TalkativeClass;
};

class SilentSink : public core::EventSink {
  public:
    void take(const core::InstanceEvent&) noexcept override {}
};

TEST(EventInterestTest, TellsAgentsOfTheFirstListenerAndOfTheLast) {
    const TalkativeAgent agent;
    const core::InstalledEventSink installed(std::make_shared<SilentSink>());
    const auto isWanted = [] { return core::EventSink::wanting("test_GADGET") != nullptr; };
    EXPECT_FALSE(isWanted());
    {
        std::optional<core::EventInterest> byName("test_gadget");
        const core::EventInterest bySuperclass("Test_Thing");
        EXPECT_EQ(agent.gadgets->told, "+");
        byName.reset();
        EXPECT_TRUE(isWanted());
        EXPECT_EQ(core::EventSink::wanting("Test_Link"), nullptr);
        EXPECT_EQ(agent.gadgets->told, "+");
    }
    EXPECT_EQ(agent.gadgets->told, "+-");
    EXPECT_FALSE(isWanted());
}

TEST(EventInterestTest, LeavesNothingWhereItCannotBe) {
    const TalkativeAgent agent;
    const core::InstalledEventSink installed(std::make_shared<SilentSink>());
    EXPECT_THAT([] { const core::EventInterest interest("Test_Nothing"); },
                ::testing::ThrowsMessage<core::CimError>(::testing::StrEq(
                    "no class \"Test_Nothing\" is served, whose instances anybody could be told of")));
    agent.gadgets->refuses = true;
    EXPECT_THROW(core::EventInterest("Test_Thing"), std::runtime_error);
    EXPECT_EQ(core::EventSink::wanting("Test_Gadget"), nullptr);
    agent.gadgets->refuses = false;
    std::optional<core::EventInterest> interest("Test_Thing");
    EXPECT_EQ(agent.gadgets->told, "-+");
    const test::LogLevelGuard logged(1);
    const test::SyslogCapture log;
    agent.gadgets->refusesTheEnd = true;
    interest.reset();
    EXPECT_EQ(test::SyslogCapture::messages("error"),
              std::vector<std::string>{"Indications of Test_Gadget could not be disabled: not yet"});
}

}  // namespace
