// SPDX-License-Identifier: Apache-2.0
// What bounds the work and the memory that clients can make the daemon spend.
#include <gtest/gtest.h>

#include <ctime>
#include <thread>

#include "Framework/Model/CimError.h"
#include "Host/Authentication/ClientAddress.h"
#include "Host/Daemon/JobRetention.h"
#include "Host/Operations/AnswerBudget.h"
#include "Host/Server/ConnectionWatch.h"
#include "Host/Server/UserSlots.h"

namespace {

using namespace std::chrono_literals;
using host::AnswerCharge;
using host::OverBudget;

constexpr std::size_t kMebibyte = 1U << 20;

TEST(AnswerBudgetTest, KeepsRoomForOthersAndForSmallAnswers) {
    host::AnswerBudget budget(4 * kMebibyte);
    AnswerCharge small(budget, "a");
    std::optional<AnswerCharge> large(std::in_place, budget, "a");
    large->set(3 * kMebibyte);
    for (int round = 0; round < 2; ++round)
        EXPECT_THROW(AnswerCharge(budget, "a").add(100000), OverBudget);
    small.set(65536);
    AnswerCharge other(budget, "b");
    other.add(kMebibyte);
    EXPECT_THROW(other.add(1), OverBudget);
    // What moves on with its answer is given back at that one's end, and only then.
    std::optional<AnswerCharge> moved(large->split(2 * kMebibyte));
    large.reset();
    EXPECT_THROW(AnswerCharge(budget, "a").add(2 * kMebibyte), OverBudget);
    moved.reset();
    // What no other answer can hold is given in any case, and then others have to wait.
    {
        AnswerCharge owed(budget, "a");
        owed.owe();
        owed.cover(5 * kMebibyte);
        EXPECT_THROW(other.add(1), OverBudget);
    }
    AnswerCharge(budget, "a").add(3 * kMebibyte);
    EXPECT_THROW(AnswerCharge(budget, "a").add(3 * kMebibyte + 1), core::CimError);
}

TEST(UserSlotsTest, MakeOnlyTheirOwnUserWait) {
    host::UserSlots slots(2);
    const host::HeldUserSlot first(slots, "a", 0ms);
    std::optional<host::HeldUserSlot> second(std::in_place, slots, "a", 0ms);
    EXPECT_TRUE(first && *second);
    EXPECT_FALSE(host::HeldUserSlot(slots, "a", 0ms));
    EXPECT_TRUE(host::HeldUserSlot(slots, "b", 0ms));
    std::stop_source ended;
    ended.request_stop();
    EXPECT_FALSE(host::HeldUserSlot(slots, "a", 1h, ended.get_token())) << "nobody waits for a lost client";
    second.reset();
    EXPECT_TRUE(host::HeldUserSlot(slots, "a", 0ms));
}

/// Connections with numbers that no descriptor has, so that ending one touches nothing.
class ConnectionRoomTest : public ::testing::Test {
  protected:
    ~ConnectionRoomTest() override {
        for (std::size_t i = 0; i < m_admitted.size(); ++i)
            m_watch.closed(socketOf(i));
    }
    static int socketOf(std::size_t index) { return 1000000 + static_cast<int>(index); }
    bool admit(const std::string& network, const std::string& user = "") {
        const int socket = socketOf(m_admitted.size());
        if (!m_watch.admit(socket, network, {})) return false;
        m_watch.started(socket);
        m_admitted.emplace_back(network, m_watch.suspend(socket));
        if (!user.empty()) m_watch.loggedIn(socket, user);
        return true;
    }
    /// Who had to go: each with its network and how many came before it.
    std::string ended() const {
        std::string text;
        for (std::size_t i = 0; i < m_admitted.size(); ++i)
            if (m_admitted[i].second.stop_requested()) text += m_admitted[i].first + std::to_string(i);
        return text;
    }

    host::ConnectionWatch m_watch{{.connections = 8, .connectionsPerAddress = 3}};
    std::vector<std::pair<std::string, std::stop_token>> m_admitted;
};

TEST_F(ConnectionRoomTest, KeepsAQuarterForNetworksFromWhichSomebodyLoggedIn) {
    EXPECT_TRUE(admit("K", "k"));
    m_watch.closed(socketOf(0));
    for (const char* stranger : {"a", "b", "z", "z", "c", "d"})
        EXPECT_TRUE(admit(stranger));
    EXPECT_EQ(ended(), "");
    EXPECT_TRUE(admit("e"));
    EXPECT_EQ(ended(), "z3") << "the oldest of the network with the most";
    EXPECT_TRUE(admit("K") && admit("K"));
    EXPECT_EQ(ended(), "z3") << "two places were kept";
    EXPECT_TRUE(admit("K"));
    EXPECT_EQ(ended(), "a1z3") << "then a stranger makes room";
    EXPECT_TRUE(admit("K"));
    EXPECT_EQ(ended(), "a1z3K8") << "as many as one network may have";
}

TEST_F(ConnectionRoomTest, IsMadeByTheOldestOfThoseWhoHaveEquallyMany) {
    for (const char* stranger : {"f", "e", "d", "c", "b", "a", "x"})
        EXPECT_TRUE(admit(stranger));
    EXPECT_EQ(ended(), "f0") << "not by a network of an attacker's choice";
}

TEST_F(ConnectionRoomTest, LeavesNewcomersTheTimeToLogIn) {
    for (const char* network : {"a", "b", "c", "d", "e", "f", "g", "h"})
        EXPECT_TRUE(admit(network, "many"));
    EXPECT_TRUE(admit("a") && admit("b") && admit("c"));
    EXPECT_EQ(ended(), "a0b1c2") << "as long as one user has more than a quarter";
}

TEST_F(ConnectionRoomTest, IsNotMadeByThoseWhoLoggedIn) {
    for (const char* network : {"a", "b", "c", "d", "e", "f", "g"})
        EXPECT_TRUE(admit(network, network));
    EXPECT_TRUE(admit("a"));
    EXPECT_TRUE(admit("x")) << "the only stranger, for one who is known by the network alone";
    EXPECT_TRUE(admit("b", "b")) << "for the stranger";
    EXPECT_EQ(ended(), "a7x8");
    EXPECT_FALSE(admit("c"));
    for (unsigned int i = 0; i < host::ConnectionWatch::kLocalConnections; ++i)
        EXPECT_TRUE(admit(host::kLocalAddress, "root")) << "places of their own";
    EXPECT_FALSE(admit(host::kLocalAddress));
    m_watch.idle(socketOf(m_admitted.size() - 1), 60s);
    EXPECT_TRUE(admit(host::kLocalAddress));
    EXPECT_EQ(ended(), "a7x8local25");
}

TEST_F(ConnectionRoomTest, IsMadeByAUserWithMoreThanAQuarter) {
    for (const char* network : {"a", "b", "c", "d", "e", "f", "g", "h"})
        EXPECT_TRUE(admit(network, *network < 'd' ? "many" : network));
    m_watch.idle(socketOf(1), 60s);
    EXPECT_TRUE(admit("x", "x"));
    EXPECT_EQ(ended(), "b1");
    EXPECT_FALSE(admit("y")) << "two are a quarter";
    // Whoever is refused, or may have been removed, has to log in again to be safe.
    m_watch.loggedOut(socketOf(4));
    EXPECT_TRUE(admit("y", "y"));
    EXPECT_EQ(ended(), "b1e4");
    m_watch.idle(socketOf(5), 60s);
    m_watch.doubtLogins();
    EXPECT_TRUE(admit("z"));
    EXPECT_EQ(ended(), "b1e4f5");
    m_watch.endIdle();
    for (int i = 0; i < 600 && ended() == "b1e4f5"; ++i)
        std::this_thread::sleep_for(100ms);
    EXPECT_EQ(ended(), "b1e4f5z10") << "no stop waits for one who has not logged in";
}

TEST_F(ConnectionRoomTest, KnowsTheNetworksOfOthersHoweverManyOneUserHas) {
    EXPECT_TRUE(admit("K", "k"));
    m_watch.closed(socketOf(0));
    for (int i = 0; i < 1100; ++i) {
        EXPECT_TRUE(admit("n" + std::to_string(i), "many"));
        m_watch.closed(socketOf(m_admitted.size() - 1));
    }
    for (const char* stranger : {"u", "v", "w", "x", "y", "z"})
        EXPECT_TRUE(admit(stranger));
    EXPECT_TRUE(admit("K") && admit("n1000"));
    EXPECT_EQ(ended(), "") << "a quarter is kept for K, and for where the other was lately";
}

TEST(WantedPropertiesTest, FindAsFastAmongThousandsOfNames) {
    const auto cost = [](std::size_t count) {
        const core::PropertyFilter filter(std::vector<std::string>(count, "ElapsedTima"));
        const std::clock_t start = std::clock();
        const core::WantedProperties wanted(filter);
        for (int i = 0; i < 20000; ++i)
            EXPECT_FALSE(wanted.includes("ElapsedTime"));
        return std::clock() - start;
    };
    EXPECT_LT(cost(20000), cost(20) * 50 + CLOCKS_PER_SEC / 10);
    EXPECT_TRUE(core::WantedProperties({{"b", "ElapsedTime", "c"}}).includes("eLAPSEDtIME"));
}

core::InstanceValue job(const std::string& id, std::uint64_t state) {
    return {core::CimPath("J.ID=\"" + id + "\""),
            {{"JobState", core::CimValue::of(core::CimType::Uint16, state), false, {}}}};
}

TEST(EndedJobsTest, AreSurplusByNumberAndAge) {
    auto now = std::chrono::steady_clock::now();
    host::EndedJobs jobs({2, 10s});
    std::vector<core::InstanceValue> all{job("1", 7), job("2", 4), job("3", 10)};
    const auto surplus = [&] {
        std::string text;
        for (const auto& [path, rule] : jobs.look(all, now))
            text += path.toString() + " " + rule + " ";
        return text;
    };
    EXPECT_EQ(surplus(), "");
    // The first to end goes first, wherever it stands; no state but the two ends makes a job go.
    now += 1s;
    for (const std::uint64_t state : {2U, 3U, 5U, 6U, 8U, 9U, 11U, 12U})
        all.push_back(job("s" + std::to_string(state), state));
    all[1] = job("2", 10);
    EXPECT_EQ(surplus(), "J.ID=\"1\" jobs.keep ");
    all.erase(all.begin());
    now += 9s;
    EXPECT_EQ(surplus(), "J.ID=\"3\" jobs.keep_seconds ");
    now += 1h;
    EXPECT_EQ(surplus(), "J.ID=\"3\" jobs.keep_seconds J.ID=\"2\" jobs.keep_seconds ");
    EXPECT_TRUE(host::EndedJobs({}).look(all, now).empty());
}

TEST(EndedJobsTest, AreLookedForAsOftenAsTheBoundsNeed) {
    EXPECT_EQ(host::pauseBetweenLooks({0, 0s}), std::nullopt);
    EXPECT_EQ(host::pauseBetweenLooks({1, 0s}), 10s);
    EXPECT_EQ(host::pauseBetweenLooks({0, 1s}), 1s);
    EXPECT_EQ(host::pauseBetweenLooks({0, 50s}), 5s);
    EXPECT_EQ(host::pauseBetweenLooks({1, 24h}), 10s);
}

}  // namespace
