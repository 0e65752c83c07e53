// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "Utils/Export.h"

namespace core {
class CimPath;
}

/// What the installation service can do for a front in its own process, beside the methods that clients see.
/// The front finds the service through the broker and asks it by dynamic_cast from core::CimInstance.
namespace update {

/// Judges images without installing them.
class QUENX_EXPORT ImageCheck {
  public:
    virtual ~ImageCheck();
    /// Verifies the image at a URI as InstallFromURI does with these arguments, and ends there: no job is
    /// created and no adapter is claimed, now or afterwards, so that an update may run meanwhile. Returns 0
    /// for an image that could be installed, else what InstallFromURI returns. Thread-safe.
    virtual unsigned int checkImage(const std::string& uri, const core::CimPath& target,
                                    const std::vector<std::uint16_t>& options,
                                    const std::vector<std::string>& values) = 0;
};

}  // namespace update
