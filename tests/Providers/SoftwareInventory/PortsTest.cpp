// SPDX-License-Identifier: Apache-2.0
#include <gtest/gtest.h>

#include "Framework/Classes/CimBroker.h"
#include "Framework/Classes/InstanceList.h"
#include "Framework/Classes/RequestScope.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Utils/Os/Linux/linux.h"

namespace {

using Rows = std::vector<std::string>;

class PortsTest : public test::UpdateTest {
  protected:
    /// The instances of both classes as the broker hands them out.
    static std::vector<core::CimInstance*> objects() {
        std::vector<core::CimInstance*> found;
        for (const char* className : {"Quenx_EthernetPort", "Quenx_PortController"}) {
            for (core::CimInstance* each :
                 core::InstanceRange(core::GetCimBroker()->getInstances(className, "")))
                found.push_back(each);
        }
        return found;
    }
    void changeAdapters(const std::string& description) {
        m_adapters.folder().write("adapters.toml", description);
        m_adapters.restart();
    }
};

TEST_F(PortsTest, ShowWhatTheAdapterSaysOfItself) {
    EXPECT_EQ(table("Quenx_EthernetPort", {"Name", "PermanentAddress", "NetworkAddresses", "Speed",
                                           "EnabledState", "LinkTechnology", "OperationalStatus"}),
              (Rows{
                  "eth0; 525400000010; 525400000010; 10000000000; 2; 2; 2",
                  "eth1; 525400000011; 525400000011; 10000000000; 6; 2; 2",
                  "eth2; 525400000012; 525400000012; 100000000; 2; 2; 2",
                  "eth3; 525400000013; 525400000013; ; 2; 2; 2",
                  "eth4; 525400000014; 525400000014; ; 2; 2; 2",
              }));
    const Rows identified = table("Quenx_EthernetPort", {"OtherIdentifyingInfo", "IdentifyingDescriptions"});
    const std::string descriptions =
        "PCI Address, PCI Vendor and Device ID, PCI Subsystem Vendor and Device ID, Firmware Update";
    EXPECT_EQ(identified.at(1), "03:00.1, 1af4:1041, 1af4:1041, Supported; " + descriptions);
    EXPECT_EQ(identified.at(3), "05:00.0, 1022:2000, 1022:2000, Not Supported; " + descriptions);
    const std::string system = "CIM_ComputerSystem; " + os::getHostname();
    const Rows keys = table("CIM_LogicalDevice",
                            {"SystemCreationClassName", "SystemName", "CreationClassName", "DeviceID"});
    EXPECT_EQ(keys.front(), system + "; Quenx_EthernetPort; Quenx:eth0");
    EXPECT_EQ(keys.back(), system + "; Quenx_PortController; Quenx:06:00");
    // The ports of a card share its controller.
    EXPECT_EQ(
        table("Quenx_PortController", {"Name", "ControllerType", "EnabledState", "OtherIdentifyingInfo"}),
        (Rows{
            "03:00; 2; 2; 03:00, 1af4:1041, 1af4:1041, Supported",
            "04:00; 2; 2; 04:00, 10ec:8139, 10ec:8139, Supported",
            "05:00; 2; 2; 05:00, 1022:2000, 1022:2000, Not Supported",
            "06:00; 2; 2; 06:00, 15ad:07b0, 15ad:07b0, Supported",
        }));
    EXPECT_FALSE(std::filesystem::exists(m_adapters.stateDirectory())) << "reading must not write";
}

TEST_F(PortsTest, StayTheSameObjectsWhileTheAdaptersDo) {
    const core::RequestScope scope;
    const auto before = objects();
    std::string changed = test::kTestAdapters;
    changed.replace(changed.find("link = false"), 12, "link = true ");
    changeAdapters(changed);
    EXPECT_EQ(table("Quenx_EthernetPort", {"EnabledState"}), (Rows{"2", "2", "2", "2", "2"}));
    EXPECT_EQ(objects(), before);

    changed = test::kTestAdapters;
    changeAdapters(changed.replace(changed.find("0000:03:00.1"), 12, "0000:09:00.1"));
    EXPECT_EQ(table("Quenx_EthernetPort", {"OtherIdentifyingInfo"}).at(1),
              "09:00.1, 1af4:1041, 1af4:1041, Supported");
    EXPECT_EQ(table("Quenx_PortController", {"Name"}), (Rows{"03:00", "09:00", "04:00", "05:00", "06:00"}));
}

TEST_F(PortsTest, ThatDoNotAnswerHideNoOthers) {
    m_adapters->injectFault("eth0", {.at = ma::Operation::Info});
    m_adapters->injectFault("eth2", {.at = ma::Operation::PciAddress});
    EXPECT_EQ(table("Quenx_EthernetPort", {"Name", "PermanentAddress", "Speed", "EnabledState", "HealthState",
                                           "OtherIdentifyingInfo"}),
              (Rows{
                  "eth0; ; ; 0; 0; 03:00.0, Supported",
                  "eth1; 525400000011; 10000000000; 6; 5; 03:00.1, 1af4:1041, 1af4:1041, Supported",
                  "eth3; 525400000013; ; 2; 5; 05:00.0, 1022:2000, 1022:2000, Not Supported",
                  "eth4; 525400000014; ; 2; 5; 06:00.0, 15ad:07b0, 15ad:07b0, Supported",
              }));
    EXPECT_EQ(table("Quenx_PortController", {"Name", "EnabledState"}),
              (Rows{"03:00; 2", "05:00; 2", "06:00; 2"}));
}

}  // namespace
