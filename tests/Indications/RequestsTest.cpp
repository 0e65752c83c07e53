// SPDX-License-Identifier: Apache-2.0
#include "Indications/Subscriptions/Requests.h"

#include <gtest/gtest.h>

#include <functional>

#include "Framework/Model/CimError.h"
#include "Indications/QueryObjects.h"
#include "Indications/Subscriptions/Classes.h"
#include "Indications/Subscriptions/Instances.h"
#include "Indications/Subscriptions/StateFile.h"
#include "Support/SyslogCapture.h"
#include "Support/TempFolder.h"

namespace {

using core::CimType;
using core::CimValue;
using core::InstanceValue;
using indications::Destination;
using indications::Filter;
using indications::readDestination;
using indications::readFilter;
using indications::readSubscription;
using indications::Records;
using indications::Subscription;
using indications::typedInstance;

/// The status and the text of the refusal; "accepted" without one.
std::string refusalOf(const std::function<void()>& step) {
    try {
        step();
    } catch (const core::CimError& error) {
        return std::to_string(static_cast<int>(error.status())) + " " + error.what();
    }
    return "accepted";
}

CimValue text(const std::string& value) {
    return CimValue::of(CimType::String, value);
}
CimValue number(std::uint64_t value) {
    return CimValue::of(CimType::Uint64, value);
}
InstanceValue instance(const char* className, const std::vector<std::pair<const char*, CimValue>>& given) {
    InstanceValue made{core::CimPath(className, {}), {}};
    for (const auto& [name, value] : given)
        made.properties.push_back({name, value, false, ""});
    return made;
}
InstanceValue filterWith(const char* name, const CimValue& value) {
    return instance(indications::kFilter,
                    {{name, value}, {"Query", text("q")}, {"QueryLanguage", text("l")}});
}
Filter goodFilter() {
    Filter filter;
    filter.name = "f";
    filter.namespaces = {"root/cimv2"};
    filter.language = "WQL";
    filter.query = "SELECT * FROM CIM_InstCreation WHERE SourceInstance ISA CIM_ConcreteJob";
    return filter;
}
const indications::EventSources& sources() {
    static const indications::EventSources all{
        {"root/cimv2", "interop"}, "root/cimv2", test::vocabulary().sources};
    return all;
}
std::string refusalOf(Filter filter) {
    return refusalOf([&] { check(filter, sources()); });
}

TEST(SubscriptionRequestsTest, ReadWhatIsGivenAndFillInTheRest) {
    const Filter filter = readFilter(filterWith("Caption", text("c")), "root/cimv2");
    EXPECT_TRUE(filter.name.starts_with("Quenx:filter:")) << filter.name;
    EXPECT_EQ(filter.query + filter.language + filter.labels.caption, "qlc");
    EXPECT_EQ(filter.namespaces, std::vector<std::string>{"root/cimv2"});
    EXPECT_EQ(readFilter(filterWith("SourceNamespace", text("x")), "").namespaces.at(0), "x");
    EXPECT_EQ(readFilter(filterWith("Name", text("n")), "").name, "n");

    const Destination handler = readDestination(instance(
        "cim_indicationhandlercimxml", {{"Destination", text("u")}, {"PersistenceType", number(3)}}));
    EXPECT_EQ(handler.key.className, indications::kHandler);
    EXPECT_TRUE(handler.key.name.starts_with("Quenx:destination:"));
    EXPECT_EQ(handler.url + std::to_string(handler.persistence), "u3");
    const Destination plain = readDestination(instance(indications::kDestination, {{"Protocol", number(2)}}));
    EXPECT_EQ(plain.key.className, indications::kDestination);
    EXPECT_EQ(plain.persistence, indications::kPermanent);

    const Subscription subscription = readSubscription(instance(
        indications::kSubscription, {{"SubscriptionInfo", text("i")}, {"SubscriptionDuration", number(5)}}));
    EXPECT_EQ(subscription.info, "i");
    EXPECT_EQ(subscription.duration, 5U);
    EXPECT_EQ(subscription.state, indications::kEnabled);
    EXPECT_NE(subscription.start, 0U);
    EXPECT_EQ(subscription.start, subscription.changed);
}

TEST(SubscriptionRequestsTest, SayWhatCannotBeRead) {
    const auto filter = [](const char* name, const CimValue& value) {
        return refusalOf([&] { readFilter(filterWith(name, value), ""); });
    };
    EXPECT_EQ(filter("IndividualSubscriptionSupported", CimValue::of(CimType::Boolean, false)),
              "7 filters that stand in collections only are not supported");
    EXPECT_EQ(filter("CreationClassName", text("CIM_Other")),
              "4 CreationClassName is CIM_Other, and the instance one of CIM_IndicationFilter");
    EXPECT_EQ(filter("CreationClassName", text("cim_indicationFilter")), "accepted");
    EXPECT_EQ(refusalOf([] {
                  readFilter(instance("X", {{"Query", text("q")}}), "");
              }),
              "4 QueryLanguage is missing");
    EXPECT_EQ(refusalOf([] {
                  readFilter(instance("X", {{"QueryLanguage", text("q")}}), "");
              }),
              "4 Query is missing");
    for (const auto& each :
         {std::pair("PersistenceType", "4 PersistenceType is 9; here it can be 2 or 3 or 1"),
          {"Protocol", "4 Protocol is 9; here it can be 2"}})
        EXPECT_EQ(refusalOf([&] { readDestination(instance("X", {{each.first, number(9)}})); }), each.second);
    for (const auto& each :
         {std::pair("OnFatalErrorPolicy", "7 OnFatalErrorPolicy is 9; here it can be 2"),
          {"RepeatNotificationPolicy", "7 RepeatNotificationPolicy is 9; here it can be 2"},
          {"SubscriptionState", "4 SubscriptionState is 9; here it can be 2 or 4"}})
        EXPECT_EQ(refusalOf([&] {
                      readSubscription(instance("X", {{each.first, number(9)}}));
                  }),
                  each.second);
}

TEST(SubscriptionRequestsTest, TakeValuesInTheTypesOfTheClass) {
    const core::ClassChain& job = test::vocabulary().sources.at(2);
    const auto typed = [&](const char* name, const CimValue& value) {
        return typedInstance(instance("CIM_ConcreteJob", {{name, value}}), job);
    };
    const InstanceValue read = typed("jobstate", text("7"));
    EXPECT_EQ(read.properties.at(0).name + core::valueText(read.properties.at(0).value), "JobState7");
    EXPECT_EQ(read.properties.at(0).value.type, CimType::Uint16);
    EXPECT_EQ(
        core::valueText(typed("OperationalStatus", CimValue::arrayOf(CimType::String, {std::string("5")}))
                            .properties.at(0)
                            .value),
        "5");
    EXPECT_TRUE(typed("JobState", CimValue::null(CimType::String)).properties.at(0).value.isNull());
    EXPECT_EQ(refusalOf([&] { typed("JobState", text("seven")); }),
              "13 JobState takes a value of type uint16");
    EXPECT_EQ(refusalOf([&] { typed("OperationalStatus", text("seven")); }),
              "13 OperationalStatus takes a value of type uint16[]");
    EXPECT_EQ(refusalOf([&] { typed("JobState", CimValue::arrayOf(CimType::Uint16, {})); }),
              "13 JobState takes a value of type uint16");
    EXPECT_EQ(refusalOf([&] {
                  typedInstance(instance("X", {{"Caption", text("a")}, {"caption", text("a")}}), job);
              }),
              "4 Caption is given twice");
    const test::LogLevelGuard level(1);
    const test::SyslogCapture log;
    EXPECT_TRUE(typed("Un%known", text("x")).properties.empty());
    typed("Unknown", text("x"));
    EXPECT_EQ(test::SyslogCapture::count("which CIM_ConcreteJob does not have; such ones are passed over"),
              1U);
}

TEST(SubscriptionRequestsTest, CheckBothSidesOfEachLimit) {
    const auto changed = [](auto Filter::*member, const auto& value) {
        Filter filter = goodFilter();
        filter.*member = value;
        return refusalOf(filter);
    };
    const std::string longest(1024, 'x');
    const std::string tooLong(1025, 'x');
    EXPECT_EQ(changed(&Filter::name, std::string(256, ' ')), "accepted");
    EXPECT_EQ(changed(&Filter::name, std::string(257, ' ')), "4 Name is longer than 256 bytes");
    for (const char* name : {"\x1F", "\x7F"})
        EXPECT_EQ(changed(&Filter::name, std::string(name)), "4 Name holds a control character");
    EXPECT_EQ(changed(&Filter::language, tooLong), "4 QueryLanguage is longer than 1024 bytes");
    EXPECT_EQ(changed(&Filter::labels, indications::Labels{longest, longest, longest}), "accepted");
    EXPECT_EQ(changed(&Filter::labels, indications::Labels{tooLong, "", ""}),
              "4 Caption is longer than 1024 bytes");
    EXPECT_EQ(changed(&Filter::labels, indications::Labels{"", tooLong, ""}),
              "4 Description is longer than 1024 bytes");
    EXPECT_EQ(changed(&Filter::labels, indications::Labels{"", "", tooLong}),
              "4 ElementName is longer than 1024 bytes");
    EXPECT_EQ(changed(&Filter::namespaces, std::vector<std::string>(16, "INTEROP/")), "accepted");
    EXPECT_EQ(changed(&Filter::namespaces, std::vector<std::string>(17, "interop")),
              "4 SourceNamespaces names more than 16");
    EXPECT_EQ(
        changed(&Filter::namespaces, std::vector<std::string>{"root/%n" + tooLong}),
        "4 SourceNamespaces names \"root/%%n" + std::string(93, 'x') + "\", which is no namespace here");
    Filter elsewhere = goodFilter();
    elsewhere.namespaces = {"interop"};
    EXPECT_EQ(refusalOf([&] { requireEvents(elsewhere, sources()); }),
              "7 the filter \"f\" looks in interop, where nothing ever happens; events come from root/cimv2");
    EXPECT_EQ(refusalOf([] { requireEvents(goodFilter(), sources()); }), "accepted");

    Destination destination;
    destination.url = "http://h";
    destination.labels.caption = tooLong;
    EXPECT_EQ(refusalOf([&] { check(destination); }), "4 Caption is longer than 1024 bytes");
    destination.labels.caption.clear();
    destination.key.name = std::string(257, 'x');
    EXPECT_EQ(refusalOf([&] { check(destination); }), "4 Name is longer than 256 bytes");
    destination.key.name = "n";
    destination.persistence = 0;
    EXPECT_EQ(refusalOf([&] { check(destination); }), "4 PersistenceType is 0; here it can be 2 or 3 or 1");

    Subscription subscription;
    for (const auto& each :
         {std::pair(std::uint64_t{1}, "accepted"),
          {3'162'240'000, "accepted"},
          {0, "4 SubscriptionDuration must be from 1 to 3162240000 seconds"},
          {3'162'240'001, "4 SubscriptionDuration must be from 1 to 3162240000 seconds"}}) {
        subscription.duration = each.first;
        EXPECT_EQ(refusalOf([&] { check(subscription); }), each.second);
    }
    subscription.duration = 1;
    subscription.info = tooLong;
    EXPECT_EQ(refusalOf([&] { check(subscription); }), "4 SubscriptionInfo is longer than 1024 bytes");
}

TEST(SubscriptionRequestsTest, ChangeWhatMayBeChanged) {
    Subscription subscription;
    subscription.filter = "f";
    subscription.destination = {indications::kDestination, "d"};
    const InstanceValue current = instanceOf(subscription, indications::kEnabled, "host", 0);
    const auto changing = [&](const char* name, const CimValue& value,
                              const core::PropertyFilter& only = {}) {
        return refusalOf([&] {
            change(subscription, instance(indications::kSubscription, {{name, value}}), current, only);
        });
    };
    EXPECT_EQ(changing("SubscriptionState", number(4)), "accepted");
    EXPECT_EQ(subscription.state, indications::kDisabled);
    EXPECT_NE(subscription.changed, 0U);
    EXPECT_EQ(changing("SubscriptionInfo", text("new")), "accepted");
    EXPECT_EQ(changing("SubscriptionInfo", text("other"), std::vector<std::string>{"X"}), "accepted");
    EXPECT_EQ(subscription.info, "new");
    EXPECT_EQ(changing("SubscriptionDuration", number(8)), "accepted");
    EXPECT_EQ(subscription.duration, 8U);
    EXPECT_EQ(changing("SubscriptionDuration", number(0)),
              "4 SubscriptionDuration must be from 1 to 3162240000 seconds");
    EXPECT_EQ(subscription.duration, 8U);
    EXPECT_EQ(changing("RepeatNotificationPolicy", number(2)), "accepted") << "as it is";
    EXPECT_EQ(changing("RepeatNotificationPolicy", number(3)),
              "7 RepeatNotificationPolicy cannot be changed");
    EXPECT_EQ(changing("Filter", text("x")), "accepted") << "the path has said which";
}

TEST(SubscriptionFileTest, KeepsAllInTheFormOfEarlierVersions) {
    const test::TempFolder folder;
    Records records;
    Filter filter = goodFilter();
    filter.labels = {"c", "d", "e"};
    filter.creator = "alice";
    records.filters = {filter, filter};
    records.filters.back().isStatic = true;
    Destination destination;
    destination.key = {indications::kDestination, "d"};
    destination.url = "http://h";
    destination.labels.caption = "c";
    destination.creator = "alice";
    destination.address = "192.0.2.1";
    records.destinations = {destination};
    Subscription subscription;
    subscription.filter = "f";
    subscription.destination = destination.key;
    subscription.info = "i";
    subscription.duration = 5;
    subscription.start = 1;
    subscription.changed = 2;
    subscription.creator = "alice";
    records.subscriptions = {subscription, subscription};
    records.subscriptions.back().duration.reset();
    records.subscriptions.back().info.clear();
    const std::string path = folder / "new/subscriptions";
    indications::StateFile(path).write(records);
    const auto bytes = test::readTestFile(path);
    const auto expected = test::readTestFile(QUENX_INDICATIONS_TEST_DIR "/samples/subscriptions.json");
    EXPECT_EQ(std::string(bytes.begin(), bytes.end()), std::string(expected.begin(), expected.end()));
    indications::StateFile file(path);
    const Records read = file.read();
    ASSERT_EQ(read.filters.size() * read.destinations.size(), 1U);
    const std::string again = folder / "again";
    indications::StateFile(again).write(read);
    EXPECT_EQ(test::readTestFile(again), expected) << "what is read is what was written";
    EXPECT_TRUE(file.isKept());
    EXPECT_FALSE(indications::StateFile("").isKept());
}

}  // namespace
