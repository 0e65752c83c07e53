// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

#include "Utils/Export.h"

namespace ma::devlink {

class Machine;

/// The network address from which the user of this process has logged in, as the environment of the process
/// or of one that it descends from tells it; empty for a user at the machine. What is not to be read counts
/// as nothing, so this finds who is there, and keeps out nobody.
QUENX_EXPORT std::string findCaller(Machine& machine);

}  // namespace ma::devlink
