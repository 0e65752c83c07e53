// SPDX-License-Identifier: Apache-2.0
// What quenx-cimd keeps of subscriptions, and what it forgets.
#include <gmock/gmock.h>

#include <filesystem>
#include <fstream>
#include <sstream>

#include "Indications/OneUpdate.h"
#include "Indications/SubscriptionClient.h"
#include "Indications/Told.h"

namespace {

using test::kAll;
using test::RunningDaemon;
using test::StrictListener;
using test::SubscriptionClient;
using test::Told;
using test::toldOf;
using test::toldUntilDeletion;
using test::update;
using ::testing::HasSubstr;

TEST(KeptSubscriptionsTest, GoOnAfterARestartWithNewNumbers) {
    const test::TempFolder folder;
    const std::string file = folder / "kept.json";
    const std::vector<std::string> options{"--indications-file", file};
    StrictListener listener;
    std::string context;
    {
        RunningDaemon daemon(options);
        const SubscriptionClient client(daemon);
        client.madeSubscription(client.madeFilter(kAll), client.madeDestination(listener.url()));
        update(daemon);
        context = toldUntilDeletion(listener).back().context;
        EXPECT_EQ(daemon.stop().status, 0);
    }
    EXPECT_EQ(std::filesystem::status(file).permissions(),
              std::filesystem::perms::owner_read | std::filesystem::perms::owner_write);
    const std::size_t before = listener.waitFor(1).size();
    RunningDaemon daemon(options);
    const SubscriptionClient client(daemon);
    EXPECT_EQ(client.count("CIM_IndicationSubscription"), 1U);
    update(daemon);
    const std::vector<Told> all = toldOf(listener, before + 4);
    EXPECT_EQ(all[before].number, 0);
    EXPECT_EQ(all[before].className, "CIM_InstCreation");
    EXPECT_NE(all[before].context, context);
}

TEST(KeptSubscriptionsTest, StartWithABrokenFileAndRefuseWhatTheyCannotKeep) {
    const test::TempFolder folder;
    const std::string file = folder.write("kept.json", "{\"version\": 7, \"filters\": []}");
    {
        const RunningDaemon daemon({"--indications-file", file});
        const SubscriptionClient client(daemon);
        EXPECT_FALSE(std::filesystem::exists(file));
        EXPECT_TRUE(std::filesystem::exists(file + ".broken"));
        client.madeFilter(kAll);
        EXPECT_TRUE(std::filesystem::exists(file));
    }
    // Half of it, a filter that nothing fits any more, and a subscription to nothing.
    std::ofstream(file) << R"({"version": 1, "filters": [{"name": "old", "namespaces": ["root/cimv2"],
        "language": "WQL", "query": "SELECT * FROM CIM_InstCreation WHERE SourceInstance ISA Gone_Class"}],
        "destinations": [{"class": "CIM_ListenerDestinationCIMXML", "name": "d", "url": "http://localhost:9",
        "persistence": 2}, {"class": "CIM_ListenerDestinationCIMXML", "name": "e", "url": "file:///x",
        "persistence": 2}, {"class": "CIM_ListenerDestinationCIMXML", "name": "g", "url": "http://h", "persistence":
        77}], "subscriptions": [
        {"filter": "old", "class": "CIM_ListenerDestinationCIMXML", "destination": "d", "state": 2, "start": 1,
        "changed": 1}, {"filter": "old", "class": "CIM_ListenerDestinationCIMXML", "destination": "e",
        "state": 2, "start": 1, "changed": 1}, {"filter": "Quenx:ConcreteJob:Failed", "class":
        "CIM_ListenerDestinationCIMXML", "destination": "d", "state": 77, "start": 1, "changed": 1}]})";
    const RunningDaemon daemon({"--indications-file", file});
    const SubscriptionClient client(daemon);
    EXPECT_EQ(client.count("CIM_ListenerDestinationCIMXML"), 1U);
    const test::CimAnswer kept =
        client.call("EnumerateInstances", client.className("CIM_IndicationSubscription"));
    const auto states = kept.document.select_nodes("//PROPERTY[@NAME='SubscriptionState']/VALUE");
    ASSERT_EQ(states.size(), 1U);
    EXPECT_EQ(std::string(states.first().node().text().get()), "4");
    // What was passed over is lost with no change that follows.
    client.madeFilter(kAll, "another");
    std::ostringstream copy;
    copy << std::ifstream(file + ".broken.2").rdbuf();
    EXPECT_THAT(copy.str(), HasSubstr("file:///x"));
    // A folder in the place of the file that is written next: what cannot be kept is not there.
    std::filesystem::remove(file);
    std::filesystem::create_directory(file);
    EXPECT_EQ(
        client.create("CIM_IndicationFilter", SubscriptionClient::filterProperties(kAll, "WQL", "n")).error,
        1);
    EXPECT_EQ(client.count("CIM_IndicationFilter"), 8U);
}

TEST(KeptSubscriptionsTest, ForgetTransientDestinationsThatTakeNothing) {
    const RunningDaemon daemon({"--indications-retries", "0", "--indications-retry-seconds", "1",
                                "--indications-abandon-seconds", "1"});
    const SubscriptionClient client(daemon);
    StrictListener listener;
    const std::string filter = client.madeFilter(kAll);
    const std::string gone = client.madeDestination("http://127.0.0.1:1", "gone");
    client.madeSubscription(filter, gone);
    client.madeSubscription(client.madeFilter(kAll, "of the gone"), gone);
    client.madeSubscription(filter, client.madeDestination(listener.url(), "good"));
    const std::string permanent =
        client.made("CIM_ListenerDestinationCIMXML",
                    SubscriptionClient::keys("CIM_ListenerDestinationCIMXML", "permanent") +
                        SubscriptionClient::property("Destination", "string", "http://127.0.0.1:1"));
    client.madeSubscription(filter, permanent);
    // Its first failure begins the time, which a later one ends.
    for (int i = 0; i < 100 && client.count("CIM_IndicationSubscription") == 4; ++i)
        update(daemon);
    EXPECT_EQ(client.remove(gone).error, 6);
    EXPECT_EQ(client.count("CIM_IndicationSubscription"), 2U);
    EXPECT_EQ(client.count("CIM_ListenerDestinationCIMXML"), 2U);
    EXPECT_EQ(client.value(permanent, "Name"), "permanent");
    EXPECT_EQ(client.count("CIM_IndicationFilter"), 7U);
}

}  // namespace
