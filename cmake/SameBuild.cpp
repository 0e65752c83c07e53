// SPDX-License-Identifier: Apache-2.0
// In every library that stands on Quenx_Utils. Libraries of different builds may differ in the layout of what
// they share; the loader refuses them, since the symbol that only the Quenx_Utils of this build has is
// missing then.
#include "BuildId.h"
#include "Utils/Export.h"

extern "C" QUENX_EXPORT const char QUENX_BUILD_SYMBOL;

namespace {

[[gnu::used]] const char* const kSameBuild = &QUENX_BUILD_SYMBOL;

}  // namespace
