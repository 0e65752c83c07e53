// SPDX-License-Identifier: Apache-2.0
#include <malloc.h>
#include <pthread.h>

#include <csignal>
#include <ctime>
#include <exception>

#include "Host/Daemon/CommandLine.h"
#include "Host/Daemon/Daemon.h"
#include "Host/Daemon/Report.h"
#include "Utils/Os/Linux/linux.h"

namespace {

/// The signals that the main thread waits for, and no thread is interrupted by.
class Signals {
  public:
    Signals() {
        ::sigemptyset(&m_set);
        for (const int signal : {SIGTERM, SIGINT, SIGHUP})
            ::sigaddset(&m_set, signal);
        ::pthread_sigmask(SIG_BLOCK, &m_set, nullptr);
        os::ignoreOtherSignals();
    }

    int wait() const {
        int signal{};
        while (::sigwait(&m_set, &signal) != 0) {
        }
        return signal;
    }
    /// Whether one came in a tenth of a second: as long as a stop may last longer than what it waits for.
    bool comesSoon() const {
        const timespec patience{0, 100'000'000};
        return ::sigtimedwait(&m_set, nullptr, &patience) > 0;
    }

  private:
    sigset_t m_set{};
};

/// What a daemon that may be writing to an adapter must survive, a lack of memory above all: there is nobody
/// to tell it to, and it goes on as it was.
template <class Work>
void withoutFail(Work work) noexcept {
    try {
        work();
    } catch (const std::exception&) {
    }
}

void serve(host::Daemon& daemon, const Signals& signals) {
    const std::string serving = "Serving " + daemon.addresses();
    host::notifyServiceManager("READY=1\nSTATUS=" + serving);
    host::report(serving);
    while (signals.wait() == SIGHUP) {
        withoutFail([&] {
            host::notifyServiceManager("RELOADING=1");
            daemon.reload();
            host::notifyServiceManager("READY=1\nSTATUS=" + serving);
        });
    }
}

void stop(host::Daemon& daemon, const Signals& signals) {
    withoutFail([] {
        host::report("Stopping.");
        host::notifyServiceManager("STOPPING=1\nSTATUS=Stopping.");
    });
    daemon.stopAccepting();
    std::string said;
    for (bool isDone = false; !isDone;) {
        withoutFail([&] {
            const std::string rest = daemon.unfinished();
            isDone = rest.empty();
            if (isDone) return;
            const std::string waiting = "Waiting for " + rest + ".";
            if (rest != said) host::report(waiting);
            said = rest;
            // Thirty seconds more each time, since a flash takes longer than the service manager waits for a
            // stop.
            host::notifyServiceManager("EXTEND_TIMEOUT_USEC=30000000\nSTATUS=" + waiting);
        });
        // An adapter that is written to half is worse than a slow stop.
        if (!isDone && signals.comesSoon())
            withoutFail([&] { host::report("Asked again to stop. Still waiting for " + said + "."); });
    }
}

/// Each connection has a thread, and by default the C library keeps what was free for each of dozens of them:
/// many times the budget of answers. With two arenas four clients waited for one another in every request;
/// with eight, what 32 clients and then four more had read in large answers left 15 MiB behind, and 6 with
/// four. Images of common size go back at once, and so do the lists of a thousand jobs.
void boundKeptMemory() {
    constexpr int kArenas = 4;
    constexpr int kMappedAlone = 160 << 10;  // bytes, which go back to the system as soon as they are free
    constexpr int kKeptFree = 4 << 20;       // for the pieces of the next answers, until AnswerBudget trims
    ::mallopt(M_ARENA_MAX, kArenas);
    ::mallopt(M_MMAP_THRESHOLD, kMappedAlone);
    ::mallopt(M_TRIM_THRESHOLD, kKeptFree);
}

int run(const host::Settings& settings) {
    // Before any thread starts, so that all of them inherit the mask.
    const Signals signals;
    try {
        host::Daemon daemon(settings);
        serve(daemon, signals);
        stop(daemon, signals);
    } catch (const std::exception& error) {
        host::reportProblem(error.what());
        return 1;
    }
    host::report("Stopped.");
    return 0;
}

}  // namespace

int main(int argc, char** argv) {
    os::openStandardDescriptors();
    boundKeptMemory();
    const host::CommandLine command = host::readCommandLine(argc, argv);
    if (command.exitStatus) return *command.exitStatus;
    if (command.passwd) return host::runPasswd(*command.passwd);
    if (command.checkOnly) return host::checkConfiguration(command.settings);
    return run(command.settings);
}
