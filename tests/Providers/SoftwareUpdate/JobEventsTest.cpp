// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/JobEvents.h"

#include <gtest/gtest.h>

#include <condition_variable>
#include <mutex>

#include "Framework/Events/EventInterest.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"

namespace {

using test::CallResult;

/// Keeps every event.
class Recorder : public core::EventSink {
  public:
    void take(const core::InstanceEvent& event) noexcept override {
        const std::lock_guard lock(m_mutex);
        m_events.push_back(event);
        m_changed.notify_all();
    }

    std::vector<core::InstanceEvent> waitFor(std::size_t count) {
        std::unique_lock lock(m_mutex);
        m_changed.wait(lock, [&] { return m_events.size() >= count; });
        return m_events;
    }
    std::vector<core::InstanceEvent> events() { return waitFor(0); }

  private:
    std::mutex m_mutex;
    std::condition_variable m_changed;
    std::vector<core::InstanceEvent> m_events;
};

/// "4:50": the state and the progress; "-" for no job.
std::string shown(const core::InstanceSnapshot& job) {
    if (job == nullptr) return "-";
    return std::to_string(job->number("JobState")) + ":" + std::to_string(job->number("PercentComplete"));
}

std::vector<std::string> shown(const std::vector<core::InstanceEvent>& events) {
    std::vector<std::string> lines;
    for (const core::InstanceEvent& event : events)
        lines.push_back(shown(event.before) + " " + shown(event.after));
    return lines;
}

using Lines = std::vector<std::string>;

class JobEventsTest : public test::UpdateTest {
  protected:
    JobEventsTest() : m_installed(m_recorder) {}

    /// An update that stays before its first byte until the backend lets it go.
    core::CimPath heldUpdate() {
        m_backend->hold("writeFlashImage");
        const CallResult result = install(goodImage(), "eth0");
        EXPECT_EQ(result.returnValue, 4096U) << result.error;
        m_backend->waitUntilHeld();
        return result.job.value_or(core::CimPath());
    }

    const std::shared_ptr<Recorder> m_recorder = std::make_shared<Recorder>();
    const core::InstalledEventSink m_installed;
};

TEST_F(JobEventsTest, TellTheWayOfAnUpdateInOrder) {
    // By a superclass, as clients subscribe.
    const core::EventInterest interest("CIM_ConcreteJob");
    m_backend->progress = 0;
    const core::CimPath job = heldUpdate();
    m_recorder->waitFor(3);
    m_backend->progress = 20;
    m_recorder->waitFor(4);
    m_backend->progress = 50;
    m_backend->progress = 60;  // within a second of the last
    m_recorder->waitFor(5);
    m_backend->letGo();
    const auto toTheEnd = m_recorder->waitFor(6);
    // Whoever hears of the end can read it at once.
    EXPECT_EQ(state(m_requests.getInstance(job)), JobStateCompleted);
    const core::InstanceValue served = m_requests.getInstance(job);
    m_requests.deleteInstance(job);
    EXPECT_EQ(shown(m_recorder->events()),
              (Lines{"- 2:0", "2:0 3:0", "3:0 4:0", "4:0 4:20", "4:20 4:60", "4:60 7:100", "7:100 -"}));
    const core::InstanceSnapshot& end = toTheEnd.back().after;
    EXPECT_EQ(end->path.toString(), job.toString());
    EXPECT_EQ(end->properties.size(), served.properties.size());
}

TEST_F(JobEventsTest, TellOfAFailureAndOfAJobDeletedWhileItRuns) {
    const core::EventInterest interest("Quenx_ConcreteJob");
    m_backend->progress = 5;
    m_backend->hook = [](const std::string& operation) {
        if (operation == "writeFlashImage") throw std::runtime_error("out of order");
    };
    ASSERT_EQ(install(goodImage(), "eth0").returnValue, 4096U);
    EXPECT_EQ(shown(m_recorder->waitFor(4)), (Lines{"- 2:0", "2:0 3:0", "3:0 4:5", "4:5 10:100"}));
    EXPECT_EQ(m_recorder->events().back().after->text("ErrorDescription"), "Timeout Error");

    m_requests.deleteInstance(heldUpdate());
    m_backend->letGo();
    deleteJobs();
    // The flash went on to its end, and nobody was told: there was no job any more.
    EXPECT_EQ(shown(m_recorder->waitFor(9)), (Lines{"- 2:0", "2:0 3:0", "3:0 4:5", "4:5 10:100", "- 2:0",
                                                    "2:0 3:0", "3:0 4:5", "4:5 -", "10:100 -"}));
}

TEST_F(JobEventsTest, TellNothingAndAskNothingWhileNobodyListens) {
    m_backend->progress = 30;
    heldUpdate();
    std::atomic<int> questions{0};
    {
        // Begins in the middle: the state that the listener finds is no change.
        const core::EventInterest interest("CIM_Job");
        const core::EventInterest second("CIM_ManagedElement");
        m_backend->progress = 40;
        EXPECT_EQ(shown(m_recorder->waitFor(1)), (Lines{"4:30 4:40"}));
    }
    m_backend->letGo();
    deleteJobs();
    m_backend->hook = [&](const std::string& operation) {
        if (operation == "getFlashImageUpdateProgress") ++questions;
    };
    ASSERT_EQ(install(goodImage(), "eth0").returnValue, 4096U);
    while (claim() != "")
        utils::Thread::msleep(1);
    EXPECT_EQ(questions, 0);
    EXPECT_EQ(m_recorder->events().size(), 1U);
}

}  // namespace
