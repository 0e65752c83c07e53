// SPDX-License-Identifier: Apache-2.0
#include "Indications/Subscriptions/Records.h"

#include <gtest/gtest.h>

#include "Framework/Model/ClassDeclaration.h"
#include "Framework/Requests/CimOperations.h"
#include "Indications/Subscriptions/Classes.h"
#include "Indications/Subscriptions/Instances.h"
#include "Support/TempFolder.h"

namespace {

using core::CimValue;
using indications::Destination;
using indications::Filter;
using indications::Subscription;

std::string sample(const std::string& name) {
    const auto bytes = test::readTestFile(QUENX_INDICATIONS_TEST_DIR "/samples/" + name);
    return {bytes.begin(), bytes.end()};
}

std::string textOf(const core::InstanceValue& instance) {
    std::string text = instance.path.toString() + "\n";
    for (const core::PropertyValue& each : instance.properties)
        text += std::string(core::typeName(each.value.type)) + " " + each.name + (each.isKey ? " key" : "") +
                (each.value.isArray ? "[] " : " ") + each.referenceClass +
                (each.value.isNull() ? "null" : "= " + core::valueText(each.value)) + "\n";
    return text;
}

std::string namesOf(const std::vector<core::Qualifier>& qualifiers) {
    std::string names;
    for (const core::Qualifier& each : qualifiers)
        names += " [" + each.name + " " + core::valueText(each.value) + "]";
    return names;
}

TEST(SubscriptionClassesTest, AreThoseOfTheStandard) {
    std::string text;
    for (const core::ClassDeclaration& each : indications::subscriptionClasses()) {
        text += each.name + " : " + each.superclass + (each.isAssociation ? " association" : "") +
                namesOf(each.qualifiers) + "\n";
        for (const core::PropertyDeclaration& property : each.properties)
            text += "  " + std::string(core::typeName(property.type)) + (property.isArray ? "[] " : " ") +
                    property.name + (property.isKey ? " key" : "") +
                    (property.referenceClass.empty() ? "" : " to " + property.referenceClass) +
                    namesOf(property.qualifiers) + "\n";
    }
    EXPECT_EQ(text, sample("classes"));
}

TEST(SubscriptionInstancesTest, HaveAllThatClientsRead) {
    const Filter filter{.name = "f",
                        .namespaces = {"root/cimv2", "root/b"},
                        .query = "q",
                        .language = "l",
                        .labels = {"c", "d", "e"}};
    std::string text = textOf(instanceOf(filter, "host"));
    const Destination destination{
        .key = {indications::kHandler, "d"}, .url = "http://u", .persistence = indications::kTransient};
    text += textOf(instanceOf(destination, "host"));
    Subscription subscription{
        .filter = "f", .destination = destination.key, .info = "i", .start = 1'000'000, .changed = 2'000'000};
    text += textOf(instanceOf(subscription, indications::kDegraded, "host", 0));
    subscription.duration = 10;
    for (const std::uint64_t now : {1'999'999U, 10'999'999U, 11'000'000U}) {
        const std::string limited = textOf(instanceOf(subscription, indications::kEnabled, "host", now));
        const std::size_t begin = limited.find("uint64 SubscriptionDuration");
        text += limited.substr(begin, limited.find("string SubscriptionInfo") - begin);
    }
    EXPECT_FALSE(subscription.isExpired(10'999'999));
    EXPECT_TRUE(subscription.isExpired(11'000'000));
    indications::DeliverySettings settings;
    settings.retries = 4;
    settings.retryPause = std::chrono::milliseconds(1001);
    text += textOf(serviceInstance(settings, "host"));
    text += textOf(indications::capabilitiesInstance(7, true));
    EXPECT_EQ(text, sample("instances"));
}

TEST(SubscriptionRecordsTest, HaveFiltersOfTheServersOwn) {
    std::string text;
    for (const Filter& each : indications::staticFilters("root/cimv2")) {
        EXPECT_TRUE(each.isStatic);
        EXPECT_EQ(each.language + each.namespaces.at(0), "DMTF:CQLroot/cimv2");
        text += each.name + ": " + each.labels.description + "\n" + each.query + "\n";
    }
    EXPECT_EQ(text, sample("filters"));
}

// Its client may have made a filter just for this destination, or one for all.
TEST(SubscriptionRecordsTest, EraseADestinationWithWhatIsItsAlone) {
    const indications::DestinationKey gone{indications::kDestination, "gone"};
    const indications::DestinationKey stays{indications::kDestination, "stays"};
    indications::Records records;
    for (const char* name : {"alone", "shared", "unused", "another's", "server's"})
        records.filters.push_back({.name = name,
                                   .namespaces = {},
                                   .query = {},
                                   .language = {},
                                   .creator = name == std::string("another's") ? "bob" : "alice"});
    records.filters.back().isStatic = true;
    records.destinations = {{.key = gone, .url = {}, .creator = "alice"},
                            {.key = stays, .url = {}, .creator = "alice"}};
    for (const char* filter : {"alone", "shared", "another's", "server's"})
        records.subscriptions.push_back({.filter = filter, .destination = gone});
    records.subscriptions.push_back({.filter = "shared", .destination = stays});
    EXPECT_EQ(records.clientFilters(), 4U);
    records.erase({indications::kHandler, "gone"});
    EXPECT_EQ(records.subscriptions.size(), 5U);
    records.erase(gone);
    EXPECT_EQ(records.filter("alone"), nullptr);
    for (const char* name : {"shared", "unused", "another's", "server's"})
        EXPECT_NE(records.filter(name), nullptr) << name;
    EXPECT_EQ(records.destination(gone), nullptr);
    EXPECT_EQ(records.subscriptions.size(), 1U);
    EXPECT_NE(records.subscription("shared", stays), nullptr);
}

}  // namespace
