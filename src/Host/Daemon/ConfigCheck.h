// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Host/Settings.h"

namespace host {

/// `quenx-cimd --check-config`: looks at everything that a start would need, without starting. Says each
/// thing that is wrong; returns the exit status, 0 or 2.
int checkConfiguration(const Settings& settings);

}  // namespace host
