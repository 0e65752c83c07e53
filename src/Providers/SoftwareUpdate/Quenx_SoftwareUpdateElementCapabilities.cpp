// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/Quenx_SoftwareUpdateElementCapabilities.h"

#include "Providers/Schema/CIM_Capabilities.h"
#include "Providers/SoftwareUpdate/AssociationEnds.h"
#include "Utils/Exception.h"

namespace {

// Values of the DMTF value map of CIM_ElementCapabilities.Characteristics.
constexpr std::uint16_t kDefault = 2;
constexpr std::uint16_t kCurrent = 3;

}  // namespace

core::InstanceList::Iterator Quenx_SoftwareUpdateElementCapabilitiesClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp timing("Quenx_SoftwareUpdateElementCapabilitiesClass::getInstances");
    // Two first calls on two threads make one association.
    const utils::Mutex::AutoLocker lock(m_creation);
    if (m_instances.size() == 0) {
        // Neither end ever changes, so the association need not either.
        Services services;
        InstancesOf<const CIM_Capabilities> capabilities("Quenx_SoftwareInstallationServiceCapabilities");
        const CIM_SoftwareInstallationService* service = onlyOne(services);
        QUENX_ASSERT_TEXT(capabilities.count() == 1, __FILE__, __LINE__, "(int)capabilities.size() == 1");
        auto association = std::make_unique<Quenx_SoftwareUpdateElementCapabilities>();
        association->ManagedElement = service;
        association->Capabilities = capabilities.first();
        association->Characteristics = {kDefault, kCurrent};
        m_instances.add(association.release());
    }
    return m_instances.getElements(false);
}
