// SPDX-License-Identifier: Apache-2.0
// What object managers leave out and clients send.
#include <gtest/gtest.h>

#include <atomic>
#include <span>

#include "Cmpi/LoadedFront.h"
#include "Support/TestModel.h"
#include "Support/Together.h"

namespace {

using cmpi::ReturnCode;
using core::CimPath;
using core::CimType;
using core::CimValue;
using test::LoadedFront;
using test::Op;
using test::Request;
using test::Sent;

class CmpiHostileTest : public ::testing::TestWithParam<test::Dialect> {
  protected:
    CmpiHostileTest() {
        const test::Gadget* const a = m_gadgets.add("a", 1);
        m_gadgets.links().instances.add(new test::Link(*a, *a));
    }

    ReturnCode send(
        const Request& request, const std::function<void(Sent&)>& change = [](Sent&) {}) const {
        test::Call call(m_front.broker);
        Sent sent(call, request);
        change(sent);
        return m_front.send(sent).rc;
    }
    /// How many fail, of each kind one. What does not is right.
    int failures() const {
        int count = 0;
        for (const Request& request :
             {m_get, m_work, Request{Op::Instances, m_a, {}, {{"Caption"}}}, Request{Op::References, m_a}}) {
            test::Call call(m_front.broker);
            Sent sent(call, request);
            const bool isDone = m_front.send(sent).rc == ReturnCode::Ok;
            EXPECT_TRUE(!isDone || call.answers.called.returnValue == (request.op == Op::Invoke ? 3U : 0U));
            count += isDone ? 0 : 1;
        }
        return count;
    }
    int failuresWithout(std::span<void*> slots) {
        int count = 0;
        for (void*& slot : slots.subspan(1)) {  // behind the level
            void* const saved = std::exchange(slot, nullptr);
            count += failures();
            slot = saved;
        }
        return count;
    }

    test::GadgetAgent m_gadgets;
    LoadedFront m_front{QUENX_CMPI_LIBRARY, GetParam()};
    const CimPath m_a{"Test_Gadget.ID=\"a\",Number=1"};
    const Request m_get{Op::Get, m_a};
    const Request m_work{.op = Op::Invoke,
                         .path = m_a,
                         .method = "Work",
                         .arguments = {{"Text", CimValue::of(CimType::String, std::string("x"))},
                                       {"Numbers", CimValue::arrayOf(CimType::Uint16, {std::uint64_t{3}})}}};
};

INSTANTIATE_TEST_SUITE_P(Manager, CmpiHostileTest, ::testing::ValuesIn(test::kDialects));

TEST_P(CmpiHostileTest, GetsAlongWithoutAnySlotAndTable) {
    test::TestBroker& broker = m_front.broker;
    const auto slotsOf = [](auto& table) {
        return std::span(reinterpret_cast<void**>(&table), sizeof table / sizeof(void*));
    };
    int failed = 0;
    std::apply([&](auto&... tables) { ((failed += failuresWithout(slotsOf(tables))), ...); },
               std::tie(broker.broker, broker.factories, broker.memory, broker.contexts, broker.results,
                        broker.strings, broker.arrays, broker.instances, broker.paths, broker.args,
                        broker.errors, broker.dateTimes));
    EXPECT_GT(failed, 20);
    EXPECT_EQ(failures(), 0);
    // A slot beyond the level that its table states is not called.
    broker.factories.ftVersion = 100;
    test::Call call(broker);
    const Request mistaken{Op::Get, CimPath("Test_Gadget", {})};
    Sent refused(call, mistaken);
    EXPECT_EQ(m_front.send(refused).rc, ReturnCode::InvalidParameter);
    EXPECT_EQ(call.answers.error, "");
}

TEST_P(CmpiHostileTest, TestsBitsOfStatesAndRefusesTypesThatItDoesNotTake) {
    for (unsigned int bits = 0; bits < 16; ++bits) {
        const auto state = static_cast<cmpi::State>((bits & 7U) << 8U | (bits >> 3U) << 15U);
        const bool isGood = (state & ~cmpi::kKeyValue) == 0;
        const ReturnCode expected = isGood ? ReturnCode::Ok : ReturnCode::InvalidParameter;
        EXPECT_EQ(send(m_get, [=](Sent& sent) { sent.path.entries[1].state = state; }), expected) << state;
        EXPECT_EQ(send(m_work, [=](Sent& sent) { sent.in.entries[0].state = state; }), expected) << state;
        EXPECT_EQ(send(m_work, [=](Sent& sent) { sent.in.entries[1].state |= state; }), ReturnCode::Ok);
    }
    const auto getWithKey = [&](CimType type, const core::CimScalar& number) {
        const test::Entry key("Number", CimValue::of(type, number));
        return send(m_get, [&](Sent& sent) { sent.path.entries[1] = key; });
    };
    for (const CimType type : {CimType::Uint8, CimType::Uint16, CimType::Uint64, CimType::Sint8,
                               CimType::Sint16, CimType::Sint64}) {
        EXPECT_EQ(getWithKey(type, std::uint64_t{1}), ReturnCode::Ok);
        EXPECT_NE(getWithKey(type, ~std::uint64_t{0}), ReturnCode::Ok);
    }
    for (const int code : {0x0001, 0x1000, 0x1200, 0x1500, 0x1900, 0x1a00, 0x2001, 0x3000, 0xffff}) {
        const auto type = static_cast<cmpi::Type>(code);
        const auto lie = [=](test::Entry& entry) { entry.type = type; };
        EXPECT_EQ(send(m_get, [=](Sent& sent) { lie(sent.path.entries[1]); }), ReturnCode::InvalidParameter);
        EXPECT_EQ(send(m_work, [=](Sent& sent) { lie(sent.in.entries[0]); }), ReturnCode::InvalidParameter);
    }
}

TEST_P(CmpiHostileTest, RefusesWhatIsNestedOrLongAndGoesOn) {
    CimPath deep = m_a;
    for (int i = 0; i < 100; ++i)
        deep = CimPath("Test_Link", {{"From", deep}, {"To", m_a}});
    const std::string longText(1 << 20, 'x');
    for (const CimPath& path : {deep, CimPath(longText, {}), CimPath("Test_Gadget", {{longText, longText}}),
                                CimPath("Test_Gadget", {{"ID", longText}, {"Number", longText}})}) {
        try {
            m_front.ask({Op::Get, path});
            ADD_FAILURE();
        } catch (const core::CimError& error) {
            EXPECT_LE(std::string(error.what()).size(), 2000U);
            EXPECT_NE(error.status(), core::CimStatus::Failed) << error.what();
        }
    }
    EXPECT_EQ(failures(), 0);
}

TEST_P(CmpiHostileTest, AnswersTenThousandCallsOfSixteenThreads) {
    const Request unknown{.op = Op::Invoke, .path = m_a, .method = "Unknown"};
    std::atomic<int> good{0};
    const auto work = [&] {
        for (int i = 0; i < 313; ++i) {
            good += m_front.ask(m_get).instances.at(0).text("ID") == "a" ? 1 : 0;
            good += send(unknown) == ReturnCode::MethodNotFound ? 1 : 0;
            // Also in between: a yes is as good as a no then.
            if (i % 50 == 0) m_front.cleanup();
        }
    };
    test::together(std::vector<std::function<void()>>(16, work));
    EXPECT_EQ(good, 16 * 313 * 2);
}

}  // namespace
