#include "Providers/InventoryInterfaces.h"
#include "Providers/SoftwareInventory/InventoryTest.h"
#include "Support/SimulatedAdapters.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Utils.h"

namespace {

using Rows = std::vector<std::string>;

class Ports : public InventoryTest {
  protected:
    test::SimulatedAdapters adapters;
};

TEST_F(Ports, ShowWhatTheAdapterSaysOfItself) {
    EXPECT_EQ(table("Quenx_EthernetPort", {"Name", "PermanentAddress", "NetworkAddresses", "Speed",
                                           "EnabledState", "LinkTechnology", "OperationalStatus"}),
              (Rows{
                  "eth0; 525400000010; 525400000010; 10000000000; 2; 2; 2",
                  "eth1; 525400000011; 525400000011; 10000000000; 6; 2; 2",
                  "eth2; 525400000012; 525400000012; 100000000; 2; 2; 2",
                  "eth3; 525400000013; 525400000013; -; 2; 2; 2",
                  "eth4; 525400000014; 525400000014; -; 2; 2; 2",
              }));
}

TEST_F(Ports, AreIdentifiedByAddressIdsAndUpdatability) {
    EXPECT_EQ(table("Quenx_EthernetPort", {"OtherIdentifyingInfo"}),
              (Rows{
                  "03:00.0, 1af4:1041, 1af4:1041, Supported",
                  "03:00.1, 1af4:1041, 1af4:1041, Supported",
                  "04:00.0, 10ec:8139, 10ec:8139, Supported",
                  "05:00.0, 1022:2000, 1022:2000, Not Supported",
                  "06:00.0, 15ad:07b0, 15ad:07b0, Supported",
              }));
    EXPECT_EQ(table("Quenx_EthernetPort", {"IdentifyingDescriptions"}).front(),
              "PCI Address, PCI Vendor and Device ID, PCI Subsystem Vendor and Device ID, Firmware Update");
}

TEST_F(Ports, ShareAControllerWhenTheyShareACard) {
    EXPECT_EQ(
        table("Quenx_PortController", {"Name", "ControllerType", "EnabledState", "OtherIdentifyingInfo"}),
        (Rows{
            "03:00; 2; 2; 03:00, 1af4:1041, 1af4:1041, Supported",
            "04:00; 2; 2; 04:00, 10ec:8139, 10ec:8139, Supported",
            "05:00; 2; 2; 05:00, 1022:2000, 1022:2000, Not Supported",
            "06:00; 2; 2; 06:00, 15ad:07b0, 15ad:07b0, Supported",
        }));
}

TEST_F(Ports, AnswerToTheirPaths) {
    const std::string system =
        R"(SystemCreationClassName="CIM_ComputerSystem",SystemName=")" + os::getHostname() + R"(",)";
    const auto names = requests.enumerateInstanceNames("CIM_LogicalDevice");
    ASSERT_EQ(names.size(), 9U);
    EXPECT_EQ(names.front().toString(),
              "root/cimv2:Quenx_EthernetPort." + system +
                  R"(CreationClassName="Quenx_EthernetPort",DeviceID="Quenx:eth0")");
    EXPECT_EQ(names.back().toString(),
              "root/cimv2:Quenx_PortController." + system +
                  R"(CreationClassName="Quenx_PortController",DeviceID="Quenx:06:00")");
    for (const core::CimPath& name : names)
        EXPECT_TRUE(requests.getInstance(name).path.names(name));
}

TEST_F(Ports, TellOtherProvidersWhatInstallingNeeds) {
    const core::RequestScope scope;
    std::string found;
    for (const auto* controller : find<inventory::PortController>("Quenx_PortController")) {
        found += utils::formatPCIAddr(controller->getPCIAddress()) + ":";
        for (const auto* port : find<inventory::EthernetPort>("Quenx_EthernetPort")) {
            if (controller->holds(port->getPCIAddress())) found += " " + port->getAdapterName();
        }
        found += "\n";
    }
    EXPECT_EQ(found, "03:00: eth0 eth1\n04:00: eth2\n05:00: eth3\n06:00: eth4\n");
}

TEST_F(Ports, StayTheSameObjectsWhileTheAdaptersDo) {
    const char* const other = R"(
[[adapter]]
name = "eth1"
pci_address = "0000:09:00.1"
pci_id = "1af4:1041"
mac = "52:54:00:00:00:99"
)";
    const core::RequestScope scope;
    const auto ports = find<inventory::EthernetPort>("Quenx_EthernetPort");
    const auto controllers = find<inventory::PortController>("Quenx_PortController");
    EXPECT_EQ(find<inventory::EthernetPort>("Quenx_EthernetPort"), ports);
    EXPECT_EQ(find<inventory::PortController>("Quenx_PortController"), controllers);

    adapters.folder().write("adapters.toml", other);
    adapters.restart();
    EXPECT_EQ(table("Quenx_EthernetPort", {"Name", "OtherIdentifyingInfo"}),
              Rows{"eth1; 09:00.1, 1af4:1041, 1af4:1041, Supported"});
    EXPECT_EQ(table("Quenx_PortController", {"Name"}), Rows{"09:00"});
    EXPECT_EQ(ports.front()->getAdapterName(), "eth0") << "held by the request that has enumerated it";
}

TEST_F(Ports, ShowNewValuesOfTheSameAdapters) {
    std::string changed = test::TEST_ADAPTERS;
    changed.replace(changed.find("link = false"), 12, "link = true ");
    const core::RequestScope scope;
    const auto ports = find<inventory::EthernetPort>("Quenx_EthernetPort");
    adapters.folder().write("adapters.toml", changed);
    adapters.restart();
    EXPECT_EQ(table("Quenx_EthernetPort", {"EnabledState"}), (Rows{"2", "2", "2", "2", "2"}));
    EXPECT_EQ(find<inventory::EthernetPort>("Quenx_EthernetPort"), ports);
}

/// Adapters of which one does not answer, and another goes away while they are enumerated.
class Unwell : public ma::Simulator {
  public:
    using ma::Simulator::Simulator;

    ma::AdapterInfo getAdapterInfo(const std::string& adapter) override {
        if (adapter == "eth0") throw ma::AdapterError("No answer from eth0.");
        return Simulator::getAdapterInfo(adapter);
    }
    utils::PCIAddr getPCIAddress(const std::string& adapter) override {
        if (adapter == "eth2") throw ma::AdapterError("No such adapter: eth2.");
        return Simulator::getPCIAddress(adapter);
    }
};

TEST_F(Ports, ThatDoNotAnswerHideNoOthers) {
    EXPECT_EQ(table("Quenx_EthernetPort", {"Name"}).size(), 5U);
    ma::setBackend(std::make_shared<Unwell>(adapters.descriptionFile(), adapters.stateDirectory()));
    EXPECT_EQ(table("Quenx_EthernetPort", {"Name", "PermanentAddress", "Speed", "EnabledState", "HealthState",
                                           "OtherIdentifyingInfo"}),
              (Rows{
                  "eth0; -; -; 0; 0; 03:00.0, Supported",
                  "eth1; 525400000011; 10000000000; 6; 5; 03:00.1, 1af4:1041, 1af4:1041, Supported",
                  "eth3; 525400000013; -; 2; 5; 05:00.0, 1022:2000, 1022:2000, Not Supported",
                  "eth4; 525400000014; -; 2; 5; 06:00.0, 15ad:07b0, 15ad:07b0, Supported",
              }));
    EXPECT_EQ(table("Quenx_PortController", {"Name", "EnabledState"}),
              (Rows{"03:00; 2", "05:00; 2", "06:00; 2"}));
}

TEST(SoftwareInventory, GoesWithItsLibrary) {
    if (!test::ProviderLibrary::isUnloadable()) GTEST_SKIP() << "stays mapped in a sanitizer build";
    const test::SimulatedAdapters adapters;
    const core::CimRequests requests{"root/cimv2"};
    for (int round = 0; round < 2; round++) {
        {
            const test::ProviderLibrary library(QUENX_SOFTWARE_INVENTORY);
            EXPECT_EQ(requests.enumerateInstances("Quenx_EthernetPort").size(), 5U);
            EXPECT_EQ(core::GetCimBroker()->getInstances("Quenx_EthernetPort", "Software Inventory").size(),
                      5U);
        }
        EXPECT_THROW(requests.enumerateInstances("Quenx_EthernetPort"), core::CimError);
        EXPECT_FALSE(test::ProviderLibrary::isMapped(QUENX_SOFTWARE_INVENTORY));
    }
}

}  // namespace
