// SPDX-License-Identifier: Apache-2.0
#include <gtest/gtest.h>

#include <functional>
#include <regex>
#include <set>

#include "Framework/Classes/CimBroker.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Support/TestRoms.h"
#include "Support/Together.h"
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
    /// A line for each value that is set, times aside; the keys have an exclamation mark.
    static std::string valuesOf(const core::InstanceValue& instance) {
        std::string values;
        for (const auto& [name, value, isKey, referenceClass] : instance.properties)
            if (!value.isNull() && value.type != core::CimType::Datetime)
                values += "  " + name + (isKey ? "!=" : "=") + core::valueText(value) + "\n";
        return values;
    }
};

TEST_F(ModelTest, ServesEachClassAsTheSampleHasIt) {
    waitForEnd(*install(goodImage(), "eth0").job);
    Names classes;
    for (const core::ClassChain& chain : m_requests.enumerateClasses("", true))
        if (chain.front()->name.starts_with("Quenx_")) classes.insert(chain.front()->name);
    std::string served;
    for (const std::string& name : classes)
        served += name + "\n" + valuesOf(m_requests.enumerateInstances(name).at(0));
    const auto sample = test::readTestFile(QUENX_MODEL_SAMPLE);
    std::string expected(sample.begin(), sample.end());
    expected = std::regex_replace(expected, std::regex("<FOLDER>"), m_folder.path());
    EXPECT_EQ(served, std::regex_replace(expected, std::regex("<HOST>"), os::getHostname()));
    for (const std::string one : {"Service", "ServiceCapabilities"})
        EXPECT_EQ(m_log.count("new instance\" (getInstances@Quenx_SoftwareInstallation" + one + ".cpp:"), 1U);

    std::string methods;
    for (const core::MethodDeclaration& each :
         m_requests.getClass("Quenx_SoftwareInstallationService").at(1)->methods)
        methods += each.name + " ";
    EXPECT_EQ(methods, "CheckSoftwareIdentity InstallFromSoftwareIdentity InstallFromURI ");
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
    EXPECT_EQ(classes(job, "CIM_AffectedJobElement", "AffectingElement", "AffectedElement"),
              (Names{port, card}));
    EXPECT_EQ(classes(job, "", "AffectingElement", "AffectingElement"), Names{});
    EXPECT_EQ(classes(service(), "CIM_ServiceAffectsElement", "AffectingElement", ""),
              (Names{port, card, "Quenx_SoftwareIdentity"}));
    EXPECT_EQ(count("Quenx_OwningJobElement"), 1U);
    EXPECT_EQ(count("Quenx_AffectedJobElement"), 2U);
    EXPECT_EQ(count("Quenx_ElementConformsToProfile"), 1U);
    // The image, and four ports, each with its card: the pair of ports that shares one names it once.
    EXPECT_EQ(rows("Quenx_ServiceAffectsElement"), 9U);
    EXPECT_EQ(count("Quenx_ServiceAffectsElement"), 8U);
}

TEST_F(ModelTest, ServesTheProfilesOfBothProviders) {
    EXPECT_EQ(table("Quenx_RegisteredProfile",
                    {"InstanceID", "RegisteredName", "RegisteredVersion", "RegisteredOrganization",
                     "SpecificationType", "Caption", "Description", "ElementName"}),
              (Texts{"Quenx:EthernetPort; Ethernet Port; 1.0.1; 2; 2; Ethernet Port; "
                     "Ethernet Port Profile for Tarvel(R) Ethernet Adapters; ",
                     "Quenx:SoftwareUpdate; Software Update; 1.0.0; 2; 2; Software Update; "
                     "Software Update Profile for Tarvel(R) Ethernet Adapters; "}));
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

TEST_F(ModelTest, EnumerationsAtOnceNeitherDoubleNorDropRows) {
    const std::pair<const char*, std::size_t> table[] = {
        {"Quenx_SoftwareInstallationService", 1}, {"Quenx_SoftwareInstallationServiceCapabilities", 1},
        {"Quenx_ElementCapabilities", 1},         {"Quenx_RegisteredProfile", 2},
        {"Quenx_SoftwareIdentity", 10},           {"Quenx_SoftwareIdentityResource", 1},
        {"Quenx_ElementSoftwareIdentity", 9},     {"Quenx_ServiceAffectsElement", 9},
    };
    std::vector<std::function<void()>> enumerations;
    for (const auto& row : table)
        for (int i = 0; i < 2; ++i)
            enumerations.emplace_back([&row] { EXPECT_EQ(rows(row.first), row.second) << row.first; });
    for (std::uint32_t round = 1; round < 20; ++round) {
        // What is made once is made anew, and what is kept while the files stay the same is not.
        m_agent.reset();
        m_agent = std::make_unique<core::SoftwareUpdateAgent>();
        file("new.rom", test::madeRom({{utils::FirmwareType::PXE, round}}));
        test::together(enumerations);
    }
}

}  // namespace
