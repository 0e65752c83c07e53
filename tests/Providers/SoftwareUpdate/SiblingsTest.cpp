// SPDX-License-Identifier: Apache-2.0
// What the update provider makes of a controller that another provider serves.
#include <gtest/gtest.h>

#include <stdexcept>

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_PortController.h"
#include "Providers/Schema/ProviderInterfaces.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"

namespace {

/// Sits elsewhere than the ports that it holds: eth0 and eth1.
class OtherController : public CIM_PortController, public inventory::PortController {
  public:
    static constexpr core::CimClassInfo classInfo{"Quenx_PortController", &CIM_PortController::classInfo};
    static inline bool isFailing = false;

    OtherController() {
        for (auto* key : {&SystemCreationClassName, &SystemName, &CreationClassName, &DeviceID, &Name})
            *key = "other";
    }
    std::string getClassName() const override { return classInfo.name; }
    void refresh() {}
    utils::PCIAddr getPCIAddress() const override { return {0x40, 0, 0, true, ""}; }
    bool holds(const utils::PCIAddr& address) const override {
        if (isFailing) throw std::runtime_error("out of order");
        return address.bus == 3;
    }
};

class OtherAgent : public core::CimAgent {
  public:
    OtherAgent() : CimAgent("Other") {
        core::GetCimBroker()->addAgent(this);
        m_classes.add(new SingletonClass<OtherController>("Other", __FILE__, __LINE__));
    }
    ~OtherAgent() override { leaveBroker(); }
};

class SiblingsTest : public test::UpdateTest {
  protected:
    ~SiblingsTest() override { OtherController::isFailing = false; }

    const OtherAgent m_other;
    const core::CimPath m_controller = pathNamed("Quenx_PortController", "other");
};

TEST_F(SiblingsTest, WhatTheyThrowIsAnUnspecifiedError) {
    OtherController::isFailing = true;
    const test::CallResult result = install(goodImage(), m_controller);
    EXPECT_EQ(result.returnValue, MethodReturn::UnspecifiedError);
    EXPECT_EQ(result.error, "");
    EXPECT_TRUE(test::SyslogCapture::contains("Unspecified Error for '" + m_controller.toString() + "'"));
    EXPECT_EQ(claim(), "");
}

TEST_F(SiblingsTest, AControllerIsAskedWhatItHoldsWhereverItSits) {
    waitForEnd(*install(goodImage(), m_controller).job);
    EXPECT_EQ(test::componentsOf("eth0"), "IMG_PXE 2, IMG_UEFI 1");
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
