// SPDX-License-Identifier: Apache-2.0
#include "Logind/Inhibitor.h"

#include <fcntl.h>
#include <systemd/sd-bus.h>
#include <unistd.h>

#include <atomic>
#include <chrono>
#include <cstring>
#include <memory>

#include "Utils/Os/Linux/LoadedLibrary.h"
#include "Utils/Os/Linux/linux.h"

namespace logind {

namespace {

using Clock = std::chrono::steady_clock;
using Microseconds = std::chrono::microseconds;

constexpr auto kPatience = std::chrono::seconds(1);  // for the bus, and once more for logind

/// The functions of libsystemd, which is not there on every machine.
struct Library {
    decltype(&::sd_bus_open_system) open = nullptr;
    decltype(&::sd_bus_close_unref) close = nullptr;
    decltype(&::sd_bus_is_ready) isReady = nullptr;
    decltype(&::sd_bus_process) process = nullptr;
    decltype(&::sd_bus_wait) wait = nullptr;
    decltype(&::sd_bus_set_method_call_timeout) setTimeout = nullptr;
    decltype(&::sd_bus_call_method) call = nullptr;
    decltype(&::sd_bus_message_read) read = nullptr;
    decltype(&::sd_bus_message_unref) endMessage = nullptr;
    decltype(&::sd_bus_error_free) endError = nullptr;
    std::string problem;
};

Library load() {
    // The headers that this is compiled with are the same interface's.
    os::LoadedLibrary library("libsystemd.so.0");
    Library found;
    library.find("sd_bus_open_system", found.open);
    library.find("sd_bus_close_unref", found.close);
    library.find("sd_bus_is_ready", found.isReady);
    library.find("sd_bus_process", found.process);
    library.find("sd_bus_wait", found.wait);
    library.find("sd_bus_set_method_call_timeout", found.setTimeout);
    library.find("sd_bus_call_method", found.call);
    library.find("sd_bus_message_read", found.read);
    library.find("sd_bus_message_unref", found.endMessage);
    library.find("sd_bus_error_free", found.endError);
    found.problem = library.problem();
    return found;
}

/// Where the library looks for it, too.
bool isThereABus() {
    return os::getEnvVariable("DBUS_SYSTEM_BUS_ADDRESS") != nullptr ||
           ::access("/run/dbus/system_bus_socket", F_OK) == 0;
}

std::atomic<const Library*> loaded{nullptr};

const Library& library() {
    return *loaded.load();
}

/// So all functions of the library tell of an error: -errno.
bool hasFailed(int result) {
    return result < 0;
}

std::string errorText(int result) {
    return std::strerror(-result);
}

/// Logs in to the bus. The library would do so with the first call, and wait for ever for a bus that says
/// nothing. Negative where it fails.
int becomeReady(sd_bus* bus) {
    for (const auto end = Clock::now() + kPatience;;) {
        const int ready = library().isReady(bus);
        if (ready != 0) return ready;
        const int done = library().process(bus, nullptr);
        if (hasFailed(done)) return done;
        const auto left = std::chrono::duration_cast<Microseconds>(end - Clock::now());
        if (left <= Microseconds::zero()) return -ETIMEDOUT;
        if (done == 0) library().wait(bus, static_cast<std::uint64_t>(left.count()));
    }
}

/// A descriptor of this process's own, since that of a message ends with it.
int ownDescriptor(int passed) {
    const int own = ::fcntl(passed, F_DUPFD_CLOEXEC, STDERR_FILENO + 1);
    return hasFailed(own) ? -errno : own;
}

/// A descriptor that is the lock, or why there is none.
int inhibit(sd_bus* bus, const std::string& who, const std::string& why, std::string& problem) {
    const Library& systemd = library();
    sd_bus_error error{};
    sd_bus_message* reply = nullptr;
    systemd.setTimeout(bus, Microseconds(kPatience).count());
    int result = systemd.call(bus, "org.freedesktop.login1", "/org/freedesktop/login1",
                              "org.freedesktop.login1.Manager", "Inhibit", &error, &reply, "ssss",
                              "shutdown:sleep", who.c_str(), why.c_str(), "block");
    int passed{};
    if (!hasFailed(result)) result = systemd.read(reply, "h", &passed);
    if (!hasFailed(result)) result = ownDescriptor(passed);
    if (hasFailed(result)) problem = error.message != nullptr ? error.message : errorText(result);
    systemd.endMessage(reply);
    systemd.endError(&error);
    return result;
}

}  // namespace

std::string loadLibrary() {
    if (!isThereABus()) return "there is no system bus";
    static const Library kLibrary = load();
    if (kLibrary.problem.empty()) loaded.store(&kLibrary);
    return kLibrary.problem;
}

Inhibitor::Inhibitor(const std::string& who, const std::string& why) {
    if (loaded.load() == nullptr) {
        m_problem = "the library that talks to the system's bus is not loaded";
        return;
    }
    sd_bus* bus = nullptr;
    int result = library().open(&bus);
    const std::unique_ptr<sd_bus, decltype(&::sd_bus_close_unref)> closed(bus, library().close);
    if (!hasFailed(result)) result = becomeReady(bus);
    if (hasFailed(result)) {
        m_problem = "the system's bus: " + errorText(result);
    } else {
        m_lock.emplace(inhibit(bus, who, why, m_problem));
    }
}

}  // namespace logind
