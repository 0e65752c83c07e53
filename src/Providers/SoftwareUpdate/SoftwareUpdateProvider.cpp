// SPDX-License-Identifier: Apache-2.0
// Loading the library builds the agent, unloading it destroys the agent.
#include "Providers/SoftwareUpdate/SoftwareUpdateAgent.h"

namespace {

const core::SoftwareUpdateAgent kAgent;

}  // namespace
