// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/InventoryInterfaces.h"

namespace inventory {

// Here, in a library below all providers, so that each type's information has one home.
EthernetPort::~EthernetPort() = default;
PortController::~PortController() = default;
SoftwareIdentity::~SoftwareIdentity() = default;
SoftwareIdentityResource::~SoftwareIdentityResource() = default;

}  // namespace inventory
