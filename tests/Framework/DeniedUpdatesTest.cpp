// SPDX-License-Identifier: Apache-2.0
#include "Framework/Requests/DeniedUpdates.h"

#include <gtest/gtest.h>

#include "Framework/Requests/Caller.h"
#include "Framework/Requests/UpdateSink.h"
#include "Support/TempFolder.h"
#include "Utils/Os/Linux/PolicyFile.h"

namespace {

using core::CimType;
using core::CimValue;

class NotingSink : public core::UpdateSink {
  public:
    std::future<core::ImageFacts> examine(std::span<const std::uint8_t>) noexcept override { return {}; }
    void refused(const core::UpdateAttempt& attempt, unsigned int returnValue, core::ReasonId reason,
                 const std::string& text) noexcept override {
        EXPECT_NE(attempt.time, 0U);
        EXPECT_NE(attempt.monotonic, 0U);
        said += attempt.caller.principal + " " + attempt.uri.substr(0, 10) + " " +
                std::to_string(attempt.uri.size()) + " " + attempt.target + " " +
                std::to_string(attempt.mostRecords) + " " + std::to_string(returnValue) + " " +
                core::reasonCode(reason) + " " + text + "\n";
    }
    std::string problem() override { return ""; }
    std::shared_ptr<core::UpdateRecord> begin(const core::UpdateAttempt&) noexcept override { return {}; }

    std::string said;
};

class DeniedUpdatesTest : public ::testing::Test {
  protected:
    void tell(const std::string& method, const std::string& uri) const {
        core::tellOfDenied(method,
                           {{"URI", CimValue::of(CimType::String, uri)},
                            {"Target", CimValue::of(CimType::Reference, core::CimPath("A.B=\"c\""))}},
                           core::ReasonId::HistoryRequired, "no");
    }
    /// How many of twenty are told.
    std::ptrdiff_t toldOf(core::Caller caller) const {
        const core::CallerScope scope(std::move(caller));
        m_sink->said.clear();
        for (int i = 0; i < 20; ++i)
            tell("InstallFromURI", "file:///x");
        return std::ranges::count(m_sink->said, '\n');
    }

    const test::TempFolder m_folder;
    const std::string m_path = m_folder.write("policy.toml", "history_records = 1000\n");
    const utils::PolicyFile m_policy{m_path};
    const std::shared_ptr<NotingSink> m_sink = std::make_shared<NotingSink>();
    const core::InstalledSink m_installed{m_sink};
};

TEST_F(DeniedUpdatesTest, TellsOfWhatWouldHaveInstalledSomething) {
    const core::CallerScope scope({.principal = "ann"});
    tell("installFROMuri", "file:///x");
    tell("InstallFromSoftwareIdentity", std::string(3000, 'x'));
    tell("CheckSoftwareIdentity", "file:///x");
    m_folder.write("policy.toml", "history_records = no\n");
    core::tellOfDenied("InstallFromURI", {}, core::ReasonId::None, "");
    EXPECT_EQ(m_sink->said,
              "ann file:///x 9 A.B=\"c\" 1000 0 QX-0503 no\n"
              "ann xxxxxxxxxx 3000 A.B=\"c\" 1000 0 QX-0503 no\n"
              "ann  0  9223372036854775807 0  \n");
    m_sink->said.clear();
    m_folder.write("policy.toml", "history = \"off\"\n");
    tell("InstallFromURI", "file:///x");
    EXPECT_EQ(m_sink->said, "");
}

TEST_F(DeniedUpdatesTest, TellsOfTenAtOnceAndLetsReadersUseUpNothingOfOthers) {
    EXPECT_EQ(toldOf({.principal = "reader"}), 10);
    EXPECT_EQ(toldOf({.principal = "root", .isAdministrator = true}), 10);
    EXPECT_EQ(toldOf({.principal = "reader"}), 0);
}

}  // namespace
