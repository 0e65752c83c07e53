// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

#include <chrono>
#include <filesystem>
#include <string>
#include <thread>

namespace test {

/// Keeps a simulated adapter's update from ending for as long as a test looks at it: the simulator waits for
/// the lock of its record.
class HeldFlash {
  public:
    /// @param folder  the adapter's, in the state directory; made when it is not there yet
    explicit HeldFlash(const std::string& folder) : m_folder(folder) {
        std::filesystem::create_directories(folder);
        m_lock = ::open((folder + "/state.lock").c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0644);
        ::flock(m_lock, LOCK_EX);
    }
    ~HeldFlash() { release(); }

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
    void release() {
        if (m_lock >= 0) ::close(m_lock);
        m_lock = -1;
    }

  private:
    const std::string m_folder;
    int m_lock = -1;
};

}  // namespace test
