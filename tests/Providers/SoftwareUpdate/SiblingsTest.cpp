// SPDX-License-Identifier: Apache-2.0
// What the update provider makes of instances that another provider serves in the inventory's classes.
#include <gtest/gtest.h>

#include <stdexcept>

#include "Framework/Classes/CimBroker.h"
#include "Providers/Schema/CIM_EthernetPort.h"
#include "Providers/Schema/CIM_PortController.h"
#include "Providers/Schema/CIM_SoftwareIdentity.h"
#include "Providers/Schema/CIM_SoftwareIdentityResource.h"
#include "Providers/Schema/ProviderInterfaces.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"

namespace {

/// The operation that throws, and the bus whose ports the other controller holds.
std::string failing;
std::uint8_t heldBus = 0x77;

template <class T>
T answer(const char* operation, T value) {
    if (failing == operation) throw std::runtime_error(operation);
    return value;
}

/// Sets what names the device, as far as a path needs it.
template <class Device>
void setKeys(Device& device) {
    for (auto* key : {&device.SystemCreationClassName, &device.SystemName, &device.CreationClassName,
                      &device.DeviceID, &device.Name})
        *key = "other";
}

class OtherPort : public CIM_EthernetPort, public inventory::EthernetPort {
  public:
    OtherPort() { setKeys(*this); }
    std::string getClassName() const override { return "Quenx_EthernetPort"; }
    std::string getAdapterName() const override { return answer("getAdapterName", std::string("eth0")); }
    utils::PCIAddr getPCIAddress() const override { return answer("getPCIAddress", m_address); }

  private:
    const utils::PCIAddr m_address{0x77, 0, 0, false, ""};
};

/// Sits elsewhere than the ports that it holds.
class OtherController : public CIM_PortController, public inventory::PortController {
  public:
    OtherController() { setKeys(*this); }
    std::string getClassName() const override { return "Quenx_PortController"; }
    utils::PCIAddr getPCIAddress() const override { return {0x40, 0, 0, true, ""}; }
    bool holds(const utils::PCIAddr& address) const override {
        return answer("holds", address.bus == heldBus);
    }
};

class OtherIdentity : public CIM_SoftwareIdentity, public inventory::SoftwareIdentity {
  public:
    OtherIdentity() { InstanceID = "Other:image"; }
    std::string getClassName() const override { return "Quenx_SoftwareIdentity"; }
    std::string getIdentifier() const override { return answer("getIdentifier", std::string("unknown")); }
    int getTypeCode() const override { return answer("getTypeCode", static_cast<int>(FirmwareImage)); }
    utils::StringArray getTargetTypes() const override {
        return answer("getTargetTypes", utils::StringArray{"IMG_PXE"});
    }
};

/// The file of the other image.
class OtherResource : public CIM_SoftwareIdentityResource, public inventory::SoftwareIdentityResource {
  public:
    std::string getClassName() const override { return "Quenx_SoftwareIdentityResource"; }
    std::string getFirmwareFileID() const override { return "unknown"; }
    std::string getAccessInfo() const override { return answer("getAccessInfo", std::string("file:///no")); }
};

template <class T>
class OneInstance : public core::CimClass {
  public:
    OneInstance() { m_instances.add(new T); }
    std::string getClassName() override { return T().getClassName(); }
    utils::SafeList<core::CimInstance*>::Iterator getInstances() override {
        return m_instances.getElements(false);
    }

  private:
    core::InstanceList m_instances;
};

class OtherAgent : public core::CimAgent {
  public:
    OtherAgent() : CimAgent("Other") {
        core::GetCimBroker()->addAgent(this);
        m_classes.add(new OneInstance<OtherPort>);
        m_classes.add(new OneInstance<OtherController>);
        m_classes.add(new OneInstance<OtherIdentity>);
        m_classes.add(new OneInstance<OtherResource>);
    }
    ~OtherAgent() override { leaveBroker(); }
};

class SiblingsTest : public test::UpdateTest {
  protected:
    ~SiblingsTest() override {
        failing.clear();
        heldBus = 0x77;
    }

    test::CallResult check(const core::CimPath& source, const core::CimPath& target) const {
        return call("CheckSoftwareIdentity",
                    {test::pathArgument("Source", source),
                     test::pathArgument("Target", target),
                     {"Collection", core::CimValue::null(core::CimType::Reference)}});
    }

    const OtherAgent m_other;
    const core::CimPath m_port = port("other");
    const core::CimPath m_controller = pathNamed("Quenx_PortController", "other");
    const core::CimPath m_image{std::string("Quenx_SoftwareIdentity.InstanceID=\"Other:image\"")};
};

TEST_F(SiblingsTest, WhatTheyThrowIsAnUnspecifiedError) {
    struct Row {
        const char* operation;
        std::function<test::CallResult()> made;
        core::CimPath target;
    };
    const auto checked = [this] { return check(m_image, m_port); };
    const auto onController = [this] { return check(m_image, m_controller); };
    for (const Row& row : std::vector<Row>{
             {"getAdapterName", [this] { return install(goodImage(), m_port); }, m_port},
             {"getAdapterName", checked, m_port},
             {"getAdapterName", onController, m_controller},
             {"getPCIAddress", onController, m_controller},
             {"holds", onController, m_controller},
             {"getTypeCode", checked, m_port},
             {"getIdentifier", checked, m_port},
             {"getTargetTypes", checked, m_port},
         }) {
        SCOPED_TRACE(row.operation);
        failing = row.operation;
        test::SyslogCapture::clear();
        const test::CallResult result = row.made();
        EXPECT_EQ(result.returnValue, MethodReturn::UnspecifiedError);
        EXPECT_EQ(result.error, "");
        EXPECT_TRUE(logged("Unspecified Error for '" + row.target.toString() + "'"));
        EXPECT_EQ(claim(), "");
    }
    failing = "getAccessInfo";
    EXPECT_EQ(check(m_image, m_port).returnValue, MethodReturn::InvalidParameter);
    EXPECT_TRUE(test::SyslogCapture::contains("Could not obtain URI from the SoftwareIdentityResource"));
    failing.clear();
    EXPECT_EQ(check(m_image, m_port).returnValue, MethodReturn::InvalidParameter) << "its file is not there";
}

TEST_F(SiblingsTest, AControllerIsAskedWhatItHoldsWhereverItSits) {
    heldBus = 3;
    waitForEnd(*install(goodImage(), "eth1").job);
    const auto affected = [this](const char* association) {
        std::size_t count = 0;
        for (const core::InstanceValue& each : m_requests.enumerateInstances(association))
            count += text(each, "AffectedElement") == m_controller.toString() ? 1U : 0U;
        return count;
    };
    EXPECT_EQ(affected("Quenx_AffectedJobElement"), 1U);
    EXPECT_EQ(affected("Quenx_ServiceAffectsElement"), 1U);
}

}  // namespace
