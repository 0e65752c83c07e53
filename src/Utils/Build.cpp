// SPDX-License-Identifier: Apache-2.0
#include "Utils/Build.h"

#include "BuildId.h"

/// What cmake/SameBuild.cpp has the loader look for.
extern "C" {
extern QUENX_EXPORT const char QUENX_BUILD_SYMBOL;
const char QUENX_BUILD_SYMBOL = 0;
}

namespace utils {

const char* buildId() noexcept {
    return QUENX_BUILD_ID;
}

}  // namespace utils
