// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>

#include "Cli/Failure.h"

namespace cli {

/// What the service's methods answer (the DMTF's value map of CIM_SoftwareInstallationService).
enum MethodReturn : std::uint32_t {
    RETURN_COMPLETED = 0,
    RETURN_UNSPECIFIED = 2,
    RETURN_FAILED = 4,
    RETURN_INVALID_PARAMETER = 5,
    RETURN_TARGET_IN_USE = 6,
    RETURN_JOB_STARTED = 4096,
    RETURN_UNSUPPORTED_TARGET = 4097,
    RETURN_DOWNGRADE = 4099,
    RETURN_NO_MEMORY = 4100,
    RETURN_NOT_APPLICABLE = 4106,
    RETURN_NO_COLLECTIONS = 4108,
};

/// What a return value means to a person, and what to do about it.
Explanation explainReturnValue(std::uint32_t value);

}  // namespace cli
