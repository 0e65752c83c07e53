// SPDX-License-Identifier: Apache-2.0
// How long those wait who log in, and who is remembered.
#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <optional>
#include <thread>

#include "Host/Authentication/Authentication.h"
#include "Host/Authentication/LoginQueue.h"

namespace {

using namespace std::chrono_literals;

TEST(FailureDelaysTest, GrowWithFailures) {
    host::FailureDelays delays(100ms, 2s);
    auto now = std::chrono::steady_clock::now();
    const auto waitOf = [&](const std::string& place) {
        return std::chrono::duration_cast<std::chrono::milliseconds>(std::max(delays.nextOf(place), now) -
                                                                     now);
    };
    for (const auto expected : {100ms, 200ms, 400ms, 800ms, 1600ms, 2000ms, 2000ms}) {
        delays.failed("a", now);
        EXPECT_EQ(waitOf("a"), expected);
        now += 20s;
    }
    EXPECT_EQ(waitOf("b"), 0ms);
    // The next one waits, however this ends.
    delays.admitted("a", now);
    EXPECT_EQ(waitOf("a"), 2000ms);
    delays.succeeded("a");
    EXPECT_EQ(waitOf("a"), 0ms);
    delays.failed("a", now);
    now += 15min;
    delays.failed("b", now);
    const auto never = host::FailureDelays::Clock::time_point::min();
    EXPECT_NE(delays.lastOf("a"), never);
    delays.failed("b", now + 1ns);
    EXPECT_EQ(delays.lastOf("a"), never) << "forgotten";
    // However many there are, those that were quiet for longest go first.
    for (int i = 1; i < 4096; ++i)
        delays.failed(std::to_string(i), now + i * 1us);
    EXPECT_NE(delays.lastOf("b"), never);
    delays.failed("1", now + 5ms);
    EXPECT_NE(delays.lastOf("b"), never) << "no further one";
    delays.failed("c", now + 5ms);
    EXPECT_EQ(delays.lastOf("b"), never);
    EXPECT_NE(delays.lastOf("2"), never);
}

TEST(LoginQueueTest, KeepsATurnForThoseWhoAreKnown) {
    using Turn = host::LoginQueue::Turn;
    host::LoginQueue queue({.firstDelay = 1h});
    std::stop_source ended;
    ended.request_stop();
    const auto canGo = [&](const std::string& user, const std::string& place, bool isKnown = false) {
        return bool(Turn(queue, {user, place, isKnown}, ended.get_token()));
    };
    const host::LoginQueue::Attempt stranger{"admin", "a"};
    const host::LoginQueue::Attempt known{"admin", "a", true};
    {
        Turn first(queue, stranger, {});
        Turn second(queue, stranger, {});
        EXPECT_FALSE(canGo("b", "b"));
        const Turn third(queue, known, {});
        EXPECT_FALSE(canGo("b", "b", true));
        first.failed();
        second.succeeded();
    }
    EXPECT_TRUE(canGo("admin", "b") && canGo("b", "a")) << "the failure is forgiven";
    Turn(queue, stranger, {}).failed();
    Turn(queue, known, {}).succeeded();
    EXPECT_FALSE(canGo("admin", "b") || canGo("b", "a")) << "one who need not wait forgives nobody else's";
    // Who has to wait is in nobody's way.
    const std::jthread waiting([&](const std::stop_token& stop) { const Turn turn(queue, stranger, stop); });
    std::this_thread::sleep_for(50ms);
    EXPECT_TRUE(canGo("b", "b"));
}

TEST(CredentialCacheTest, KeepsTheThousandVerifiedLast) {
    host::CredentialCache cache(1h);
    for (int i = 0; i < 1025; ++i) {
        EXPECT_EQ(cache.find({"0", ""}, "a").has_value(), i > 0);
        cache.remember({std::to_string(i), ""}, "a", {}, cache.generation());
    }
    EXPECT_FALSE(cache.find({"0", ""}, "a"));
    EXPECT_TRUE(cache.find({"1", ""}, "a"));
}

TEST(LoginQueueTest, LetsGoThoseWhoWaitedForChecksThatFailed) {
    using Turn = host::LoginQueue::Turn;
    host::LoginQueue queue({.firstDelay = 10ms, .patience = 20s});
    const host::LoginQueue::Attempt attempt{"admin", "192.0.2.1"};
    std::optional<Turn> one(std::in_place, queue, attempt, std::stop_token());
    std::optional<Turn> other(std::in_place, queue, attempt, std::stop_token());
    std::atomic<int> turns{0};
    std::vector<std::jthread> waiting;
    for (int i = 0; i < 4; ++i) {
        waiting.emplace_back([&](const std::stop_token& stop) {
            if (const Turn turn(queue, attempt, stop); turn) ++turns;
        });
    }
    std::this_thread::sleep_for(100ms);
    // From now on the place has to wait, and nobody comes who would look after it.
    for (std::optional<Turn>* each : {&one, &other}) {
        (*each)->failed();
        each->reset();
    }
    for (std::jthread& each : waiting)
        each.join();
    EXPECT_EQ(turns, 4);
}

}  // namespace
