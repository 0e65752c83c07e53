#include "Utils/Os/Linux/Thread.h"

#include <gtest/gtest.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>
#include <functional>
#include <stdexcept>
#include <thread>
#include <vector>

#include "Support/ChildProcess.h"
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
    void execute() override {
        m_id = static_cast<pid_t>(syscall(SYS_gettid));
        m_body(*this);
    }
    void waitUntilInBody() const {
        while (m_id == 0)
            msleep(1);
    }
    void waitUntilGone() const {
        waitUntilInBody();
        while (syscall(SYS_tgkill, getpid(), m_id.load(), 0) == 0)
            msleep(1);
    }
    std::string address() const { return formatStr("%p", static_cast<const void*>(this)); }
    using Thread::isStopRequested;
    using Thread::requestStop;

  private:
    const std::function<void(Worker&)> m_body;  // used by the body to its end
    std::atomic<pid_t> m_id{0};
};

std::string beginLine(const std::string& address) {
    return "Thread::~Thread(" + address + ")";
}
std::string delayLine(const std::string& address) {
    return "Thread " + address + " is still in 'execute' method. Little delay before join...";
}
std::string couldNotStart(const std::string& address, int error) {
    return "Could not start thread " + address + ". Error " + std::to_string(error);
}

struct ThreadTest : ::testing::Test {
    test::LogLevelGuard guard{2};
};

}  // namespace

TEST_F(ThreadTest, ABodyThatIgnoresTheStopIsJoinedAfterThreeDelays) {
    bool isFinished = false;
    std::string address;
    {
        Worker worker([&](Worker& self) {
            while (SyslogCapture::count("Little delay") < 3)
                Worker::msleep(1);
            EXPECT_TRUE(self.isStopRequested());
            Worker::msleep(120);
            isFinished = true;
        });
        address = worker.address();
        worker.start();
        worker.waitUntilInBody();
    }
    EXPECT_TRUE(isFinished);
    const std::string delay = delayLine(address);
    EXPECT_EQ(SyslogCapture::messages(), (std::vector<std::string>{beginLine(address), delay, delay, delay}));
    EXPECT_EQ(SyslogCapture::count("(~Thread@Thread.cpp:"), 4U);
}

TEST_F(ThreadTest, ABodyThatHasEndedOrNeverBegunIsNotWaitedFor) {
    std::string address;
    {
        Worker ended([](Worker&) {});
        address = ended.address();
        ended.start();
        ended.waitUntilGone();
    }
    EXPECT_EQ(SyslogCapture::messages(), std::vector<std::string>{beginLine(address)});
    SyslogCapture::clear();
    {
        Worker unstarted([](Worker&) { ADD_FAILURE(); });
        address = unstarted.address();
    }
    EXPECT_EQ(SyslogCapture::messages(), std::vector<std::string>{beginLine(address)});
}

TEST_F(ThreadTest, AStopBeforeTheBeginningKeepsTheBodyFromRunning) {
    bool hasRun = false;
    {
        Worker worker([&](Worker&) { hasRun = true; });
        worker.requestStop();
        worker.start();
    }
    EXPECT_FALSE(hasRun);
    // However the end meets the beginning, the body runs whole or not at all.
    for (int round = 0; round < 200; ++round) {
        std::vector<int> fields;
        Worker worker([&](Worker&) { fields.assign(10, 1); });
        worker.start();
    }
}

TEST_F(ThreadTest, AnExceptionOfTheBodyEndsTheThreadOnly) {
    std::string address;
    {
        Worker worker([](Worker&) { throw std::runtime_error("%n"); });
        address = worker.address();
        worker.start();
        worker.waitUntilGone();
        Worker other([](Worker&) { throw 5; });
        other.start();
        other.waitUntilGone();
    }
    const auto errors = SyslogCapture::messages("error");
    ASSERT_EQ(errors.size(), 2U);
    EXPECT_EQ(errors[0], "Thread " + address + " ended by an exception: %n");
}

TEST_F(ThreadTest, ASecondStartIsRefused) {
    std::atomic<int> runs{0};
    {
        Worker worker([&](Worker&) { ++runs; });
        worker.start();
        EXPECT_THROW(worker.start(), utils::Exception);
        EXPECT_EQ(SyslogCapture::messages("error"),
                  std::vector<std::string>{couldNotStart(worker.address(), EALREADY)});
        worker.waitUntilGone();
    }
    EXPECT_EQ(runs, 1);
}

TEST_F(ThreadTest, AThreadThatCannotBeCreatedThrowsAndIsNotJoined) {
    EXPECT_EQ(test::runAsNobody([]() -> std::string {
                  const rlimit none{0, 0};
                  if (setrlimit(RLIMIT_NPROC, &none) != 0) return "no limit set";
                  SyslogCapture::clear();
                  std::string expected;
                  {
                      Worker worker([](Worker&) {});
                      expected = "SMASHv2:" + couldNotStart(worker.address(), EAGAIN);
                      try {
                          worker.start();
                          return "it started";
                      } catch (const utils::Exception& failure) {
                          if (failure.what() != expected) return failure.what();
                      }
                  }
                  return SyslogCapture::messages().size() == 1 ? "" : "more than the line of the end";
              }),
              "");
}

TEST_F(ThreadTest, AThreadThatDestroysItselfIsNotJoinedByItself) {
    std::atomic<bool> isStarted{false}, isGone{false};
    auto* const worker = new Worker([&isStarted, flag = &isGone](Worker& self) {
        while (!isStarted)
            Worker::msleep(1);
        std::atomic<bool>* const ownFlag = flag;  // the body itself goes with the object
        delete &self;
        ownFlag->store(true);
    });
    worker->start();
    isStarted = true;
    while (!isGone)
        utils::Thread::msleep(1);
    EXPECT_EQ(SyslogCapture::count(formatStr("join status is %d", EDEADLK)), 1U);
}

TEST(Mutex, CountersFollowAndLockersExclude) {
    const unsigned int locks = utils::Mutex::lockCounter, unlocks = utils::Mutex::unlockCounter;
    utils::Mutex mutex;
    int value = 0;
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([&] {
            for (int round = 0; round < 1000; ++round) {
                utils::Mutex::AutoLocker locker(mutex);
                ++value;
            }
        });
    }
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(value, 4000);
    EXPECT_EQ(utils::Mutex::lockCounter - locks, 4000U);
    EXPECT_EQ(utils::Mutex::unlockCounter - unlocks, 4000U);
}

TEST(Atomic, OneOfManyTakesTheClaim) {
    EXPECT_FALSE(utils::Atomic<bool>());
    utils::Atomic<std::string> claim;
    std::atomic<int> taken{0};
    std::vector<std::thread> threads;
    for (int i = 0; i < 8; ++i) {
        threads.emplace_back([&, name = "adapter " + std::to_string(i)] {
            std::string holder;
            if (claim.compareAndSet("", name, holder)) {
                ++taken;
            } else {
                EXPECT_EQ(holder.substr(0, 8), "adapter ");
            }
        });
    }
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(taken, 1);
    EXPECT_FALSE(claim == "");
    claim = "";
    EXPECT_TRUE(claim == "");
    EXPECT_EQ(static_cast<std::string>(claim), "");
}
