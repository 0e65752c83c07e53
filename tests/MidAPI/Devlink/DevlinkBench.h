// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "MidAPI/Devlink/DevlinkBackend.h"
#include "MidAPI/Devlink/FakeKernel.h"
#include "MidAPI/ma.h"
#include "Support/SimulatedAdapters.h"

namespace test {

/// A fake kernel with one card of two functions, and the backend on it as that of ma.h, for the scope of a
/// test.
class DevlinkBench {
  public:
    const std::string first = "0000:05:00.0";
    const std::string second = "0000:05:00.1";
    const std::vector<std::uint8_t> image{'i', 'm', 'a', 'g', 'e'};
    const std::shared_ptr<FakeKernel> kernel = std::make_shared<FakeKernel>();

    DevlinkBench() {
        kernel->add(first, "enp5s0f0");
        kernel->add(second, "enp5s0f1");
        restart();
    }
    DevlinkBench(const DevlinkBench&) = delete;
    DevlinkBench& operator=(const DevlinkBench&) = delete;
    ~DevlinkBench() { ma::setBackend(m_previous); }

    /// Another process: a backend that knows nothing yet.
    void restart() {
        auto before =
            ma::setBackend(std::make_shared<ma::devlink::DevlinkBackend>(ma::devlink::Settings(), kernel));
        if (!m_isChosen) m_previous = std::move(before);
        m_isChosen = true;
    }

    FakeDevice& device() const { return kernel->devices.at(first); }
    int prepare(std::vector<utils::FirmwareType> types = {}) const {
        return prepareImage(first, image, std::move(types)).status;
    }
    WriteResult write() const { return writeImage(first, image); }
    /// Prepares and writes.
    WriteResult install() const {
        const int status = prepare();
        return status == 0 ? write() : WriteResult{.text = "status " + std::to_string(status)};
    }
    /// The files that were staged, and are still there.
    utils::StringArray staged() const { return kernel->listFolder("/lib/firmware/quenx").value(); }

  private:
    std::shared_ptr<ma::Backend> m_previous;
    bool m_isChosen = false;
};

}  // namespace test
