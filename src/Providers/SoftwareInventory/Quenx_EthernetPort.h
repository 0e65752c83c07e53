// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_EthernetPort.h"
#include "Providers/Schema/InventoryInterfaces.h"
#include "Providers/SoftwareInventory/Devices.h"

/// One port (one PCI function) of an Ethernet adapter.
class Quenx_EthernetPort : public CIM_EthernetPort, public inventory::EthernetPort {
  public:
    static const core::CimClassInfo classInfo;

    explicit Quenx_EthernetPort(inventory::Port port);
    std::string getClassName() const override;
    ~Quenx_EthernetPort() override;

    /// The adapter name.
    virtual std::string getUniqId() const;
    /// Asks the adapter, then sets every value that can change.
    virtual void refresh();

    std::string getAdapterName() const override;
    utils::PCIAddr getPCIAddress() const override;

  private:
    void setLink(const std::optional<ma::AdapterInfo>& info);

    const inventory::Port m_port;
};

/// Serves a port for each adapter name.
class Quenx_EthernetPortClass : public CachedClass<Quenx_EthernetPort, inventory::Port> {
  public:
    utils::SafeList<core::CimInstance*>::Iterator getInstances() override;
};
