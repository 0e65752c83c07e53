// SPDX-License-Identifier: Apache-2.0
// Loaded by a host that has nothing of the framework, to count the agents there are.
#include "Framework/Classes/CimBroker.h"

extern "C" QUENX_EXPORT int agentCount() {
    return static_cast<int>(core::GetCimBroker()->useAgents().size());
}
