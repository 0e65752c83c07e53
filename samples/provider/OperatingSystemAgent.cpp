// SPDX-License-Identifier: Apache-2.0
#include "Quenx_OperatingSystem.h"

namespace {

/// The provider: a name under which requests can be meant for it, and the class objects that it serves.
class OperatingSystemAgent : public core::CimAgent {
  public:
    OperatingSystemAgent() : CimAgent("Quenx_OperatingSystem") {
        core::GetCimBroker()->addAgent(this);
        m_classes.add(new Quenx_OperatingSystemClass);
    }
    // Waits for the requests that are in here, so that the library can go.
    ~OperatingSystemAgent() override { leaveBroker(); }
};

// Loading the library is what registers the provider; unloading it takes it away.
const OperatingSystemAgent kAgent;

}  // namespace
