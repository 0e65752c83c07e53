// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <filesystem>
#include <optional>
#include <string>
#include <thread>

#include "Utils/Os/Linux/FileLock.h"

namespace test {

/// Keeps a simulated adapter's update from ending for as long as a test looks at it: the simulator waits for
/// the lock of its record.
class HeldFlash {
  public:
    /// @param folder  the adapter's, in the state directory; made when it is not there yet
    explicit HeldFlash(const std::string& folder) : m_folder(folder) {
        std::filesystem::create_directories(folder);
        m_lock.emplace(folder + "/state.lock");
    }

    /// Whether an update comes to hold the flash. It leaves its process id there.
    bool isWaitedFor() const {
        std::error_code error;
        for (int round = 0; round < 1000; ++round) {
            const auto size = std::filesystem::file_size(m_folder + "/flash.lock", error);
            if (!error && size != 0) return true;
            std::this_thread::sleep_for(std::chrono::milliseconds(20));
        }
        return false;
    }

    /// Lets updates go on.
    void release() { m_lock.reset(); }

  private:
    const std::string m_folder;
    std::optional<os::FileLock> m_lock;
};

}  // namespace test
