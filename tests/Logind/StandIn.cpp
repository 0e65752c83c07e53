// SPDX-License-Identifier: Apache-2.0
#include "Logind/StandIn.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <poll.h>
#include <systemd/sd-bus.h>
#include <unistd.h>

#include <mutex>

namespace test {

namespace {

constexpr const char* kBus = R"(<busconfig>
  <type>system</type>
  <listen>unix:path=SOCKET</listen>
  <auth>EXTERNAL</auth>
  <policy context="default">
    <allow own="*"/> <allow user="*"/> <allow send_destination="*"/> <allow receive_sender="*"/>
  </policy>
</busconfig>)";

constexpr std::uint64_t kPause = 20'000;  // microseconds

}  // namespace

struct StandIn::Service {
    explicit Service(Manner chosen, const std::string& address) : manner(chosen) {
        sd_bus_new(&bus);
        sd_bus_set_address(bus, address.c_str());
        sd_bus_set_bus_client(bus, 1);
        sd_bus_start(bus);
        static const sd_bus_vtable kManager[] = {
            SD_BUS_VTABLE_START(0),
            SD_BUS_METHOD("Inhibit", "ssss", "h", inhibit, SD_BUS_VTABLE_UNPRIVILEGED),
            SD_BUS_VTABLE_END,
        };
        sd_bus_add_object_vtable(bus, nullptr, "/org/freedesktop/login1", "org.freedesktop.login1.Manager",
                                 kManager, this);
        EXPECT_GE(sd_bus_request_name(bus, "org.freedesktop.login1", 0), 0);
    }
    Service(const Service&) = delete;
    ~Service() {
        sd_bus_flush_close_unref(bus);
        ::close(lock);
    }

    static int inhibit(sd_bus_message* call, void* self, sd_bus_error* /*error*/) {
        auto& service = *static_cast<Service*>(self);
        const char* words[4] = {};
        sd_bus_message_read(call, "ssss", &words[0], &words[1], &words[2], &words[3]);
        const std::lock_guard guard(service.mutex);
        service.asked = std::string(words[0]) + "/" + words[1] + "/" + words[2] + "/" + words[3];
        if (service.manner == Manner::IsSilent) return 1;
        if (service.manner == Manner::Refuses)
            return sd_bus_reply_method_errorf(call, SD_BUS_ERROR_ACCESS_DENIED, "not today");
        int ends[2] = {-1, -1};
        EXPECT_EQ(::pipe2(ends, O_CLOEXEC), 0);
        ::close(service.lock);
        service.lock = ends[0];
        const int sent = sd_bus_reply_method_return(call, "h", ends[1]);
        ::close(ends[1]);
        return sent;
    }

    const Manner manner;
    sd_bus* bus = nullptr;
    std::mutex mutex;
    std::string asked;
    int lock = -1;  ///< the reading end: the other one is the client's
};

StandIn::StandIn(Manner manner) {
    const std::string address = "unix:path=" + m_folder / "bus";
    std::string configuration = kBus;
    configuration.replace(configuration.find("SOCKET"), 6, m_folder / "bus");
    m_bus = std::make_unique<Program>(std::vector<std::string>{"/usr/bin/dbus-daemon", "--nofork",
                                                               "--print-address", "--config-file",
                                                               m_folder.write("bus.conf", configuration)});
    EXPECT_TRUE(m_bus->waitFor(address)) << m_bus->finish().error;
    m_environment = "DBUS_SYSTEM_BUS_ADDRESS=" + address;
    m_service = std::make_unique<Service>(manner, address);
    m_thread = std::jthread([service = m_service.get()](const std::stop_token& stop) {
        while (!stop.stop_requested()) {
            if (sd_bus_process(service->bus, nullptr) == 0) sd_bus_wait(service->bus, kPause);
        }
    });
}

StandIn::~StandIn() {
    m_thread.request_stop();
    m_thread.join();
}

std::string StandIn::asked() const {
    const std::lock_guard guard(m_service->mutex);
    return m_service->asked;
}

bool StandIn::isHeld(bool expected) const {
    const std::lock_guard guard(m_service->mutex);
    pollfd lock{m_service->lock, POLLIN, 0};
    constexpr int kWait = 5000;  // milliseconds
    ::poll(&lock, 1, expected ? 0 : kWait);
    return m_service->lock >= 0 && (lock.revents & POLLHUP) == 0;
}

}  // namespace test
