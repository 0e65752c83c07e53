#include <gtest/gtest.h>

#include <atomic>
#include <functional>
#include <set>
#include <thread>

#include "Providers/SoftwareUpdate/UpdateTest.h"

namespace {

using core::CimPath;

class AssociationsTest : public test::UpdateTest {
  protected:
    std::size_t count(const char* className) const { return m_requests.enumerateInstances(className).size(); }
};

TEST_F(AssociationsTest, JoinWhatBelongsTogether) {
    EXPECT_EQ(count("Quenx_OwningJobElement"), 0U);
    EXPECT_EQ(count("Quenx_AffectedJobElement"), 0U);
    const auto result = install(goodImage(), "eth0");
    ASSERT_TRUE(result.job);
    waitForEnd(*result.job);
    EXPECT_EQ(count("Quenx_OwningJobElement"), 1U);
    EXPECT_EQ(count("Quenx_AffectedJobElement"), 2U);  // the port and its card
    EXPECT_EQ(count("Quenx_ElementCapabilities"), 1U);
    EXPECT_EQ(count("Quenx_ElementConformsToProfile"), 1U);
    EXPECT_EQ(count("Quenx_ReferencedProfile"), 1U);
    EXPECT_EQ(count("Quenx_RegisteredProfile"), 2U);

    const auto names = [&](const CimPath& from, const core::AssociationFilter& by) {
        std::set<std::string> classes;
        for (const CimPath& path : m_requests.associatorNames(from, by))
            classes.insert(path.getClassName());
        return classes;
    };
    using Classes = std::set<std::string>;
    EXPECT_EQ(names(service(), {"Quenx_OwningJobElement", "", "OwningElement", "OwnedElement"}),
              Classes{"Quenx_ConcreteJob"});
    EXPECT_EQ(names(service(), {"Quenx_ElementCapabilities", "", "ManagedElement", "Capabilities"}),
              Classes{"Quenx_SoftwareInstallationServiceCapabilities"});
    EXPECT_EQ(
        names(service(), {"Quenx_ElementConformsToProfile", "", "ManagedElement", "ConformantStandard"}),
        Classes{"Quenx_RegisteredProfile"});
    EXPECT_EQ(names(service(), {"CIM_ServiceAffectsElement", "", "AffectingElement", "AffectedElement"}),
              (Classes{"Quenx_EthernetPort", "Quenx_PortController", "Quenx_SoftwareIdentity"}));
    EXPECT_EQ(names(*result.job, {"CIM_AffectedJobElement", "", "AffectingElement", "AffectedElement"}),
              (Classes{"Quenx_EthernetPort", "Quenx_PortController"}));

    const auto reference = m_requests.enumerateInstances("Quenx_ReferencedProfile").at(0);
    EXPECT_NE(text(reference, "Antecedent").find("Quenx:EthernetPort"), std::string::npos);
    EXPECT_NE(text(reference, "Dependent").find("Quenx:SoftwareUpdate"), std::string::npos);
    const auto capabilities = m_requests.enumerateInstances("Quenx_ElementCapabilities").at(0);
    EXPECT_EQ(capabilities.find("Characteristics")->value.elements()->size(), 2U);
    for (const core::InstanceValue& profile : m_requests.enumerateInstances("Quenx_RegisteredProfile")) {
        if (text(profile, "InstanceID") != "Quenx:SoftwareUpdate") continue;
        EXPECT_EQ(text(profile, "RegisteredName"), "Software Update");
        EXPECT_EQ(text(profile, "RegisteredVersion"), "1.0.0");
        EXPECT_EQ(text(profile, "Caption"), "Software Update");
        EXPECT_EQ(text(profile, "Description"), "Software Update Profile for Tarvel(R) Ethernet Adapters");
        EXPECT_EQ(number(profile, "SpecificationType"), 2U);
        EXPECT_EQ(number(profile, "RegisteredOrganization"), 2U);
        EXPECT_TRUE(profile.find("ElementName")->value.isNull());
    }
}

TEST_F(AssociationsTest, PortsThatCannotBeUpdatedAreLeftOut) {
    std::set<std::string> affected;
    for (const CimPath& path :
         m_requests.associatorNames(service(), {"Quenx_ServiceAffectsElement", "", "", ""})) {
        affected.insert(path.toString());
    }
    EXPECT_TRUE(affected.contains(port("eth0").toString()));
    EXPECT_TRUE(affected.contains(port("eth1").toString()));
    EXPECT_FALSE(affected.contains(port("eth3").toString()));
    // A card with two such ports: one association for each pair, served once by the request layer.
    std::size_t rows = core::GetCimBroker()->getInstances("Quenx_ServiceAffectsElement", "").size();
    EXPECT_EQ(rows, 8U);  // four ports, each with its card
    EXPECT_EQ(count("Quenx_ServiceAffectsElement"), 7U);
}

TEST_F(AssociationsTest, EveryReferenceOfTheModelResolves) {
    const auto result = install(goodImage(), "eth0");
    waitForEnd(*result.job);
    std::set<std::string> reached;
    const std::function<void(const CimPath&)> walk = [&](const CimPath& path) {
        if (!reached.insert(path.toString()).second) return;
        EXPECT_TRUE(m_requests.getInstance(path).path.names(path)) << path.toString();
        const auto associations = m_requests.references(path, {});
        EXPECT_FALSE(associations.empty()) << path.toString();
        for (const core::InstanceValue& association : associations) {
            EXPECT_TRUE(m_requests.getInstance(association.path).path.names(association.path));
        }
        for (const CimPath& next : m_requests.associatorNames(path, {}))
            walk(next);
    };
    walk(service());
    for (const char* className : {"Quenx_SoftwareInstallationServiceCapabilities", "Quenx_RegisteredProfile",
                                  "Quenx_ConcreteJob", "Quenx_EthernetPort", "Quenx_SoftwareIdentity"}) {
        for (const CimPath& path : m_requests.enumerateInstanceNames(className)) {
            if (path.toString().find("eth3") != std::string::npos) continue;  // cannot be updated
            EXPECT_TRUE(reached.contains(path.toString())) << path.toString();
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
        for (int i = 0; i < 100; ++i) {
            if (core::GetCimBroker()->getInstances("Quenx_ServiceAffectsElement", "").size() != 8) ++wrong;
        }
    };
    std::thread other(enumerate);
    enumerate();
    other.join();
    EXPECT_EQ(wrong, 0);
}

}  // namespace
