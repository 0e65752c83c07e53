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

class ModelTest : public test::UpdateTest {
  protected:
    /// As the provider has them, before the request layer joins equal ones.
    static std::size_t rows(const char* className) {
        return core::GetCimBroker()->getInstances(className, "").size();
    }
    /// A line for each value of the first instance that is set, and for each of the others that is different
    /// there. Times are left out; the keys have an exclamation mark.
    std::string valuesOf(const std::string& className) const {
        std::string values;
        Names first;
        for (const core::InstanceValue& instance : m_requests.enumerateInstances(className)) {
            values += className + "\n";
            const bool isFirst = first.empty();
            for (const auto& [name, value, isKey, referenceClass] : instance.properties) {
                if (value.type == core::CimType::Datetime) continue;
                const std::string text = value.isNull() ? " is null" : "=" + core::valueText(value);
                const std::string line = "  " + name + (isKey ? "!" : "") + text + "\n";
                if (isFirst ? !value.isNull() : !first.contains(line)) values += line;
                if (isFirst) first.insert(line);
            }
        }
        return values;
    }
};

TEST_F(ModelTest, ServesEachClassAsTheSampleHasIt) {
    file("iscsi.rom", test::madeRom({{utils::FirmwareType::iSCSI, 7}}, 0x15ad, 0x07b0));
    EXPECT_EQ(rows("Quenx_SoftwareIdentity"), 10U);  // nothing of it stays that an update changes
    waitForEnd(*install(goodImage(), "eth0").job);
    Names classes;
    for (const core::ClassChain& chain : m_requests.enumerateClasses("", true))
        if (chain.front()->name.starts_with("Quenx_")) classes.insert(chain.front()->name);
    std::string served;
    for (const std::string& name : classes)
        served += valuesOf(name);
    const auto sample = test::readTestFile(QUENX_UPDATE_SAMPLES "/model");
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
