// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/ProviderInterfaces.h"

#include "Framework/Classes/CimBroker.h"
#include "Framework/Model/CimInstance.h"

// Here, in a library below all providers, so that each type's information has one home.
namespace inventory {

EthernetPort::~EthernetPort() = default;
PortController::~PortController() = default;
SoftwareIdentity::~SoftwareIdentity() = default;
SoftwareIdentityResource::~SoftwareIdentityResource() = default;

}  // namespace inventory

namespace update {

ImageCheck::~ImageCheck() = default;

ImageCheck* findImageCheck(core::CimPath& service) {
    return dynamic_cast<ImageCheck*>(core::GetCimBroker()->getInstanceByPath(service));
}

}  // namespace update
