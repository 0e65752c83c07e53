// SPDX-License-Identifier: Apache-2.0
#include <gtest/gtest.h>

#include <algorithm>
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
    /// A line for each property of the first instance, and for each of the others' that is different there.
    /// Times are left out; the keys have an exclamation mark. Whatever is named can be asked for, and what is
    /// joined knows by what.
    std::string valuesOf(const std::string& className) const {
        std::string values;
        Names first;
        for (const core::InstanceValue& instance : m_requests.enumerateInstances(className)) {
            values += className + "\n";
            EXPECT_TRUE(m_requests.getInstance(instance.path).path.isSameObjectAs(instance.path));
            const bool isFirst = first.empty();
            for (const auto& [name, value, isKey, referenceClass] : instance.properties) {
                if (const auto* end = value.get<CimPath>()) {
                    EXPECT_TRUE(m_requests.getInstance(*end).path.isSameObjectAs(*end)) << end->toString();
                    const auto all = m_requests.referenceNames(*end, {className, "", name, ""});
                    EXPECT_EQ(std::ranges::count(all, instance.path.toString(), &CimPath::toString), 1);
                }
                const bool isTime = value.type == core::CimType::Datetime && !value.isNull();
                const std::string text = value.isNull() ? " is null" : "=" + core::valueText(value);
                const std::string line = "  " + name + (isKey ? "!" : "") + (isTime ? "" : text) + "\n";
                if (!first.contains(line)) values += line;
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
