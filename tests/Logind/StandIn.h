// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <functional>
#include <memory>
#include <string>
#include <thread>

#include "Support/Program.h"
#include "Support/TempFolder.h"

namespace test {

/// A system bus of the test's own, with somebody on it who goes by the name of systemd-logind.
class StandIn {
  public:
    enum class Manner { Grants, Refuses, IsSilent };

    explicit StandIn(Manner manner);
    StandIn(const StandIn&) = delete;
    StandIn& operator=(const StandIn&) = delete;
    ~StandIn();

    /// "DBUS_SYSTEM_BUS_ADDRESS=...", for programs.
    const std::string& environment() const { return m_environment; }
    /// The arguments of the last call, with a slash between them; empty before the first.
    std::string asked() const;
    /// Whether somebody holds the lock that was granted last. Waits a while for its end.
    bool isHeld(bool expected) const;

  private:
    struct Service;

    TempFolder m_folder;
    std::string m_environment;
    std::unique_ptr<Program> m_bus;
    std::unique_ptr<Service> m_service;
    std::jthread m_thread;
};

}  // namespace test
