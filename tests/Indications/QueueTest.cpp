// SPDX-License-Identifier: Apache-2.0
#include "Indications/Delivery/Queue.h"

#include <gtest/gtest.h>

namespace {

using indications::Clock;
using indications::Outcome;
using indications::Queue;
using std::chrono::seconds;

constexpr Clock::time_point kNow{seconds(1000)};

/// Three bytes.
std::string numbered(const indications::Sequence& sequence) {
    return sequence.context + ' ' + std::to_string(sequence.number);
}

indications::DeliverySettings settings() {
    indications::DeliverySettings made;
    made.retries = 1;
    made.retryPause = seconds(10);
    made.mostWaiting = 3;
    return made;
}

/// "waiting overflow bytes"
std::string filling(const Queue& queue) {
    return std::to_string(queue.counters().waiting) + ' ' + std::to_string(queue.counters().overflow) + ' ' +
           std::to_string(queue.bytes());
}

TEST(QueueTest, MakesRoomFromTheOldestThatIsNotUnderWay) {
    Queue queue("c");
    EXPECT_FALSE(queue.due().has_value() || queue.dropOldest());
    EXPECT_EQ(queue.begin(kNow), nullptr);
    for (std::uint64_t tag : {1U, 1U, 2U})
        queue.add(tag, numbered, settings());
    EXPECT_EQ(filling(queue), "3 0 9");
    queue.add(1, numbered, settings());
    EXPECT_EQ(filling(queue), "3 1 9");
    const indications::Message* const first = queue.begin(kNow);
    ASSERT_NE(first, nullptr);
    EXPECT_EQ(first->body, "c 1");
    EXPECT_FALSE(queue.due().has_value());
    EXPECT_EQ(queue.begin(kNow), nullptr);
    queue.add(1, numbered, settings());  // takes the place of the one with the tag 2
    queue.drop(2);
    EXPECT_EQ(filling(queue), "3 2 9");
    queue.drop(1);
    EXPECT_EQ(filling(queue), "1 2 3");
    EXPECT_FALSE(queue.dropOldest());
    queue.end(Outcome::Taken, settings(), kNow);
    EXPECT_EQ(filling(queue), "0 2 0");
    auto small = settings();
    small.mostBytes = 6;
    for (std::uint64_t tag : {3U, 4U})
        queue.add(tag, numbered, small);
    EXPECT_EQ(filling(queue), "2 2 6");
    queue.add(3, numbered, small);
    EXPECT_EQ(filling(queue), "2 3 6");
    queue.drop(4);
    EXPECT_EQ(queue.begin(kNow)->body, "c 7");
}

TEST(QueueTest, PausesBeforeItTriesAgainAndGivesUp) {
    Queue queue("c");
    for (int i = 0; i < 5; ++i) {
        auto roomy = settings();
        roomy.mostWaiting = 5;
        queue.add(1, numbered, roomy);
    }
    EXPECT_EQ(queue.due(), Clock::time_point());
    const struct {
        int begin;  ///< seconds from now on, as all of these
        const char* body;
        Outcome outcome;
        int end;
        int due;  ///< the next, or -1 for at once or none
        std::uint64_t givenUp;
        bool isFailing;
        int failingFor;
    } tries[] = {
        {0, "c 0", Outcome::Failed, 1, 11, 0, false, 0},   {11, "c 0", Outcome::Failed, 12, 22, 1, true, 0},
        {22, "c 1", Outcome::Failed, 25, 35, 2, true, 13},  // one try, after one that was given up
        {35, "c 2", Outcome::Taken, 36, -1, 2, false, 0},  {36, "c 3", Outcome::Refused, 40, -1, 3, true, 0},
        {41, "c 4", Outcome::Refused, 47, -1, 4, true, 7},
    };
    for (const auto& each : tries) {
        EXPECT_EQ(queue.begin(*queue.due() - Clock::duration(1)), nullptr) << each.begin;
        const indications::Message* const message = queue.begin(kNow + seconds(each.begin));
        ASSERT_NE(message, nullptr) << each.begin;
        EXPECT_EQ(message->body, each.body);
        queue.end(each.outcome, settings(), kNow + seconds(each.end));
        const Clock::time_point due = each.due < 0 ? Clock::time_point() : kNow + seconds(each.due);
        EXPECT_EQ(queue.due().value_or(Clock::time_point()), due) << each.begin;
        EXPECT_EQ(queue.counters().givenUp, each.givenUp) << each.begin;
        EXPECT_EQ(queue.counters().failingFor, seconds(each.failingFor)) << each.begin;
        EXPECT_EQ(queue.counters().isFailing, each.isFailing) << each.begin;
        EXPECT_EQ(queue.isReliable(), each.outcome == Outcome::Taken) << each.begin;
    }
    EXPECT_EQ(queue.counters().delivered, 1U);
}

}  // namespace
