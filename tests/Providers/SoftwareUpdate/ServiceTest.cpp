#include <gtest/gtest.h>

#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Utils/Os/Linux/linux.h"

namespace {

using Texts = std::vector<std::string>;

class ServiceTest : public test::UpdateTest {
  protected:
    /// The values that are set, as "Name=value", with ! after the name of a key.
    static Texts valuesOf(const core::InstanceValue& instance) {
        Texts values;
        for (const core::PropertyValue& property : instance.properties) {
            if (property.value.isNull()) continue;
            values.push_back(property.name + (property.isKey ? "!=" : "=") +
                             text(instance, property.name.c_str()));
        }
        return values;
    }
};

TEST_F(ServiceTest, TheServiceIsServedOnceWithItsValues) {
    const auto services = m_requests.enumerateInstances("Quenx_SoftwareInstallationService");
    ASSERT_EQ(services.size(), 1U);
    EXPECT_EQ(valuesOf(services[0]),
              (Texts{"SystemCreationClassName!=Quenx_SoftwareInstallationService",
                     "SystemName!=" + os::getHostname(),
                     "CreationClassName!=Quenx_SoftwareInstallationService", "Name!=Quenx:FirmwareUpdate",
                     "PrimaryOwnerName=Tarvel Corporation", "PrimaryOwnerContact=https://www.tarvel.example",
                     "OperationalStatus=2", "Caption=Ethernet Firmware Update",
                     "Description=Firmware Update Service for Tarvel(R) Ethernet Adapters"}));
    EXPECT_EQ(services[0].properties.size(), 29U);

    test::SyslogCapture::clear();
    core::CimBroker& broker = *core::GetCimBroker();
    EXPECT_EQ(broker.getInstances("Quenx_SoftwareInstallationService", "").first(),
              broker.getInstances("Quenx_SoftwareInstallationService", "Software Update").first());
    EXPECT_TRUE(logged("getInstance"));
    EXPECT_TRUE(logged("return 1"));
    EXPECT_FALSE(logged("create new instance"));
    EXPECT_TRUE(test::SyslogCapture::contains("time(SoftwareInstallationService::getInstances) = "));
}

TEST_F(ServiceTest, TheCapabilitiesAreServedOnceWithTheirValues) {
    const auto capabilities = m_requests.enumerateInstances("Quenx_SoftwareInstallationServiceCapabilities");
    ASSERT_EQ(capabilities.size(), 1U);
    EXPECT_EQ(
        valuesOf(capabilities[0]),
        (Texts{"SupportedAsynchronousActions=5, 3", "SupportedSynchronousActions=2",
               "SupportedTargetTypes=IMG_CLP, IMG_iSCSI, IMG_PXE, IMG_UEFI, IMG_FCoE",
               "SupportedExtendedResourceTypes=2", "CanAddToCollection=FALSE",
               "SupportedInstallOptions=3, 5, 32768", "SupportedURISchemes=3",
               "InstanceID!=Quenx:Capabilities@FirmwareUpdate",
               "ElementName=Capabilities for Ethernet Firmware Update",
               "Caption=Capabilities for Ethernet Firmware Update",
               "Description=Capabilities for Firmware Update Service for Tarvel(R) Ethernet Adapters"}));
    EXPECT_EQ(capabilities[0].properties.size(), 17U);
    EXPECT_TRUE(test::SyslogCapture::contains("create new instance"));
}

TEST_F(ServiceTest, ClassesAreServedInTheirOrder) {
    Texts names;
    for (const core::ServedClass* served : m_agent->getClasses().getAll())
        names.push_back(served->name);
    EXPECT_EQ(names,
              (Texts{"Quenx_SoftwareInstallationService", "Quenx_SoftwareInstallationServiceCapabilities",
                     "Quenx_RegisteredProfile", "Quenx_ElementCapabilities", "Quenx_ElementConformsToProfile",
                     "Quenx_ReferencedProfile", "Quenx_ServiceAffectsElement", "Quenx_ConcreteJob",
                     "Quenx_AffectedJobElement", "Quenx_OwningJobElement"}));
}

}  // namespace
