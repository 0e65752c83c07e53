// SPDX-License-Identifier: Apache-2.0
// What happens to jobs, as an object manager is told of it.
#include <gtest/gtest.h>

#include <atomic>
#include <future>
#include <set>
#include <span>
#include <thread>

#include "Cmpi/Listener.h"
#include "Framework/Events/EventSink.h"
#include "Support/SimulatedAdapters.h"
#include "Support/SyslogCapture.h"
#include "Support/TestRoms.h"

namespace {

using cmpi::ReturnCode;
using core::CimPath;
using core::CimType;
using core::CimValue;
using test::Delivered;

/// The first stops on its way for longer than a look each second takes; the second one breaks.
const std::string kAdapters = [] {
    std::string text = test::kTestAdapters;
    const auto add = [&text](const std::string& next, const std::string& faults) {
        text.insert(text.find(" },\n{ name = \"" + next), ", fault = [ " + faults + " ]");
    };
    const std::string stop = R"({ at = "write", action = "stall", milliseconds = 1500, percent = )";
    add("eth1", stop + "40 }, " + stop + "80 }");
    add("eth2", R"({ at = "write", action = "fail" })");
    return text;
}();

core::InstanceValue source(const Delivered& each) {
    return each.embedded.at("SourceInstance");
}

/// Equal exactly when the instances are.
std::string described(const core::InstanceValue& instance) {
    std::string text = instance.path.toString();
    for (const core::PropertyValue& property : instance.properties)
        text += "\n" + property.name + " " + std::string(core::typeName(property.value.type)) + " " +
                (property.value.isNull() ? "null" : core::valueText(property.value));
    return text;
}

/// No job of a provider's; with what is easily lost on the way.
core::InstanceSnapshot madeJob() {
    auto job = std::make_shared<core::InstanceValue>();
    job->path = CimPath("root/cimv2:Quenx_ConcreteJob.InstanceID=\"a ]]> \\\"b\\\"\"");
    const auto add = [&](const char* name, CimValue value) {
        job->properties.push_back({name, std::move(value), false, {}});
    };
    add("InstanceID", CimValue::of(CimType::String, std::string("a ]]> \"b\"")));
    add("ErrorDescription", CimValue::of(CimType::String, std::string("<&'\u00e4\n")));
    add("StartTime", CimValue::of(CimType::Datetime, utils::Time::fromEpoch(1'700'000'000'123'456)));
    add("OperationalStatus", CimValue::arrayOf(CimType::Uint16, {std::uint64_t{2}, std::uint64_t{65535}}));
    add("Owner", CimValue::null(CimType::String));
    add("Job", CimValue::of(CimType::Reference, job->path));
    return job;
}

/// The classes and states, but for repetitions: how often there is progress depends on the machine.
std::string statesOf(const std::vector<Delivered>& all) {
    std::string text;
    for (const Delivered& each : all) {
        std::string line = each.indication.path.getClassName().substr(8);
        for (const auto& [name, job] : each.embedded)
            line += " " + std::to_string(job.number("JobState"));
        line += "; ";
        if (!text.ends_with(line)) text += line;
    }
    return text;
}

class CmpiIndicationTest : public ::testing::TestWithParam<test::Dialect> {
  protected:
    /// As a provider does it; false where nobody listens.
    static bool tell(const core::InstanceSnapshot& before, const core::InstanceSnapshot& after) {
        core::EventSink* const sink = core::EventSink::wanting("Quenx_ConcreteJob");
        if (sink != nullptr) sink->take({before, after, 1'700'000'000'123'456});
        return sink != nullptr;
    }
    /// An event that says which one it is.
    bool tell(unsigned int number) const {
        const auto value = CimValue::of(CimType::Uint32, std::uint64_t{number});
        return tell(nullptr, std::make_shared<core::InstanceValue>(
                                 core::InstanceValue{m_job->path, {{"Number", value, false, {}}}}));
    }
    static std::vector<std::uint64_t> numbersOf(const std::vector<Delivered>& all) {
        std::vector<std::uint64_t> numbers;
        for (const Delivered& each : all)
            numbers.push_back(source(each).number("Number"));
        return numbers;
    }
    /// When no indication is on its way any more.
    std::string cleanupWhenFree() {
        std::string codes = m_listener.cleanup();
        for (int i = 0; i < 6000 && codes.find("50") != std::string::npos; ++i) {
            std::this_thread::sleep_for(std::chrono::milliseconds(10));
            codes = m_listener.cleanup();
        }
        return codes;
    }

    CimPath install(const char* adapter) {
        const auto image = test::withRevision(test::realRom("efi-virtio"), 7);
        const std::string uri = "file://" + m_adapters.folder().write("image.rom", std::span(image));
        const auto ports = m_front.ask({"names", CimPath("Quenx_EthernetPort", {})}).paths;
        const auto port = std::ranges::find_if(
            ports, [&](const CimPath& each) { return each.toString().find(adapter) != std::string::npos; });
        const core::MethodResult result = m_front.install(uri, *port);
        EXPECT_EQ(result.returnValue, 4096U);
        return *result.outputs.at(0).value.get<CimPath>();
    }
    /// From the creation of a job to its deletion.
    std::vector<Delivered> tellOfUpdate(const char* adapter) {
        const std::size_t first = m_deliveries.all().size();
        const CimPath job = install(adapter);
        auto all = m_deliveries.waitFor(first + 1);
        while (source(all.back()).number("JobState") < 7)
            all = m_deliveries.waitFor(all.size() + 1);
        // Whoever hears of the end can read it at once.
        EXPECT_EQ(described(m_front.ask({"get", job}).instances.at(0)), described(source(all.back())));
        m_front.ask({"delete", job});
        all = m_deliveries.waitFor(all.size() + 1);
        all.erase(all.begin(), all.begin() + static_cast<std::ptrdiff_t>(first));
        return all;
    }

    static constexpr const char* kBusy = " 50 50 50 50";
    static constexpr const char* kFree = " 0 0 0 0";
    const test::SimulatedAdapters m_adapters{kAdapters};
    const core::InstanceSnapshot m_job = madeJob();
    test::LoadedFront m_front{QUENX_CMPI_LIBRARY, GetParam()};
    test::Deliveries& m_deliveries = m_front.broker.deliveries;
    test::Listener m_listener{m_front};
};

INSTANTIATE_TEST_SUITE_P(Manager, CmpiIndicationTest, ::testing::ValuesIn(test::kDialects));

TEST_P(CmpiIndicationTest, TellsTheWayOfAnUpdateInOrder) {
    EXPECT_EQ(m_listener.authorize(), ReturnCode::Ok);
    EXPECT_EQ(m_listener.mustPoll(), ReturnCode::NotSupported);
    ASSERT_EQ(m_listener.begin(), ReturnCode::Ok);
    const auto all = tellOfUpdate("eth0");
    EXPECT_EQ(statesOf(all),
              "Creation 2; Modification 2 3; Modification 3 4; "
              "Modification 4 4; Modification 4 7; Deletion 7; ");
    std::set<std::string> identifiers;
    std::string before;
    for (const Delivered& each : all) {
        const core::InstanceValue job = source(each);
        const auto previous = each.embedded.find("PreviousInstance");
        EXPECT_TRUE(previous == each.embedded.end() || described(previous->second) == before) << before;
        before = described(job);
        EXPECT_EQ(each.nameSpace, "root/cimv2");
        const CimPath path(each.indication.text("SourceInstanceModelPath"));
        EXPECT_TRUE(path.isSameObjectAs(job.path)) << path.toString();
        EXPECT_NE(path.getHost(), "");
        EXPECT_EQ(path.getHost(), each.indication.text("SourceInstanceHost"));
        EXPECT_FALSE(each.indication.get<utils::Time>("IndicationTime")->isPeriod());
        const std::string identifier = each.indication.text("IndicationIdentifier");
        EXPECT_TRUE(identifier.starts_with("Quenx:1")) << identifier;
        EXPECT_TRUE(identifier.ends_with("-" + std::to_string(identifiers.size() + 1))) << identifier;
        identifiers.insert(identifier);
    }
    EXPECT_EQ(identifiers.size(), all.size());
    EXPECT_EQ(source(all.back()).number("PercentComplete"), 100U);

    EXPECT_EQ(statesOf(tellOfUpdate("eth1")),
              "Creation 2; Modification 2 3; Modification 3 4; "
              "Modification 4 10; Deletion 10; ");
    m_listener.end();
    EXPECT_EQ(cleanupWhenFree(), kFree);
    EXPECT_EQ(m_deliveries.contexts(), 0);
}

TEST_P(CmpiIndicationTest, TellsNobodyButThoseWhoListen) {
    m_front.first("Quenx_EthernetPort");
    EXPECT_FALSE(tell(0));
    EXPECT_EQ(m_listener.deactivate(), ReturnCode::Ok) << "what nobody has activated";
    EXPECT_EQ(m_listener.disable(), ReturnCode::Ok);
    m_listener.enable();
    EXPECT_FALSE(tell(0)) << "no filter";
    EXPECT_EQ(m_listener.cleanup(), kFree);
    m_listener.activate("CIM_InstCreation");
    m_listener.disable();
    EXPECT_FALSE(tell(0)) << "not enabled, again";
    EXPECT_EQ(m_deliveries.contexts(), 0);

    // As for the classes of two registrations, one of them in another namespace, too.
    m_listener.enable();
    m_listener.create();
    m_listener.activate("CIM_InstDeletion");
    m_listener.enable();
    m_listener.activate("CIM_InstDeletion", "root/interop");
    EXPECT_TRUE(tell(1));
    const auto both = m_deliveries.waitFor(2);
    EXPECT_EQ(both[0].nameSpace + " " + both[1].nameSpace, "root/cimv2 root/interop");
    EXPECT_EQ(source(both[0]).path.getNamespace() + " " + source(both[1]).path.getNamespace(),
              "root/cimv2 root/interop");
    EXPECT_EQ(both[0].indication.text("IndicationIdentifier"),
              both[1].indication.text("IndicationIdentifier"));
    m_listener.deactivate("CIM_INSTDELETION", "ROOT/interop", true);
    m_listener.deactivate("CIM_InstDeletion");
    m_listener.disable();
    EXPECT_TRUE(tell(2));
    EXPECT_EQ(numbersOf(m_deliveries.waitFor(3)), (std::vector<std::uint64_t>{1, 1, 2}));
    EXPECT_EQ(m_listener.cleanup(), kBusy);
    m_listener.deactivate("CIM_InstCreation");
    EXPECT_FALSE(tell(3));
    m_listener.disable();
    EXPECT_EQ(cleanupWhenFree(), kFree);
    EXPECT_EQ(m_deliveries.contexts(), 0);
    // The manager may come back, without a new library.
    m_listener.begin();
    EXPECT_TRUE(tell(4));
    EXPECT_EQ(numbersOf(m_deliveries.waitFor(4)).back(), 4U);
}

TEST_P(CmpiIndicationTest, DropsTheOldestWhereTheManagerDoesNotComeBack) {
    const test::LogLevelGuard logged(1);
    const test::SyslogCapture log;
    std::promise<void> isIn;
    std::promise<void> goOn;
    std::atomic<int> count{0};
    m_deliveries.whileDelivering = [&, gate = goOn.get_future().share()] {
        if (count++ == 0) isIn.set_value();
        gate.wait();
        return ReturnCode::Ok;
    };
    ASSERT_EQ(m_listener.begin(), ReturnCode::Ok);
    tell(0);
    isIn.get_future().wait();
    for (unsigned int i = 1; i < 3000; ++i)
        tell(i);
    const std::string dropping =
        R"("The object manager does not take indications; the oldest are dropped from here on")";
    EXPECT_EQ(test::SyslogCapture::count(dropping), 1U);
    goOn.set_value();
    std::vector<std::uint64_t> expected{0};
    for (std::uint64_t i = 3000 - 1024; i < 3000; ++i)
        expected.push_back(i);
    EXPECT_EQ(numbersOf(m_deliveries.waitFor(1025)), expected);
    EXPECT_TRUE(test::SyslogCapture::contains(R"("1975 events were dropped")"));
}

TEST_P(CmpiIndicationTest, EndsWhileAnIndicationIsOnItsWay) {
    std::promise<void> isIn;
    std::promise<void> isEnded;
    // As a manager that has a lock in its call which the indication needs, too.
    m_deliveries.whileDelivering = [&] {
        isIn.set_value();
        const bool ended =
            isEnded.get_future().wait_for(std::chrono::seconds(30)) == std::future_status::ready;
        return ended ? ReturnCode::Ok : ReturnCode::Failed;
    };
    ASSERT_EQ(m_listener.begin(), ReturnCode::Ok);
    tell(1);
    tell(2);
    isIn.get_future().wait();
    m_listener.end();
    EXPECT_FALSE(tell(3));
    EXPECT_EQ(m_listener.cleanup(), kBusy);
    isEnded.set_value();
    EXPECT_EQ(cleanupWhenFree(), kFree);
    EXPECT_EQ(numbersOf(m_deliveries.all()), std::vector<std::uint64_t>{1});
    EXPECT_EQ(m_deliveries.contexts(), 0);
}

TEST_P(CmpiIndicationTest, GoesOnWhereTheManagerTakesOneOfThemOnly) {
    const test::LogLevelGuard logged(1);
    const test::SyslogCapture log;
    std::atomic<int> count{0};
    m_deliveries.whileDelivering = [&] { return ++count < 4 ? ReturnCode::NotFound : ReturnCode::Ok; };
    ASSERT_EQ(m_listener.begin(), ReturnCode::Ok);
    for (const unsigned int number : {1U, 2U, 3U, 4U})
        tell(number);
    EXPECT_EQ(numbersOf(m_deliveries.waitFor(1)), std::vector<std::uint64_t>{4});
    EXPECT_EQ(test::SyslogCapture::count("Indications do not reach those who listen: the object manager did "
                                         "not take an indication (code 6)\""),
              1U);
}

TEST_P(CmpiIndicationTest, GetsAlongWithoutAnySlot) {
    const test::LogLevelGuard logged(1);
    const test::SyslogCapture log;
    test::TestBroker& broker = m_front.broker;
    int refused = 0;
    int silent = 0;
    const auto tryWithout = [&](auto& table) {
        const auto slots = std::span(reinterpret_cast<void**>(&table), sizeof table / sizeof(void*));
        for (void*& slot : slots.subspan(1)) {
            if (slot == nullptr) continue;
            void* const saved = std::exchange(slot, nullptr);
            const std::size_t before = m_deliveries.all().size();
            if (m_listener.begin() == ReturnCode::Ok) {
                const std::size_t attempts = m_deliveries.attempts();
                tell(m_job, m_job);
                tell(m_job, m_job);
                // When the second is begun the first has ended.
                while (m_deliveries.attempts() < attempts + 2)
                    std::this_thread::yield();
                m_listener.cleanup(true);
                silent += m_deliveries.all().size() == before ? 1 : 0;
            } else {
                ++refused;
                m_listener.end();
            }
            slot = saved;
        }
    };
    std::apply([&](auto&... tables) { (tryWithout(tables), ...); },
               std::tie(broker.table, broker.factories, broker.memory, broker.instances));
    EXPECT_EQ(refused, 4);
    EXPECT_EQ(silent, 5);  // instances, paths, datetimes, arrays, properties
    const std::vector<std::string> errors = test::SyslogCapture::messages("error");
    std::set<std::string> expected;
    for (const char* reason : {"could not make a datetime", "could not make an array",
                               "could not make an instance of CIM_InstModification",
                               "could not make an object path", "did not take SourceInstance (code 7)"})
        expected.insert("Indications do not reach those who listen: the object manager " +
                        std::string(reason));
    EXPECT_EQ((std::set<std::string>(errors.begin(), errors.end())), expected);
    m_listener.begin();
    const std::size_t before = m_deliveries.all().size();
    tell(m_job, m_job);
    EXPECT_EQ(described(source(m_deliveries.waitFor(before + 1).back())), described(*m_job));
}

}  // namespace
