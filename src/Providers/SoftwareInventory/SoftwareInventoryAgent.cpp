// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareInventory/SoftwareInventoryAgent.h"

#include "Framework/Classes/CimBroker.h"
#include "Providers/SoftwareInventory/Quenx_ElementSoftwareIdentity.h"
#include "Providers/SoftwareInventory/Quenx_EthernetPort.h"
#include "Providers/SoftwareInventory/Quenx_EthernetPortRegisteredProfile.h"
#include "Providers/SoftwareInventory/Quenx_PortController.h"
#include "Providers/SoftwareInventory/Quenx_SoftwareIdentity.h"
#include "Providers/SoftwareInventory/Quenx_SoftwareIdentityResource.h"

namespace core {

constinit const char* const SoftwareInventoryAgent::CIM_PROVIDER_NAME = "Software Inventory";

SoftwareInventoryAgent::SoftwareInventoryAgent() : CimAgent(CIM_PROVIDER_NAME) {
    GetCimBroker()->addAgent(this);
    m_classes.add(new Quenx_EthernetPortClass);
    m_classes.add(new Quenx_PortControllerClass);
    const auto catalog = std::make_shared<inventory::FirmwareCatalog>();
    m_classes.add(new Quenx_SoftwareIdentityClass(catalog));
    m_classes.add(new Quenx_SoftwareIdentityResourceClass(catalog));
    m_classes.add(new Quenx_ElementSoftwareIdentityClass);
    m_classes.add(new Quenx_EthernetPortRegisteredProfileClass);
}

SoftwareInventoryAgent::~SoftwareInventoryAgent() {
    leaveBroker();
}

}  // namespace core

namespace {

// Loading the library is what registers the provider; unloading it takes it away.
const core::SoftwareInventoryAgent agent;

}  // namespace
