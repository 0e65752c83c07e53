// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/ProviderInterfaces.h"

// Here, in a library below all providers, so that each type's information has one home.
namespace inventory {

EthernetPort::~EthernetPort() = default;
PortController::~PortController() = default;
SoftwareIdentity::~SoftwareIdentity() = default;
SoftwareIdentityResource::~SoftwareIdentityResource() = default;

}  // namespace inventory

namespace update {

ImageCheck::~ImageCheck() = default;

}  // namespace update
