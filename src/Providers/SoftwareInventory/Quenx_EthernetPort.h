// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_EthernetPort.h"
#include "Providers/Schema/CIM_RegisteredProfile.h"
#include "Providers/Schema/ProviderInterfaces.h"
#include "Providers/SoftwareInventory/Devices.h"

/// One port (one PCI function) of an Ethernet adapter.
class Quenx_EthernetPort final : public CIM_EthernetPort, public inventory::EthernetPort {
  public:
    static constexpr core::CimClassInfo classInfo{"Quenx_EthernetPort", &CIM_EthernetPort::classInfo};

    explicit Quenx_EthernetPort(inventory::Port port);
    std::string getClassName() const override { return classInfo.name; }

    /// The adapter name.
    virtual std::string getUniqId() const { return m_port.adapter; }
    /// Asks the adapter, then sets every value that can change.
    virtual void refresh();

    std::string getAdapterName() const override { return m_port.adapter; }
    utils::PCIAddr getPCIAddress() const override { return m_port.address; }

  private:
    void setLink(const std::optional<ma::AdapterInfo>& info);

    const inventory::Port m_port;
};

/// Serves a port for each adapter name.
class Quenx_EthernetPortClass : public CachedClass<Quenx_EthernetPort, inventory::Port> {
  public:
    core::InstanceList::Iterator getInstances() override;
    core::CimInstance* findInstance(const core::CimPath& path);
};

/// Says that the ports are modelled as DMTF DSP1014 has it. Served as "Quenx_RegisteredProfile", a class that
/// other providers serve too.
class Quenx_EthernetPortRegisteredProfile : public CIM_RegisteredProfile {
  public:
    static constexpr core::CimClassInfo classInfo{"Quenx_RegisteredProfile",
                                                  &CIM_RegisteredProfile::classInfo};

    std::string getClassName() const override { return classInfo.name; }

    virtual void refresh();
};
