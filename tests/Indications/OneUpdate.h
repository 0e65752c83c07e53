// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <gtest/gtest.h>

#include <chrono>
#include <string>
#include <thread>

#include "System/RunningDaemon.h"

namespace test {

/// Has an update run and ended, and its job deleted.
inline void update(const RunningDaemon& daemon) {
    const std::string service = daemon.lines("ein", "Quenx_SoftwareInstallationService").at(0);
    const std::string port = daemon.lines("ein", "Quenx_EthernetPort").at(0);
    const ProgramResult called = daemon.wbemcli(
        "cm", service,
        {"InstallFromURI.URI=\"file://" + daemon.image() + "\",InstallOptions=5,Target=" + port});
    ASSERT_TRUE(contains(called.out, "InstallFromURI: 4096")) << called.out << called.error;
    const std::string job = daemon.lines("ein", "Quenx_ConcreteJob").at(0);
    for (int round = 0; round < 600; ++round) {
        const std::string state = daemon.lines("gi", job, {"JobState"}).at(0);
        if (contains(state, "JobState=7") || contains(state, "JobState=10")) break;
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
    }
    EXPECT_EQ(daemon.wbemcli("di", job).status, 0);
}

}  // namespace test
