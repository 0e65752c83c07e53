// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

#include "Framework/Classes/CimBroker.h"

namespace core {

/// The provider of firmware updates (DMTF Software Update profile, DSP1025): its one agent, with its class
/// objects.
class SoftwareUpdateAgent : public CimAgent {
  public:
    /// "Software Update": the name under which the agent registers, and by which its instances are looked up.
    static const std::string CIM_PROVIDER_NAME;

    /// Registers with the broker, then creates the class objects. Throws what one of their constructors
    /// throws; the agent is then not registered any more.
    SoftwareUpdateAgent();
    /// Leaves the broker. Waits for requests in flight and for flashes that have begun.
    ~SoftwareUpdateAgent() override;
};

}  // namespace core
