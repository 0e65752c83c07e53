// SPDX-License-Identifier: Apache-2.0
// What object managers leave out and clients send.
#include <gtest/gtest.h>

#include <atomic>
#include <numeric>
#include <regex>
#include <set>
#include <span>

#include "Cmpi/LoadedFront.h"
#include "Support/TestModel.h"
#include "Support/Together.h"

namespace {

using cmpi::ReturnCode;
using core::CimPath;
using core::CimType;
using core::CimValue;
using test::Call;
using test::LoadedFront;
using test::Request;

class CmpiHostileTest : public ::testing::TestWithParam<test::Dialect> {
  protected:
    CmpiHostileTest() {
        const test::Gadget* const a = m_gadgets.add("a", 1);
        m_gadgets.links().instances.add(new test::Link(*a, *a));
    }

    ReturnCode send(
        const Request& request, const std::function<void(Call&)>& change = [](Call&) {}) const {
        Call call(m_front.broker, request);
        change(call);
        const auto [code, text] = m_front.send(call);
        if (text != nullptr)
            m_refusals.insert(std::to_string(static_cast<int>(code)) + " " +
                              reinterpret_cast<const test::Node*>(text)->text + "\n");
        // What does not fail is right.
        if (code == ReturnCode::Ok && request.op == "invoke") {
            const bool isGiven = (call.in.entries[1].state & ~cmpi::kKeyValue) == 0;
            EXPECT_EQ(call.answers.called.returnValue, isGiven ? 3U : 0U);
        }
        return code;
    }
    /// How many fail, of each kind one.
    int failures() const {
        int count = 0;
        for (const Request& request :
             {m_get, m_work, Request{"instances", m_a, {}, {{"Caption"}}}, Request{"references", m_a}})
            count += send(request) == ReturnCode::Ok ? 0 : 1;
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

    std::string refusals() const {
        return std::accumulate(m_refusals.begin(), m_refusals.end(), std::string());
    }

    mutable std::set<std::string> m_refusals;  // of send()
    test::GadgetAgent m_gadgets;
    LoadedFront m_front{QUENX_CMPI_LIBRARY, GetParam()};
    const CimPath m_a{"Test_Gadget.ID=\"a\",Number=1"};
    const Request m_get{"get", m_a};
    const Request m_work{"invoke",
                         m_a,
                         {},
                         {},
                         "Work",
                         {{"Text", CimValue::of(CimType::String, std::string("x"))},
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
    EXPECT_EQ(refusals(), R"(1 parameter Numbers: the object manager does not tell a value that it gave
1 the object manager could not make an instance of Test_Gadget
1 the object manager could not make an instance of Test_Link
1 the object manager could not make an object path
1 the object manager did not take a key (code 7)
1 the object manager did not take a result (code 7)
1 the object manager did not take the end of the results
1 the object manager did not take the output Echo
16 Work is called on an instance
4 '' is not an object path; write one as namespace:Class.Key="value"
4 SMASHv2:EUnspecifiedError:Text is missing
4 Test_Gadget has 2 keys, not 0
4 parameter Numbers: element 0 of an array is null, or of another type
6 no class "" is served
)");
    // A slot beyond the level that its table states is not called.
    broker.factories.ftVersion = 100;
    Call call(broker, {"get", CimPath("Test_Gadget", {})});
    EXPECT_EQ(m_front.send(call).rc, ReturnCode::InvalidParameter);
    EXPECT_EQ(call.answers.error, "");
}

TEST_P(CmpiHostileTest, TestsBitsOfStatesAndRefusesTypesThatItDoesNotTake) {
    for (unsigned int bits = 0; bits < 16; ++bits) {
        const auto state = static_cast<cmpi::State>((bits & 7U) << 8U | (bits >> 3U) << 15U);
        const bool isGood = (state & ~cmpi::kKeyValue) == 0;
        const ReturnCode expected = isGood ? ReturnCode::Ok : ReturnCode::InvalidParameter;
        EXPECT_EQ(send(m_get, [=](Call& call) { call.path.entries[1].state = state; }), expected) << state;
        EXPECT_EQ(send(m_work, [=](Call& call) { call.in.entries[0].state = state; }), expected) << state;
        EXPECT_EQ(send(m_work, [=](Call& call) { call.in.entries[1].state |= state; }), ReturnCode::Ok);
    }
    const auto getWithKey = [&](CimType type, const core::CimScalar& number) {
        const test::Entry key("Number", CimValue::of(type, number));
        return send(m_get, [&](Call& call) { call.path.entries[1] = key; });
    };
    for (const CimType type : {CimType::Uint8, CimType::Uint16, CimType::Uint64, CimType::Sint8,
                               CimType::Sint16, CimType::Sint64}) {
        EXPECT_EQ(getWithKey(type, std::uint64_t{1}), ReturnCode::Ok);
        EXPECT_NE(getWithKey(type, ~std::uint64_t{0}), ReturnCode::Ok);
    }
    const std::pair<std::uint64_t, const char*> units[] = {
        {0x7a, "z"},        {0x7f, "\x7f"},     {0x80, "\u0080"},
        {0x7ff, "\u07ff"},  {0x800, "\u0800"},  {0xd7ff, "\xED\x9F\xBF"},
        {0xd800, "\ufffd"}, {0xdfff, "\ufffd"}, {0xe000, "\ue000"}};
    for (const auto& [unit, text] : units) {
        m_gadgets.add(text, 1);
        const test::Entry key("ID", CimValue::of(CimType::Char16, unit));
        EXPECT_EQ(send(m_get, [&](Call& call) { call.path.entries[0] = key; }), ReturnCode::Ok) << unit;
    }
    for (const int code : {0x0001, 0x1000, 0x1200, 0x1500, 0x1900, 0x1a00, 0x2001, 0x3000, 0xffff}) {
        const auto type = static_cast<cmpi::Type>(code);
        const auto lie = [=](test::Entry& entry) { entry.type = type; };
        EXPECT_EQ(send(m_get, [=](Call& call) { lie(call.path.entries[1]); }), ReturnCode::InvalidParameter);
        EXPECT_EQ(send(m_work, [=](Call& call) { lie(call.in.entries[0]); }), ReturnCode::InvalidParameter);
    }
    EXPECT_EQ(refusals(), R"(4 SMASHv2:EUnspecifiedError:Text is missing
4 Test_Gadget has 2 keys, not 1
4 an embedded instance is taken nowhere here
4 key Number does not hold a value of type uint32
4 no CIM type has the code 1
4 no CIM type has the code 12288
4 no CIM type has the code 4608
4 no CIM type has the code 5376
4 no CIM type has the code 6400
4 no CIM type has the code 65535
4 no CIM type has the code 6656
4 no CIM type has the code 8193
4 parameter Text: an embedded instance is taken nowhere here
4 parameter Text: no CIM type has the code 1
4 parameter Text: no CIM type has the code 4608
4 parameter Text: no CIM type has the code 5376
4 parameter Text: no CIM type has the code 57343
4 parameter Text: no CIM type has the code 6400
4 parameter Text: no CIM type has the code 6656
6 Test_Gadget.ID="a",Number=255 names no instance
6 Test_Gadget.ID="a",Number=65535 names no instance
)");
}

TEST_P(CmpiHostileTest, RefusesWhatIsNestedOrLongAndGoesOn) {
    CimPath deep = m_a;
    for (int i = 0; i < 100; ++i) {
        deep = CimPath("Test_Link", {{"From", deep}, {"To", m_a}});
        if (i == 7 || i == 8) send({"get", deep});
    }
    EXPECT_EQ(std::regex_replace(refusals(), std::regex("[0-9]+ bytes"), "so many bytes"),
              "4 references are nested too deep in a path\n6 a path of so many bytes names no instance\n");
    const std::string longText(1 << 20, 'x');
    for (const CimPath& path : {deep, CimPath(longText, {}), CimPath("Test_Gadget", {{longText, longText}}),
                                CimPath("Test_Gadget", {{"ID", longText}, {"Number", longText}})}) {
        try {
            m_front.ask({"get", path});
            ADD_FAILURE();
        } catch (const core::CimError& error) {
            EXPECT_LE(std::string(error.what()).size(), 2000U);
            EXPECT_NE(error.status(), core::CimStatus::Failed) << error.what();
        }
    }
    EXPECT_EQ(failures(), 0);
}

TEST_P(CmpiHostileTest, AnswersTenThousandCallsOfSixteenThreads) {
    const Request unknown{"invoke", m_a, {}, {}, "Unknown"};
    std::atomic<int> good{0};
    // Notes no refusal: that is for one thread.
    const auto codeOf = [&](const Request& request) {
        Call call(m_front.broker, request);
        return m_front.send(call).rc;
    };
    const auto work = [&] {
        for (int i = 0; i < 313; ++i) {
            good += m_front.ask(m_get).instances.at(0).text("ID") == "a" ? 1 : 0;
            good += codeOf(unknown) == ReturnCode::MethodNotFound ? 1 : 0;
            // Also in between: a yes is as good as a no then.
            if (i % 50 == 0) m_front.cleanup();
        }
    };
    test::together(std::vector<std::function<void()>>(16, work));
    EXPECT_EQ(good, 16 * 313 * 2);
}

}  // namespace
