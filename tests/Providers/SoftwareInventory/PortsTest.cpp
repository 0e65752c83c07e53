// SPDX-License-Identifier: Apache-2.0
#include <gtest/gtest.h>

#include "Framework/Classes/CimBroker.h"
#include "Framework/Classes/InstanceList.h"
#include "Framework/Classes/RequestScope.h"
#include "MidAPI/ma.h"
#include "Providers/Schema/ProviderInterfaces.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"

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

TEST_F(PortsTest, StayTheSameObjectsWhileTheAdaptersDo) {
    const core::RequestScope scope;
    const auto before = objects();
    std::string changed = test::kTestAdapters;
    changed.replace(changed.find("link = false"), 12, "link = true ");
    changeAdapters(changed);
    EXPECT_EQ(table("Quenx_EthernetPort", {"EnabledState"}), (Rows{"2", "2", "2", "2", "2"}));
    EXPECT_EQ(objects(), before);
    EXPECT_FALSE(std::filesystem::exists(m_adapters.stateDirectory())) << "reading must not write";

    changed = test::kTestAdapters;
    changeAdapters(changed.replace(changed.find("0000:03:00.1"), 12, "0000:09:00.1"));
    EXPECT_EQ(table("Quenx_EthernetPort", {"OtherIdentifyingInfo"}).at(1),
              "09:00.1,1af4:1041,1af4:1041,Supported,simulator");
    EXPECT_EQ(table("Quenx_PortController", {"Name"}), (Rows{"03:00", "09:00", "04:00", "05:00", "06:00"}));

    changed = test::kTestAdapters;
    changeAdapters(changed.replace(changed.find("0000:04:00.0"), 12, "0001:03:00.0"));
    EXPECT_EQ(table("Quenx_EthernetPort", {"OtherIdentifyingInfo"}).at(2),
              "0001:03:00.0,10ec:8139,10ec:8139,Supported,simulator");
    EXPECT_EQ(table("Quenx_PortController", {"Name"}), (Rows{"03:00", "0001:03:00", "05:00", "06:00"}));
    int holders = 0;
    for (const core::CimInstance* each : objects()) {
        const auto* card = dynamic_cast<const inventory::PortController*>(each);
        if (card != nullptr && card->holds(ma::getPCIAddress("eth2"))) ++holders;
    }
    EXPECT_EQ(holders, 1) << "an update of the other card must not come to this one";
}

TEST_F(PortsTest, ThatDoNotAnswerHideNoOthers) {
    std::string described = test::kTestAdapters;
    for (const char* name : {"name = \"eth0\"", "name = \"eth4\""})
        described.insert(described.find(name), "description = \"Fast\", ");
    changeAdapters(described);
    EXPECT_EQ(objects().size(), 9U);  // all answer, and nothing of that may stay
    for (const char* adapter : {"eth0", "eth4"})
        m_adapters->injectFault(adapter, {.at = ma::Operation::Info});
    const Rows ports =
        table("Quenx_EthernetPort",
              {"Name", "EnabledState", "HealthState", "OperationalStatus", "OtherIdentifyingInfo",
               "Description", "PermanentAddress", "NetworkAddresses", "Speed"});
    EXPECT_EQ(ports.at(0), "eth0; 0; 0; 0; 03:00.0,Supported,simulator; ; ; ; ");
    EXPECT_EQ(ports.at(1),
              "eth1; 6; 5; 2; 03:00.1,1af4:1041,1af4:1041,Supported,simulator; ; 525400000011; "
              "525400000011; 10000000000");
    const Rows controllers = table("Quenx_PortController", {"Name", "EnabledState", "HealthState",
                                                            "OtherIdentifyingInfo", "Description"});
    EXPECT_EQ(controllers.front(), "03:00; 2; 5; 03:00,1af4:1041,1af4:1041,Supported,simulator; ");
    EXPECT_EQ(controllers.back(), "06:00; 0; 0; 06:00,Supported,simulator; ");

    m_adapters->injectFault("eth2", {.at = ma::Operation::PciAddress});
    EXPECT_EQ(table("Quenx_EthernetPort", {"Name"}), (Rows{"eth0", "eth1", "eth3", "eth4"}));
    EXPECT_EQ(table("Quenx_PortController", {"Name", "EnabledState"}),
              (Rows{"03:00; 2", "05:00; 2", "06:00; 0"}));
}

TEST_F(PortsTest, TellWhatTheirDriverTells) {
    m_backend->told = [](const std::string& adapter, ma::AdapterInfo& info) {
        if (adapter != "eth0") return;
        info.backend = "devlink";
        info.driver = "fastnic";
        info.serialNumber = "S1";
        info.boardSerialNumber = "B1";
        info.versions = {
            {.name = "board.id", .fixed = "K12"},
            {.name = "fw.mgmt", .running = "1.2.3", .stored = "1.3.0"},
            {.name = "fw.undi", .running = "v1 beta", .stored = "v1 beta", .type = utils::FirmwareType::PXE}};
        info.resetNeeded = ma::ResetNeeded::PowerCycle;
        info.interfaces = {"ens1", "ens2"};
        info.writer = "process 8 (x)";
    };
    EXPECT_EQ(table("Quenx_EthernetPort", {"OtherIdentifyingInfo"}).front(),
              "03:00.0,1af4:1041,1af4:1041,Supported,devlink,fastnic,S1,B1,K12,Busy,process 8 (x),Power "
              "Cycle,ens1,ens2");
    EXPECT_EQ(table("Quenx_EthernetPort", {"IdentifyingDescriptions"}).front(),
              "PCI Address,PCI Vendor and Device ID,PCI Subsystem Vendor and Device ID,Firmware Update,"
              "Adapter Backend,Driver,Serial Number,Board Serial Number,board.id,Update State,Updating "
              "Process,Reset Needed,"
              "Network Interface,Network Interface");
    EXPECT_EQ(table("Quenx_PortController", {"OtherIdentifyingInfo"}).front(),
              "03:00,1af4:1041,1af4:1041,Supported,devlink,fastnic,S1,B1,K12,Busy,process 8 (x),Power Cycle");

    // One identity for what runs, and one behind it for what waits. The texts stay, beside the numbers.
    Rows identities = table("Quenx_SoftwareIdentity",
                            {"InstanceID", "VersionString", "MajorVersion", "RevisionNumber", "TargetTypes",
                             "IdentityInfoValue", "Classifications", "OperationalStatus"});
    identities.resize(4);
    EXPECT_EQ(identities, (Rows{
                              "Quenx:eth0:IMG_PXE; v1 beta; ; ; IMG_PXE; 1af4:1041,1; 10,11; 2",
                              "Quenx:eth0:IMG_UEFI; IMG_UEFI 0; 0; ; IMG_UEFI; 1af4:1041,0; 10,2; 2",
                              "Quenx:eth0:fw.mgmt; 1.2.3; 1; 3; ; 1af4:1041,1.2.3; 10; 2",
                              "Quenx:eth0:fw.mgmt:stored; 1.3.0; 1; 0; ; 1af4:1041,1.3.0,Power Cycle; 10; 15",
                          }));
    Rows statuses = table("Quenx_ElementSoftwareIdentity", {"ElementSoftwareStatus"});
    statuses.resize(4);
    EXPECT_EQ(statuses, (Rows{"2", "2", "2", "3"}));
}

}  // namespace
