// Loading the library builds the agent, unloading it destroys the agent.
#include "Providers/SoftwareUpdate/SoftwareUpdateAgent.h"

namespace {

const core::SoftwareUpdateAgent agent;

}  // namespace
