// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_PortController.h"
#include "Providers/Schema/ProviderInterfaces.h"
#include "Providers/SoftwareInventory/Devices.h"

namespace inventory {

/// A card: the ports that share a PCI domain, bus and device. Never without a port.
struct Card {
    std::vector<Port> ports;

    bool operator==(const Card&) const = default;
};

/// The ports by card, in the order of each card's first port.
std::vector<Card> groupByCard(const std::vector<Port>& ports);

}  // namespace inventory

/// One card with the ports that are its PCI functions.
class Quenx_PortController final : public CIM_PortController, public inventory::PortController {
  public:
    static constexpr core::CimClassInfo classInfo{"Quenx_PortController", &CIM_PortController::classInfo};

    explicit Quenx_PortController(inventory::Card card);
    std::string getClassName() const override { return classInfo.name; }

    /// Bus and device, as "3b:00"; in other domains than the first as "0001:3b:00".
    virtual std::string getUniqId() const;
    /// Asks the card's ports, then sets every value that can change.
    virtual void refresh();

    utils::PCIAddr getPCIAddress() const override;
    bool holds(const utils::PCIAddr& address) const override;
    bool holdsOneDevice() const override { return true; }

  private:
    const inventory::Card m_card;
};

/// Serves a controller for each card.
class Quenx_PortControllerClass : public CachedClass<Quenx_PortController, inventory::Card> {
  public:
    core::InstanceList::Iterator getInstances() override;
    core::CimInstance* findInstance(const core::CimPath& path);
};
