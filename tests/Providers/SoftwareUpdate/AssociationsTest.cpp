#include <gtest/gtest.h>

#include <atomic>
#include <functional>
#include <set>
#include <thread>

#include "Providers/SoftwareUpdate/UpdateTest.h"

namespace {

using core::CimPath;
using Names = std::set<std::string>;

class AssociationsTest : public test::UpdateTest {
  protected:
    std::size_t count(const char* className) const { return m_requests.enumerateInstances(className).size(); }
    /// As the provider has them, before the request layer joins equal ones.
    static std::size_t rows(const char* className) {
        return core::GetCimBroker()->getInstances(className, "").size();
    }
};

TEST_F(AssociationsTest, JoinWhatBelongsTogetherInTheirRoles) {
    EXPECT_EQ(count("Quenx_OwningJobElement"), 0U);
    EXPECT_EQ(count("Quenx_AffectedJobElement"), 0U);
    const auto result = install(goodImage(), "eth0");
    ASSERT_TRUE(result.job);
    waitForEnd(*result.job);
    struct Row {
        const char* association;
        CimPath from;
        const char* role;
        const char* resultRole;
        Names classes;
        std::size_t count;
    };
    for (const Row& row : std::vector<Row>{
             {"Quenx_OwningJobElement", service(), "OwningElement", "OwnedElement", {"Quenx_ConcreteJob"}, 1},
             {"Quenx_ElementCapabilities",
              service(),
              "ManagedElement",
              "Capabilities",
              {"Quenx_SoftwareInstallationServiceCapabilities"},
              1},
             {"Quenx_ElementConformsToProfile",
              service(),
              "ManagedElement",
              "ConformantStandard",
              {"Quenx_RegisteredProfile"},
              1},
             // Four ports of three cards, and the image: the pair of ports that shares a card names it once.
             {"Quenx_ServiceAffectsElement",
              service(),
              "AffectingElement",
              "AffectedElement",
              {"Quenx_EthernetPort", "Quenx_PortController", "Quenx_SoftwareIdentity"},
              8},
             {"Quenx_AffectedJobElement",
              *result.job,
              "AffectingElement",
              "AffectedElement",
              {"Quenx_EthernetPort", "Quenx_PortController"},
              2},
         }) {
        Names classes;
        for (const CimPath& path :
             m_requests.associatorNames(row.from, {row.association, "", row.role, row.resultRole}))
            classes.insert(path.getClassName());
        EXPECT_EQ(classes, row.classes) << row.association;
        EXPECT_EQ(count(row.association), row.count) << row.association;
    }
    EXPECT_EQ(rows("Quenx_ServiceAffectsElement"), 9U);
    EXPECT_EQ(table("Quenx_ElementCapabilities", {"Characteristics"}), std::vector<std::string>{"2, 3"});
}

TEST_F(AssociationsTest, ProfilesAreServedWithTheirReference) {
    EXPECT_EQ(
        table("Quenx_RegisteredProfile",
              {"InstanceID", "RegisteredName", "RegisteredVersion", "RegisteredOrganization",
               "SpecificationType", "Caption", "Description", "ElementName"}),
        (std::vector<std::string>{"Quenx:EthernetPort; Ethernet Port; 1.0.1; 2; 2; Ethernet Port; "
                                  "Ethernet Port Profile for Tarvel(R) Ethernet Adapters; ",
                                  "Quenx:SoftwareUpdate; Software Update; 1.0.0; 2; 2; Software Update; "
                                  "Software Update Profile for Tarvel(R) Ethernet Adapters; "}));
    EXPECT_EQ(
        table("Quenx_ReferencedProfile", {"Antecedent", "Dependent"}),
        std::vector<std::string>{"root/cimv2:Quenx_RegisteredProfile.InstanceID=\"Quenx:EthernetPort\"; "
                                 "root/cimv2:Quenx_RegisteredProfile.InstanceID=\"Quenx:SoftwareUpdate\""});
}

TEST_F(AssociationsTest, EveryReferenceOfTheModelResolves) {
    waitForEnd(*install(goodImage(), "eth0").job);
    Names reached;
    const std::function<void(const CimPath&)> walk = [&](const CimPath& path) {
        if (!reached.insert(path.toString()).second) return;
        EXPECT_TRUE(m_requests.getInstance(path).path.names(path)) << path.toString();
        const auto associations = m_requests.references(path, {});
        EXPECT_FALSE(associations.empty()) << path.toString();
        for (const core::InstanceValue& association : associations)
            EXPECT_TRUE(m_requests.getInstance(association.path).path.names(association.path));
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

TEST_F(AssociationsTest, AFailedAssertionLeavesTheListEmpty) {
    install(goodImage(), "eth0");
    EXPECT_EQ(count("Quenx_OwningJobElement"), 1U);
    {
        const core::SoftwareUpdateAgent second;  // now there are two services
        EXPECT_THROW(count("Quenx_OwningJobElement"), core::CimError);
        EXPECT_THROW(count("Quenx_ServiceAffectsElement"), core::CimError);
        EXPECT_TRUE(test::SyslogCapture::contains("Assertion failed: '(int)services.size() == 1'"));
    }
    EXPECT_EQ(count("Quenx_OwningJobElement"), 1U);
}

TEST_F(AssociationsTest, TwoEnumerationsAtOnceNeitherDoubleNorDropRows) {
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
