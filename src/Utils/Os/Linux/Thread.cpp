// SPDX-License-Identifier: Apache-2.0
#include "Utils/Os/Linux/Thread.h"

#include <cxxabi.h>

#include <cerrno>
#include <ctime>
#include <exception>

#include "Utils/Exception.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/SignalsBlocked.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Utils.h"

namespace utils {

namespace {

// The lines of a thread's end name the destructor, whose sequence it is.
constexpr const char* kEndFunction = "~Thread";
constexpr int kJoinDelays = 3;
constexpr unsigned int kJoinDelayMilliseconds = 100;

/// Says for a scope that the body runs.
class InExecute {
  public:
    explicit InExecute(IntThreadData& data) : m_data(data) { m_data.inExecute = true; }
    ~InExecute() { m_data.inExecute = false; }
    InExecute(const InExecute&) = delete;
    InExecute& operator=(const InExecute&) = delete;

  private:
    IntThreadData& m_data;
};

std::atomic<pthread_t> waitingThread{};

void runBody(Thread& thread) {
    const void* const address = &thread;
    try {
        thread.execute();
    } catch (const abi::__forced_unwind&) {
        throw;  // the end of a thread by pthread_exit; to swallow it would abort the process
    } catch (const std::exception& failure) {
        QUENX_ERROR("Thread %p ended by an exception: %s", address, failure.what());
    } catch (...) {
        QUENX_ERROR("Thread %p ended by an unknown exception", address);
    }
}

}  // namespace

Thread::Thread() : m_data(std::make_shared<IntThreadData>()) {}

Thread::~Thread() {
    shutdown();
}

void Thread::start() {
    const SignalsBlocked blocked;
    m_data->forks = os::forkCount();
    const int error =
        m_data->started ? EALREADY : pthread_create(&m_data->handle, nullptr, &thread_entry, this);
    if (error != 0) {
        throw Exception(formatStr("Could not start thread %p. Error %d", static_cast<void*>(this), error));
    }
    m_data->started = true;
}

void Thread::msleep(unsigned int milliseconds) {
    timespec left{};
    left.tv_sec = static_cast<std::time_t>(milliseconds / 1000);
    left.tv_nsec = static_cast<long>(milliseconds % 1000) * 1000000;
    // A signal must not shorten a wait: waits pace the polling of devices.
    while (nanosleep(&left, &left) != 0 && errno == EINTR) {
    }
}

void Thread::requestStop() noexcept {
    if (m_data != nullptr) m_data->stopRequested = true;
}

bool Thread::isStopRequested() const noexcept {
    return m_data == nullptr || m_data->stopRequested;
}

void Thread::shutdown() noexcept {
    if (m_data == nullptr) return;
    const void* const address = this;
    formatDebugLog(__FILE__, kEndFunction, __LINE__, "Thread::~Thread(%p)", address);
    m_data->stopRequested = true;
    // A child of the process that started the thread does not have it, and nothing to wait for.
    if (!isInThisProcess()) {
        m_data.reset();
        return;
    }
    // The delays give a body time to see the flag, and the log time to tell why a shutdown takes long.
    for (int i = 0; i < kJoinDelays && m_data->inExecute; ++i) {
        formatDebugLog(__FILE__, kEndFunction, __LINE__,
                       "Thread %p is still in 'execute' method. Little delay before join...", address);
        msleep(kJoinDelayMilliseconds);
    }
    if (m_data->started) join();
    m_data.reset();
}

bool Thread::isInThisProcess() const noexcept {
    return m_data != nullptr && (m_data->started == false || m_data->forks == os::forkCount());
}

Thread::Waiting::Waiting() noexcept {
    waitingThread = pthread_self();
}

Thread::Waiting::~Waiting() {
    waitingThread = pthread_t{};
}

void Thread::join() noexcept {
    // A thread that destroys its own object cannot be joined by anyone, nor one that waits for this to be
    // done. Then it has left its body, and runs the end of the process.
    const bool isOwn = pthread_equal(m_data->handle, pthread_self()) != 0 ||
                       pthread_equal(m_data->handle, waitingThread.load()) != 0;
    const int status = isOwn ? EDEADLK : pthread_join(m_data->handle, nullptr);
    if (status != 0) {
        formatDebugLog(__FILE__, kEndFunction, __LINE__, "Thread %p: join status is %d",
                       static_cast<const void*>(this), status);
    }
    if (isOwn) pthread_detach(m_data->handle);
}

void* thread_entry(void* argument) {
    Thread& thread = *static_cast<Thread*>(argument);
    // Kept first: a body may destroy its own thread object, and the flags are written after that.
    const std::shared_ptr<IntThreadData> data = thread.m_data;
    if (data->stopRequested) return nullptr;
    const InExecute inExecute(*data);
    runBody(thread);
    return nullptr;
}

}  // namespace utils
