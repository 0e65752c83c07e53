// SPDX-License-Identifier: Apache-2.0
// quenx-cimd tells listeners what happens to its jobs.
#include <gmock/gmock.h>

#include <filesystem>
#include <fstream>
#include <sstream>
#include <thread>

#include "Indications/StrictListener.h"
#include "Indications/SubscriptionClient.h"

namespace {

using test::RunningDaemon;
using test::StrictListener;
using test::SubscriptionClient;
using ::testing::ElementsAre;
using ::testing::HasSubstr;

constexpr const char* kAll = "SELECT * FROM CIM_InstIndication WHERE SourceInstance ISA CIM_ConcreteJob";

/// An indication as a listener reads it.
struct Told {
    std::string className;
    std::string filter;
    std::string context;
    std::string state;
    std::string before;  ///< state before a modification
    std::string percent;
    long number = -1;
};

std::string valueIn(const pugi::xml_node& instance, const char* property) {
    return instance.find_child_by_attribute("NAME", property).child("VALUE").text().get();
}

Told told(const std::string& body) {
    pugi::xml_document document;
    EXPECT_EQ(test::faultsOf(body), "");
    EXPECT_TRUE(document.load_string(body.c_str()));
    const pugi::xml_node instance = document.select_node("//EXPPARAMVALUE/INSTANCE").node();
    const auto embedded = [&](const char* name, const char* property) {
        pugi::xml_document inner;
        inner.load_string(valueIn(instance, name).c_str());
        return valueIn(inner.child("INSTANCE"), property);
    };
    return {instance.attribute("CLASSNAME").value(),       valueIn(instance, "IndicationFilterName"),
            valueIn(instance, "SequenceContext"),          embedded("SourceInstance", "JobState"),
            embedded("PreviousInstance", "JobState"),      embedded("SourceInstance", "PercentComplete"),
            std::stol(valueIn(instance, "SequenceNumber"))};
}

std::vector<Told> toldOf(StrictListener& listener, std::size_t count) {
    std::vector<Told> all;
    for (const std::string& body : listener.waitFor(count))
        all.push_back(told(body));
    EXPECT_THAT(listener.problems(), ElementsAre());
    return all;
}

/// Waits for the indication of a job's deletion, which is its last.
std::vector<Told> toldUntilDeletion(StrictListener& listener) {
    for (std::size_t count = 1;; ++count) {
        std::vector<Told> all = toldOf(listener, count);
        if (all.size() < count || all.back().className == "CIM_InstDeletion") return all;
    }
}

/// Has an update run and ended, and its job deleted.
void update(const RunningDaemon& daemon) {
    const std::string service = daemon.lines("ein", "Quenx_SoftwareInstallationService").at(0);
    const std::string port = daemon.lines("ein", "Quenx_EthernetPort").at(0);
    const test::ProgramResult called = daemon.wbemcli(
        "cm", service,
        {"InstallFromURI.URI=\"file://" + daemon.image() + "\",InstallOptions=5,Target=" + port});
    ASSERT_TRUE(test::contains(called.out, "InstallFromURI: 4096")) << called.out << called.error;
    const std::string job = daemon.lines("ein", "Quenx_ConcreteJob").at(0);
    for (int round = 0; round < 600; ++round) {
        const std::string state = daemon.lines("gi", job, {"JobState"}).at(0);
        if (test::contains(state, "JobState=7") || test::contains(state, "JobState=10")) break;
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
    }
    EXPECT_EQ(daemon.wbemcli("di", job).status, 0);
}

TEST(ServedIndicationsTest, TellOneUpdateExactlyToWhoSubscribedAsCommonClientsDo) {
    const RunningDaemon daemon;
    const SubscriptionClient client(daemon);
    StrictListener listener;
    for (const char* each : {"CIM_ListenerDestinationCIMXML", "CIM_IndicationSubscription"})
        EXPECT_EQ(client.count(each), 0U) << each;
    EXPECT_EQ(client.count("CIM_IndicationFilter"), 6U);
    EXPECT_EQ(client.count("CIM_ObjectManager"), 1U);

    const std::string url = "http://127.0.0.1:" + std::to_string(listener.port());
    const std::string destination = client.madeDestination(url);
    EXPECT_EQ(client.value(destination, "Destination"), url);
    EXPECT_EQ(client.value(destination, "PersistenceType"), "3");
    EXPECT_EQ(client.value(destination, "Protocol"), "2");
    const std::string filter = client.madeFilter(kAll);
    EXPECT_EQ(client.value(filter, "Query"), kAll);
    EXPECT_EQ(client.value(filter, "SourceNamespace"), "root/cimv2");
    const std::string subscription = client.madeSubscription(filter, destination);
    EXPECT_THAT(subscription, HasSubstr("<VALUE.REFERENCE><LOCALINSTANCEPATH>"));
    EXPECT_EQ(client.value(subscription, "SubscriptionState"), "2");

    update(daemon);
    const std::vector<Told> all = toldUntilDeletion(listener);
    ASSERT_GE(all.size(), 4U);
    EXPECT_EQ(all.front().className + all.front().state, "CIM_InstCreation2");
    std::string states;
    for (const Told& each : all) {
        EXPECT_EQ(each.number, &each - all.data());
        EXPECT_EQ(each.context, all.front().context);
        EXPECT_EQ(each.filter, "f");
        if (each.className == "CIM_InstModification" && each.state != each.before)
            states += each.before + ">" + each.state + "@" + each.percent + " ";
    }
    EXPECT_THAT(states, ::testing::AnyOf("2>4@0 4>7@100 ", "2>3@0 3>4@0 4>7@100 "));
    EXPECT_EQ(all.back().className + all.back().state, "CIM_InstDeletion7");

    // Away with it, in the order that clients keep, who ask before whether somebody needs it.
    const auto references = [&](const std::string& path) {
        return client.call(
            "ReferenceNames",
            client.parameter("ObjectName", path) +
                client.parameter("ResultClass", "<CLASSNAME NAME=\"CIM_IndicationSubscription\"/>"));
    };
    EXPECT_THAT(client.remove(filter).description, HasSubstr("CIM_IndicationSubscription"));
    EXPECT_EQ(client.remove(destination).error, 1);
    EXPECT_TRUE(references(filter).result().first_child());
    EXPECT_EQ(client.remove(subscription).error, 0);
    EXPECT_EQ(client.remove(subscription).error, 6);
    for (const std::string& each : {filter, destination}) {
        EXPECT_FALSE(references(each).result().first_child());
        EXPECT_EQ(client.remove(each).error, 0);
    }
    update(daemon);
    EXPECT_EQ(listener.waitFor(all.size()).size(), all.size());
}

}  // namespace
