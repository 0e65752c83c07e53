// SPDX-License-Identifier: Apache-2.0
#include <gtest/gtest.h>

#include "Framework/Classes/CimBroker.h"
#include "Framework/Classes/InstanceList.h"
#include "Framework/Classes/RequestScope.h"
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
              "09:00.1,1af4:1041,1af4:1041,Supported");
    EXPECT_EQ(table("Quenx_PortController", {"Name"}), (Rows{"03:00", "09:00", "04:00", "05:00", "06:00"}));
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
    EXPECT_EQ(ports.at(0), "eth0; 0; 0; 0; 03:00.0,Supported; ; ; ; ");
    EXPECT_EQ(ports.at(1),
              "eth1; 6; 5; 2; 03:00.1,1af4:1041,1af4:1041,Supported; ; 525400000011; "
              "525400000011; 10000000000");
    const Rows controllers = table("Quenx_PortController", {"Name", "EnabledState", "HealthState",
                                                            "OtherIdentifyingInfo", "Description"});
    EXPECT_EQ(controllers.front(), "03:00; 2; 5; 03:00,1af4:1041,1af4:1041,Supported; ");
    EXPECT_EQ(controllers.back(), "06:00; 0; 0; 06:00,Supported; ");

    m_adapters->injectFault("eth2", {.at = ma::Operation::PciAddress});
    EXPECT_EQ(table("Quenx_EthernetPort", {"Name"}), (Rows{"eth0", "eth1", "eth3", "eth4"}));
    EXPECT_EQ(table("Quenx_PortController", {"Name", "EnabledState"}),
              (Rows{"03:00; 2", "05:00; 2", "06:00; 0"}));
}

}  // namespace
