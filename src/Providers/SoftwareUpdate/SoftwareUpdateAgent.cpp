// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/SoftwareUpdateAgent.h"

#include "Framework/Classes/CimBroker.h"
#include "Providers/SoftwareUpdate/Quenx_AffectedJobElement.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJobClass.h"
#include "Providers/SoftwareUpdate/Quenx_OwningJobElement.h"
#include "Providers/SoftwareUpdate/Quenx_ServiceAffectsElement.h"
#include "Providers/SoftwareUpdate/Quenx_SoftwareInstallationService.h"
#include "Providers/SoftwareUpdate/Quenx_SoftwareInstallationServiceCapabilities.h"
#include "Providers/SoftwareUpdate/Quenx_SoftwareUpdateElementCapabilities.h"
#include "Providers/SoftwareUpdate/Quenx_SoftwareUpdateElementConformsToProfile.h"
#include "Providers/SoftwareUpdate/Quenx_SoftwareUpdateReferencedProfile.h"
#include "Providers/SoftwareUpdate/Quenx_SoftwareUpdateRegisteredProfile.h"

namespace core {

// Built before the agent at file scope, whatever the order of units.
__attribute__((init_priority(1000))) const std::string SoftwareUpdateAgent::CIM_PROVIDER_NAME =
    "Software Update";

SoftwareUpdateAgent::SoftwareUpdateAgent() : CimAgent(CIM_PROVIDER_NAME) {
    GetCimBroker()->addAgent(this);
    // In the order in which clients have always listed the classes.
    m_classes.add(new Quenx_SoftwareInstallationServiceClass);
    m_classes.add(new Quenx_SoftwareInstallationServiceCapabilitiesClass);
    m_classes.add(new Quenx_SoftwareUpdateRegisteredProfileClass);
    m_classes.add(new Quenx_SoftwareUpdateElementCapabilitiesClass);
    m_classes.add(new Quenx_SoftwareUpdateElementConformsToProfileClass);
    m_classes.add(new Quenx_SoftwareUpdateReferencedProfileClass);
    m_classes.add(new Quenx_ServiceAffectsElementClass);
    m_classes.add(new Quenx_ConcreteJobClass);
    m_classes.add(new Quenx_AffectedJobElementClass);
    m_classes.add(new Quenx_OwningJobElementClass);
}

SoftwareUpdateAgent::~SoftwareUpdateAgent() {
    // Here and not in the base: requests in flight still use what this class adds.
    leaveBroker();
}

}  // namespace core
