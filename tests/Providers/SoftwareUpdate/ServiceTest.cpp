#include <dlfcn.h>
#include <gtest/gtest.h>

#include "Providers/SoftwareUpdate/Quenx_SoftwareInstallationService.h"
#include "Providers/SoftwareUpdate/Quenx_SoftwareInstallationServiceCapabilities.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Utils/Os/Linux/linux.h"

namespace {

class ServiceTest : public test::UpdateTest {
  protected:
    /// The values that are set, as "Name=value"; arrays joined by commas.
    static std::vector<std::string> valuesOf(const core::InstanceValue& instance) {
        std::vector<std::string> values;
        for (const core::PropertyValue& property : instance.properties) {
            if (property.value.isNull()) continue;
            std::string text;
            if (const auto* scalar = property.value.scalar())
                text = core::scalarText(property.value.type, *scalar);
            if (const auto* elements = property.value.elements()) {
                for (const auto& element : *elements) {
                    text += (text.empty() ? "" : ",") + core::scalarText(property.value.type, element);
                }
            }
            values.push_back(property.name + (property.isKey ? "!" : "") + "=" + text);
        }
        return values;
    }
};

TEST_F(ServiceTest, TheServiceIsServedOnceWithItsValues) {
    const auto services = m_requests.enumerateInstances("Quenx_SoftwareInstallationService");
    ASSERT_EQ(services.size(), 1U);
    EXPECT_EQ(
        valuesOf(services[0]),
        (std::vector<std::string>{
            "SystemCreationClassName!=Quenx_SoftwareInstallationService", "SystemName!=" + os::getHostname(),
            "CreationClassName!=Quenx_SoftwareInstallationService", "Name!=Quenx:FirmwareUpdate",
            "PrimaryOwnerName=Tarvel Corporation", "PrimaryOwnerContact=https://www.tarvel.example",
            "OperationalStatus=2", "Caption=Ethernet Firmware Update",
            "Description=Firmware Update Service for Tarvel(R) Ethernet Adapters"}));
    EXPECT_EQ(services[0].properties.size(), 29U);

    test::SyslogCapture::clear();
    const auto* first = core::GetCimBroker()->getInstances("Quenx_SoftwareInstallationService", "").first();
    EXPECT_EQ(
        core::GetCimBroker()->getInstances("Quenx_SoftwareInstallationService", "Software Update").first(),
        first);
    EXPECT_TRUE(logged("getInstance"));
    EXPECT_TRUE(logged("return 1"));
    EXPECT_FALSE(logged("create new instance"));
    EXPECT_TRUE(test::SyslogCapture::contains("time(SoftwareInstallationService::getInstances) = "));
}

TEST_F(ServiceTest, TheCapabilitiesAreServedOnceWithTheirValues) {
    const auto capabilities = m_requests.enumerateInstances("Quenx_SoftwareInstallationServiceCapabilities");
    ASSERT_EQ(capabilities.size(), 1U);
    EXPECT_EQ(valuesOf(capabilities[0]),
              (std::vector<std::string>{
                  "SupportedAsynchronousActions=5,3", "SupportedSynchronousActions=2",
                  "SupportedTargetTypes=IMG_CLP,IMG_iSCSI,IMG_PXE,IMG_UEFI,IMG_FCoE",
                  "SupportedExtendedResourceTypes=2", "CanAddToCollection=FALSE",
                  "SupportedInstallOptions=3,5,32768", "SupportedURISchemes=3",
                  "InstanceID!=Quenx:Capabilities@FirmwareUpdate",
                  "ElementName=Capabilities for Ethernet Firmware Update",
                  "Caption=Capabilities for Ethernet Firmware Update",
                  "Description=Capabilities for Firmware Update Service for Tarvel(R) Ethernet Adapters"}));
    EXPECT_EQ(capabilities[0].properties.size(), 17U);
    EXPECT_TRUE(test::SyslogCapture::contains("create new instance"));
}

TEST_F(ServiceTest, ClassesAreServedInTheirOrder) {
    std::vector<std::string> names;
    for (const core::ServedClass* served : m_agent->getClasses().getAll())
        names.push_back(served->name);
    EXPECT_EQ(names,
              (std::vector<std::string>{
                  "Quenx_SoftwareInstallationService", "Quenx_SoftwareInstallationServiceCapabilities",
                  "Quenx_RegisteredProfile", "Quenx_ElementCapabilities", "Quenx_ElementConformsToProfile",
                  "Quenx_ReferencedProfile", "Quenx_ServiceAffectsElement", "Quenx_ConcreteJob",
                  "Quenx_AffectedJobElement", "Quenx_OwningJobElement"}));
    EXPECT_EQ(m_agent->getProviderName(), "Software Update");
    EXPECT_FALSE(Quenx_SoftwareInstallationService::IsValueDefined(5, {}));
}

TEST_F(ServiceTest, MethodsAreDeclaredAndCalledByName) {
    EXPECT_THROW(m_requests.invokeMethod(service(), "InstallFromByteStream", {}), core::CimError);
    EXPECT_EQ(call("installfromuri", {}).error, "SMASHv2:EUnspecifiedError:Expected URI argument");
}

class LibraryTest : public ::testing::Test {
  protected:
    test::LogLevelGuard m_logLevel{0};
};

TEST_F(LibraryTest, UnloadsAndStartsAnewWhenLoadedAgain) {
    for (int round = 0; round < 2; ++round) {
        const test::ProviderLibrary library(QUENX_UPDATE_LIBRARY);
        EXPECT_TRUE(test::ProviderLibrary::isMapped(QUENX_UPDATE_LIBRARY));
        EXPECT_EQ(
            core::GetCimBroker()->getInstances("Quenx_SoftwareInstallationService", "Software Update").size(),
            1U);
        EXPECT_EQ(core::GetCimBroker()->getInstances("Quenx_ConcreteJob", "").size(), 0U);
        // Loading one provider starts no other.
        EXPECT_EQ(core::GetCimBroker()->getInstances("Quenx_EthernetPort", "").size(), 0U);
    }
    if (!test::ProviderLibrary::isUnloadable()) return;
    EXPECT_FALSE(test::ProviderLibrary::isMapped(QUENX_UPDATE_LIBRARY));
    EXPECT_EQ(core::GetCimBroker()->getInstances("Quenx_SoftwareInstallationService", "").size(), 0U);
}

}  // namespace
