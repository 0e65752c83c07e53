// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/ProviderInterfaces.h"

#include "Framework/Classes/CimBroker.h"
#include "Framework/Classes/RequestScope.h"
#include "Framework/Model/CimInstance.h"
#include "Framework/Requests/CimOperations.h"

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

std::string claimedAdapter(core::CimOperations& operations) {
    // By the standard's class, so that services of any provider count.
    constexpr const char* kServices = "CIM_SoftwareInstallationService";
    const core::RequestScope scope;
    if (operations.getClass(kServices).empty()) return {};
    for (core::CimPath& service : operations.enumerateInstanceNames(kServices)) {
        const ImageCheck* check = findImageCheck(service);
        if (check == nullptr) continue;
        if (std::string adapter = check->claimedAdapter(); !adapter.empty()) return adapter;
    }
    return {};
}

}  // namespace update
