// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Classes/CimAgent.h"

namespace core {

/// The provider that shows what there is: Ethernet ports and the cards that carry them, firmware in
/// files and on adapters.
class SoftwareInventoryAgent : public CimAgent {
  public:
    static const char* const CIM_PROVIDER_NAME;

    SoftwareInventoryAgent();
    ~SoftwareInventoryAgent() override;
};

}  // namespace core
