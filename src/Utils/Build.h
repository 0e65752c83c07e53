// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Utils/Export.h"

namespace utils {

/// What tells this build of the libraries from others: the same for all builds of the same headers by the
/// same compiler. Thread-safe.
QUENX_EXPORT const char* buildId() noexcept;

}  // namespace utils
