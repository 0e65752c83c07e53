// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/Quenx_SoftwareUpdateElementCapabilities.h"

#include "Framework/Classes/CimBroker.h"
#include "Providers/Schema/CIM_Capabilities.h"
#include "Providers/Schema/CIM_ManagedElement.h"
#include "Providers/SoftwareUpdate/AssociationEnds.h"
#include "Utils/Debug.h"
#include "Utils/Exception.h"
#include "Utils/Log.h"

namespace {

// Values of the DMTF value map of CIM_ElementCapabilities.Characteristics.
constexpr std::uint16_t kDefault = 2;
constexpr std::uint16_t kCurrent = 3;

}  // namespace

constinit const core::CimClassInfo Quenx_SoftwareUpdateElementCapabilities::classInfo{
    "Quenx_ElementCapabilities", &CIM_ElementCapabilities::classInfo, true, {}, nullptr};

Quenx_SoftwareUpdateElementCapabilities::~Quenx_SoftwareUpdateElementCapabilities() = default;

std::string Quenx_SoftwareUpdateElementCapabilities::getClassName() const {
    return classInfo.name;
}

utils::SafeList<core::CimInstance*>::Iterator Quenx_SoftwareUpdateElementCapabilitiesClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp timing("Quenx_SoftwareUpdateElementCapabilitiesClass::getInstances");
    // Two first calls on two threads make one association.
    const utils::Mutex::AutoLocker lock(m_creation);
    if (m_instances.size() == 0) {
        // Neither end ever changes, so the association need not either.
        core::InstanceRange services(allServices());
        auto capabilities =
            core::GetCimBroker()->getInstances("Quenx_SoftwareInstallationServiceCapabilities", "");
        const core::CimInstance* service = onlyService(services);
        QUENX_ASSERT_TEXT(capabilities.size() == 1, __FILE__, __LINE__, "(int)capabilities.size() == 1");
        auto association = std::make_unique<Quenx_SoftwareUpdateElementCapabilities>();
        association->ManagedElement = dynamic_cast<const CIM_ManagedElement*>(service);
        association->Capabilities = dynamic_cast<const CIM_Capabilities*>(capabilities.first());
        association->Characteristics = {kDefault, kCurrent};
        m_instances.add(association.release());
    }
    return m_instances.getElements(false);
}
