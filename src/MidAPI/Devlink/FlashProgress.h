// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <cstdint>

#include "MidAPI/Devlink/DevlinkMessages.h"
#include "MidAPI/Progress.h"
#include "Utils/Export.h"

namespace ma::devlink {

/// Makes one percentage of what a driver tells during the flashes of an update. Drivers count each of their
/// steps from 0; the percentage never goes back, and is below 100 until the update is done. One thread at a
/// time.
class QUENX_EXPORT FlashProgress {
  public:
    /// @param parts  how many flashes the update has, each an equal part of the whole
    FlashProgress(Progress& progress, std::size_t parts) : m_progress(progress), m_parts(parts) {}

    void report(const FlashStatus& status);
    void partDone();

  private:
    void advance(std::uint64_t percentOfPart);

    Progress& m_progress;
    const std::size_t m_parts;
    std::size_t m_done = 0;
};

}  // namespace ma::devlink
