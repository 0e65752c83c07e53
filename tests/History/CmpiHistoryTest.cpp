// SPDX-License-Identifier: Apache-2.0
// What comes through another object manager is in the history, too.
#include <gtest/gtest.h>

#include "Cmpi/LoadedFront.h"
#include "History/History.h"
#include "Support/SimulatedAdapters.h"
#include "Utils/Os/Linux/PolicyFile.h"

namespace {

using core::CimType;
using core::CimValue;

TEST(CmpiHistoryTest, KeepsWhatOtherObjectManagersAreAskedFor) {
    const test::SimulatedAdapters adapters;
    const std::string policy = adapters.folder().write("policy.toml", "history_served = true\n");
    const char* const machines = utils::systemPolicyFile.exchange(policy.c_str());
    {
        const test::LoadedFront front(QUENX_CMPI_LIBRARY, test::Dialect::Sfcb);
        front.ask({"invoke",
                   front.first("Quenx_SoftwareInstallationService"),
                   {},
                   {},
                   "InstallFromURI",
                   {{"URI", CimValue::of(CimType::String, std::string("file:///nonexistent"))},
                    {"Target", CimValue::of(CimType::Reference, front.first("Quenx_EthernetPort"))},
                    {"InstallOptions", CimValue::arrayOf(CimType::Uint16, {std::uint64_t{5}})},
                    {"InstallOptionsValues", CimValue::arrayOf(CimType::String, {})}}});
        const auto entries = front.ask({"instances", core::CimPath("Quenx_LogEntry", {})}).instances;
        ASSERT_EQ(entries.size(), 1U);
        EXPECT_EQ(entries[0].text("Outcome") + entries[0].text("UserName"), "refused") << "shows no persons";
        EXPECT_EQ(front.ask({"associatorNames", front.first("Quenx_RecordLog")}).paths.size(), 1U);
    }
    utils::systemPolicyFile = machines;
    const std::string folder = adapters.folder() / "state.history";
    const auto records = history::History({[&] { return folder; }}).find({});
    ASSERT_EQ(records.size(), 1U);
    EXPECT_EQ(records[0].front + " " + records[0].outcome + " " + records[0].uri,
              "cmpi:RequestHandler refused file:///nonexistent");
}

}  // namespace
