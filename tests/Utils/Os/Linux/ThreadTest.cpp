// SPDX-License-Identifier: Apache-2.0
#include "Utils/Os/Linux/Thread.h"

#include <gtest/gtest.h>
#include <signal.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>
#include <functional>
#include <stdexcept>
#include <vector>

#include "Support/SyslogCapture.h"
#include "Utils/Exception.h"
#include "Utils/Utils.h"

using test::SyslogCapture;
using utils::formatStr;

namespace {

/// Runs a function as its body.
class Worker : public utils::Thread {
  public:
    explicit Worker(std::function<void(Worker&)> body) : m_body(std::move(body)) {}
    ~Worker() override { shutdown(); }
    void execute() override { m_body(*this); }
    std::string address() const { return formatStr("%p", static_cast<const void*>(this)); }
    using Thread::isStopRequested;
    using Thread::requestStop;

  private:
    const std::function<void(Worker&)> m_body;  // used by the body to its end
};

void waitUntil(const std::function<bool()>& condition) {
    while (!condition())
        utils::Thread::msleep(1);
}

struct ThreadTest : ::testing::Test {
    test::LogLevelGuard guard{2};
};

}  // namespace

TEST_F(ThreadTest, JoinsABodyThatIgnoresTheStopAfterThreeDelays) {
    std::atomic<bool> isRunning{false};
    bool isFinished = false;
    std::string address;
    {
        Worker worker([&](Worker& self) {
            isRunning = true;
            waitUntil([] { return SyslogCapture::count("Little delay") == 3; });
            EXPECT_TRUE(self.isStopRequested());
            Worker::msleep(120);  // into the join
            isFinished = true;
        });
        address = worker.address();
        worker.start();
        waitUntil([&] { return isRunning.load(); });
    }
    EXPECT_TRUE(isFinished);
    EXPECT_EQ(SyslogCapture::messages().front(), "Thread::~Thread(" + address + ")");
    EXPECT_EQ(SyslogCapture::messages().back(),
              "Thread " + address + " is still in 'execute' method. Little delay before join...");
    EXPECT_EQ(SyslogCapture::count("(~Thread@Thread.cpp:"), 4U);
}

TEST_F(ThreadTest, WaitsForNoBodyThatHasEndedOrIsNotToBegin) {
    std::atomic<pid_t> id{0};
    {
        Worker unstarted([](Worker&) { ADD_FAILURE(); });
        Worker stopped([](Worker&) { ADD_FAILURE(); });
        stopped.requestStop();
        stopped.start();
        Worker ended([&](Worker&) { id = static_cast<pid_t>(syscall(SYS_gettid)); });
        ended.start();
        EXPECT_THROW(ended.start(), utils::Exception);
        waitUntil([&] { return id != 0 && syscall(SYS_tgkill, getpid(), id.load(), 0) != 0; });
    }
    EXPECT_EQ(SyslogCapture::count("Thread::~Thread("), 3U);
    EXPECT_EQ(SyslogCapture::messages().size(), 3U);
    // However the end meets the beginning, the body runs whole or not at all.
    for (int round = 0; round < 200; ++round) {
        std::vector<int> fields;
        Worker worker([&](Worker&) { fields.assign(10, 1); });
        worker.start();
    }
}

TEST_F(ThreadTest, AloneEndsOnAnExceptionOfTheBody) {
    Worker known([](Worker&) { throw std::runtime_error("%n"); });
    Worker unknown([](Worker&) { throw 5; });
    for (Worker* const worker : {&known, &unknown})
        worker->start();
    waitUntil([] { return SyslogCapture::messages("error").size() == 2; });
    EXPECT_TRUE(SyslogCapture::says("Thread " + known.address() + " ended by an exception: %n"));
    EXPECT_TRUE(SyslogCapture::says("Thread " + unknown.address() + " ended by an unknown exception"));
}

TEST(MutexTest, CountsLocksAndUnlocks) {
    utils::Mutex mutex;
    const unsigned int locks = utils::Mutex::lockCounter, unlocks = utils::Mutex::unlockCounter;
    { const utils::Mutex::AutoLocker locker(mutex); }
    EXPECT_EQ(utils::Mutex::lockCounter - locks, 1U);
    EXPECT_EQ(utils::Mutex::unlockCounter - unlocks, 1U);
}

TEST_F(ThreadTest, LeavesSignalsToTheThreadsOfItsHost) {
    std::atomic<bool> isAsked{false};
    Worker worker([&](Worker&) {
        sigset_t blocked;
        pthread_sigmask(SIG_BLOCK, nullptr, &blocked);
        EXPECT_TRUE(sigismember(&blocked, SIGINT) == 1 && sigismember(&blocked, SIGSEGV) == 0);
        isAsked = true;
    });
    worker.start();
    waitUntil([&] { return isAsked.load(); });
}

TEST_F(ThreadTest, DoesNotJoinItselfWhenItDestroysItself) {
    std::atomic<bool> isStarted{false}, isGone{false};
    auto* const worker = new Worker([&isStarted, flag = &isGone](Worker& self) {
        waitUntil([&] { return isStarted.load(); });
        std::atomic<bool>* const ownFlag = flag;  // the body itself goes with the object
        delete &self;
        ownFlag->store(true);
    });
    worker->start();
    isStarted = true;
    waitUntil([&] { return isGone.load(); });
    EXPECT_EQ(SyslogCapture::count(formatStr("join status is %d", EDEADLK)), 1U);
}
