// SPDX-License-Identifier: Apache-2.0
#include <gtest/gtest.h>

#include <atomic>
#include <functional>
#include <set>
#include <thread>

#include "Framework/Classes/CimBroker.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Utils/Os/Linux/linux.h"

namespace {

using core::CimPath;
using Names = std::set<std::string>;
using Texts = std::vector<std::string>;

class ModelTest : public test::UpdateTest {
  protected:
    std::size_t count(const char* className) const { return m_requests.enumerateInstances(className).size(); }
    /// As the provider has them, before the request layer joins equal ones.
    static std::size_t rows(const char* className) {
        return core::GetCimBroker()->getInstances(className, "").size();
    }
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

TEST_F(ModelTest, ServiceAndCapabilitiesAreServedOnceWithTheirValues) {
    struct Row {
        const char* className;
        Texts values;
    };
    for (const Row& row : std::vector<Row>{
             {"Quenx_SoftwareInstallationService",
              {"SystemCreationClassName!=Quenx_SoftwareInstallationService",
               "SystemName!=" + os::getHostname(), "CreationClassName!=Quenx_SoftwareInstallationService",
               "Name!=Quenx:FirmwareUpdate", "PrimaryOwnerName=Tarvel Corporation",
               "PrimaryOwnerContact=https://www.tarvel.example", "OperationalStatus=2",
               "Caption=Ethernet Firmware Update",
               "Description=Firmware Update Service for Tarvel(R) Ethernet Adapters"}},
             {"Quenx_SoftwareInstallationServiceCapabilities",
              {"SupportedAsynchronousActions=5, 3", "SupportedSynchronousActions=2",
               "SupportedTargetTypes=IMG_CLP, IMG_iSCSI, IMG_PXE, IMG_UEFI, IMG_FCoE",
               "SupportedExtendedResourceTypes=2", "CanAddToCollection=FALSE",
               "SupportedInstallOptions=3, 5, 32768", "SupportedURISchemes=3",
               "InstanceID!=Quenx:Capabilities@FirmwareUpdate",
               "ElementName=Capabilities for Ethernet Firmware Update",
               "Caption=Capabilities for Ethernet Firmware Update",
               "Description=Capabilities for Firmware Update Service for Tarvel(R) Ethernet Adapters"}},
         }) {
        test::SyslogCapture::clear();
        const auto instances = m_requests.enumerateInstances(row.className);
        ASSERT_EQ(instances.size(), 1U);
        EXPECT_EQ(valuesOf(instances[0]), row.values);
        core::CimBroker& broker = *core::GetCimBroker();
        EXPECT_EQ(broker.getInstances(row.className, "").first(),
                  broker.getInstances(row.className, "Software Update").first());
        EXPECT_EQ(test::SyslogCapture::count("\"create new instance\" (getInstances@" +
                                             std::string(row.className) + ".cpp:"),
                  1U);
    }
}

TEST_F(ModelTest, TheServiceDeclaresTheMethodsItHas) {
    Names methods;
    for (const core::MethodDeclaration& method :
         m_requests.getClass("Quenx_SoftwareInstallationService").at(1)->methods)
        methods.insert(method.name);
    EXPECT_EQ(methods, (Names{"CheckSoftwareIdentity", "InstallFromSoftwareIdentity", "InstallFromURI"}));
}

TEST_F(ModelTest, AssociationsJoinWhatBelongsTogetherInTheirRoles) {
    EXPECT_EQ(count("Quenx_OwningJobElement"), 0U);
    EXPECT_EQ(count("Quenx_AffectedJobElement"), 0U);
    const CimPath job = *install(goodImage(), "eth0").job;
    waitForEnd(job);
    const auto classes = [&](const CimPath& from, const char* association, const char* role,
                             const char* resultRole) {
        Names found;
        for (const CimPath& path : m_requests.associatorNames(from, {association, "", role, resultRole}))
            found.insert(path.getClassName());
        return found;
    };
    const std::string port = "Quenx_EthernetPort";
    const std::string card = "Quenx_PortController";
    EXPECT_EQ(classes(service(), "Quenx_OwningJobElement", "OwningElement", "OwnedElement"),
              Names{"Quenx_ConcreteJob"});
    EXPECT_EQ(classes(job, "CIM_AffectedJobElement", "AffectingElement", "AffectedElement"),
              (Names{port, card}));
    EXPECT_EQ(classes(service(), "CIM_ServiceAffectsElement", "AffectingElement", "AffectedElement"),
              (Names{port, card, "Quenx_SoftwareIdentity"}));
    EXPECT_EQ(classes(service(), "Quenx_ElementCapabilities", "ManagedElement", "Capabilities"),
              Names{"Quenx_SoftwareInstallationServiceCapabilities"});
    EXPECT_EQ(classes(service(), "Quenx_ElementConformsToProfile", "ManagedElement", "ConformantStandard"),
              Names{"Quenx_RegisteredProfile"});
    EXPECT_EQ(count("Quenx_OwningJobElement"), 1U);
    EXPECT_EQ(count("Quenx_AffectedJobElement"), 2U);
    EXPECT_EQ(count("Quenx_ElementConformsToProfile"), 1U);
    EXPECT_EQ(table("Quenx_ElementCapabilities", {"Characteristics"}), Texts{"2, 3"});
    // The image, and four ports, each with its card: the pair of ports that shares one names it once.
    EXPECT_EQ(rows("Quenx_ServiceAffectsElement"), 9U);
    EXPECT_EQ(count("Quenx_ServiceAffectsElement"), 8U);
}

TEST_F(ModelTest, ProfilesAreServedWithTheirReference) {
    EXPECT_EQ(table("Quenx_RegisteredProfile",
                    {"InstanceID", "RegisteredName", "RegisteredVersion", "RegisteredOrganization",
                     "SpecificationType", "Caption", "Description", "ElementName"}),
              (Texts{"Quenx:EthernetPort; Ethernet Port; 1.0.1; 2; 2; Ethernet Port; "
                     "Ethernet Port Profile for Tarvel(R) Ethernet Adapters; ",
                     "Quenx:SoftwareUpdate; Software Update; 1.0.0; 2; 2; Software Update; "
                     "Software Update Profile for Tarvel(R) Ethernet Adapters; "}));
    EXPECT_EQ(table("Quenx_ReferencedProfile", {"Antecedent", "Dependent"}),
              Texts{"root/cimv2:Quenx_RegisteredProfile.InstanceID=\"Quenx:EthernetPort\"; "
                    "root/cimv2:Quenx_RegisteredProfile.InstanceID=\"Quenx:SoftwareUpdate\""});
}

TEST_F(ModelTest, EveryReferenceOfTheModelResolves) {
    waitForEnd(*install(goodImage(), "eth0").job);
    Names reached;
    const std::function<void(const CimPath&)> walk = [&](const CimPath& path) {
        if (!reached.insert(path.toString()).second) return;
        EXPECT_TRUE(m_requests.getInstance(path).path.isSameObjectAs(path)) << path.toString();
        const auto associations = m_requests.references(path, {});
        EXPECT_FALSE(associations.empty()) << path.toString();
        for (const core::InstanceValue& association : associations)
            EXPECT_TRUE(m_requests.getInstance(association.path).path.isSameObjectAs(association.path));
        for (const CimPath& next : m_requests.associatorNames(path, {}))
            walk(next);
    };
    walk(service());
    // But for the adapter that cannot be updated.
    for (const char* className : {"Quenx_SoftwareInstallationServiceCapabilities", "Quenx_RegisteredProfile",
                                  "Quenx_ConcreteJob", "Quenx_EthernetPort", "Quenx_SoftwareIdentity"}) {
        for (const CimPath& path : m_requests.enumerateInstanceNames(className)) {
            const bool isUpdatable = path.toString().find("eth3") == std::string::npos;
            EXPECT_EQ(reached.contains(path.toString()), isUpdatable) << path.toString();
        }
    }
}

TEST_F(ModelTest, TwoEnumerationsAtOnceNeitherDoubleNorDropRows) {
    std::atomic<int> wrong{0};
    const auto enumerate = [&] {
        for (int i = 0; i < 100; ++i)
            if (rows("Quenx_ServiceAffectsElement") != 8) ++wrong;
    };
    std::thread other(enumerate);
    enumerate();
    other.join();
    EXPECT_EQ(wrong, 0);
}

}  // namespace
