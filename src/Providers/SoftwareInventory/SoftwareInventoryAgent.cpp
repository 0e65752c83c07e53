// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareInventory/Quenx_ElementSoftwareIdentity.h"
#include "Providers/SoftwareInventory/Quenx_EthernetPort.h"
#include "Providers/SoftwareInventory/Quenx_PortController.h"
#include "Providers/SoftwareInventory/Quenx_SoftwareIdentity.h"
#include "Providers/SoftwareInventory/Quenx_SoftwareIdentityResource.h"

namespace {

/// The provider that shows what there is: Ethernet ports and the cards that carry them, firmware in files and
/// on adapters.
class SoftwareInventoryAgent : public core::CimAgent {
  public:
    SoftwareInventoryAgent() : CimAgent(inventory::kProviderName) {
        core::GetCimBroker()->addAgent(this);
        m_classes.add(new Quenx_EthernetPortClass);
        m_classes.add(new Quenx_PortControllerClass);
        // One catalog, so that a file is read once for both.
        const auto catalog = std::make_shared<inventory::FirmwareCatalog>();
        m_classes.add(new Quenx_SoftwareIdentityClass(catalog));
        m_classes.add(new Quenx_SoftwareIdentityResourceClass(catalog));
        m_classes.add(new Quenx_ElementSoftwareIdentityClass);
        m_classes.add(new SingletonClass<Quenx_EthernetPortRegisteredProfile>(
            "RegisteredProfile::getInstances", __FILE__, __LINE__));
    }
    ~SoftwareInventoryAgent() override { leaveBroker(); }
};

// Loading the library is what registers the provider; unloading it takes it away.
const SoftwareInventoryAgent kAgent;

}  // namespace
