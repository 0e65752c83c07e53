// SPDX-License-Identifier: Apache-2.0
// How updates ended, for people and for scripts.
#include <gtest/gtest.h>

#include <sstream>

#include "Cli/Display/Output.h"
#include "Cli/Verbs/ManyResults.h"

namespace {

using cli::Ending;
using cli::ExitStatus;
using cli::Json;
using cli::Outcome;

Outcome outcomeOf(ExitStatus status, Ending ending = Ending::Updated) {
    Outcome outcome{cli::Candidate{}};
    outcome.end(status, ending, "what happened");
    return outcome;
}

TEST(OutcomeTest, HasItsWordsForScripts) {
    const std::tuple<Ending, const char*, const char*> table[] = {
        {Ending::Current, "current", "already current"},
        {Ending::Updated, "updated", "updated"},
        {Ending::UpdatedResetPending, "updated-reset-pending", "updated"},
        {Ending::Refused, "refused", "refused"},
        {Ending::Failed, "failed", "failed"},
        {Ending::Unknown, "unknown", "unknown"},
        {Ending::Installable, "installable", "installable"},
    };
    Outcome outcome = outcomeOf(ExitStatus::Done);
    for (const auto& [ending, word, result] : table) {
        outcome.ending = ending;
        EXPECT_EQ(Json(outcome)["outcome"], word);
        EXPECT_EQ(Json(outcome)["result"], result);
    }
    EXPECT_FALSE(Json(outcome).contains("signedBy"));
    outcome.signedBy = "vendor";
    outcome.historyId = 1;
    outcome.reason = core::ReasonId::FlashWithoutEffect;
    EXPECT_EQ(Json(outcome)["signedBy"], "vendor");
    EXPECT_EQ(Json(outcome)["historyId"], 1);
    EXPECT_EQ(Json(outcome)["reasonId"], "QX-0707");
}

TEST(OutcomeTest, ShowsWhatHasChanged) {
    Outcome outcome = outcomeOf(ExitStatus::Done, Ending::UpdatedResetPending);
    outcome.before = {{"A", 1}, {"B", 2}, {"C", 3, "3.1"}};
    outcome.after = {{"A", 1, "", "1.3"}, {"C", 3, "3.1"}, {"D", 4}};
    std::ostringstream out;
    cli::printChange(out, outcome);
    outcome.after.clear();  // it cannot be read
    cli::printChange(out, outcome);
    EXPECT_EQ(out.str(),
              "  A  1 -> 1.3 after a reset\n  C  3.1 (unchanged)\n  D  none -> 4\n  B  2 -> none\n");
}

TEST(ManyResultsTest, HasTheStatusOfTheWorstEnding) {
    using enum ExitStatus;
    const std::pair<std::vector<ExitStatus>, ExitStatus> table[] = {
        {{}, AlreadyCurrent},
        {{AlreadyCurrent}, AlreadyCurrent},
        {{AlreadyCurrent, Done}, Done},
        {{Done, NotFound, AlreadyCurrent}, Failed},
        {{Failed, Unknown, Done}, Unknown},
        {{Interrupted, Unknown}, Interrupted},
    };
    cli::ManyResults results;
    for (const auto& [endings, status] : table) {
        results.outcomes.clear();
        for (const ExitStatus ending : endings)
            results.outcomes.push_back(outcomeOf(ending));
        EXPECT_EQ(results.status(), status);
    }
    results.outcomes = {outcomeOf(AlreadyCurrent)};
    results.unused = {"file:///x"};
    EXPECT_EQ(results.status(), AlreadyCurrent);
    results.isInterrupted = true;
    EXPECT_EQ(results.status(), Interrupted);
    results.isInterrupted = false;
    results.outcomes.clear();
    EXPECT_EQ(results.status(), NotFound);
}

TEST(ManyResultsTest, TellsOfAFunctionWithOtherFirmware) {
    cli::ManyResults results;
    results.outcomes = {outcomeOf(ExitStatus::Done)};
    Outcome& outcome = results.outcomes.front();
    outcome.adapter = outcome.label = "eth0";
    outcome.after = {{"A", 2}};
    cli::Adapter other;
    other.name = "eth1";
    other.components = {{"A", 1}};
    results.sameCard = {{other, "eth0"}};
    results.notTried = {"eth2"};
    const auto isTold = [&] {
        std::ostringstream out;
        cli::printSummary(out, results);
        return out.str().ends_with(
            "\neth1 has other firmware than eth0, so it may have a flash of its own: install on it with "
            "--match 'eth1'.\n");
    };
    EXPECT_TRUE(isTold());
    outcome.ending = Ending::Installable;
    EXPECT_FALSE(isTold()) << "nothing was written";
    outcome = outcomeOf(ExitStatus::Failed, Ending::Failed);
    outcome.adapter = "eth0";
    outcome.after = {{"A", 2}};
    EXPECT_FALSE(isTold());
    outcome.status = ExitStatus::AlreadyCurrent;
    EXPECT_TRUE(isTold());
    outcome.after.clear();
    EXPECT_FALSE(isTold()) << "it cannot be read";
    outcome.after = other.components;
    EXPECT_FALSE(isTold());
    outcome.after = {{"A", 2}};
    results.sameCard.front().target = "eth3";
    EXPECT_FALSE(isTold());
    const Json json = [&] {
        std::ostringstream out;
        cli::printAsJson(out, results);
        return Json::parse(out.str());
    }();
    EXPECT_EQ(json["sameCard"].dump(),
              R"([{"adapter":"eth1","target":"eth3","components":[{"type":"A","version":1}]}])");
    EXPECT_EQ(json["notTried"].dump(), R"(["eth2"])");
    EXPECT_EQ(json["exitStatus"], 3);
}

}  // namespace
