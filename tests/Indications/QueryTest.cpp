// SPDX-License-Identifier: Apache-2.0
#include "Indications/Query/Query.h"

#include <gtest/gtest.h>

#include "Framework/Model/CimError.h"
#include "Indications/QueryObjects.h"

namespace {

using core::CimError;
using indications::Query;
using test::indication;
using test::job;

/// "15: text" for a refusal; empty for none.
template <class Call>
std::string refusalOf(Call&& call) {
    try {
        call();
        return "";
    } catch (const CimError& error) {
        return std::to_string(static_cast<int>(error.status())) + ": " + error.what();
    }
}

std::string refusal(const std::string& text) {
    return refusalOf([&] { Query(text).check(test::vocabulary()); });
}

const std::string kChange = "SELECT * FROM CIM_InstModification WHERE ";
const std::string kJobChange = kChange + "SourceInstance ISA CIM_ConcreteJob AND ";

TEST(QueryTest, MatchesTheEventsOfAJobAsClientsWriteTheirFilters) {
    const auto tick = indication(job(4, 20, {2UL}), job(4, 10, {2UL}));
    const auto done = indication(job(7, 100, {2UL}), job(4, 99, {2UL}));
    const auto fail = indication(job(10, 100, {2UL}), job(4, 50, {2UL}));
    const auto doneWithStatus = indication(job(7, 100, {2UL, 17UL}), job(4, 100, {2UL}));
    const auto made = indication(job(2, 0, {2UL}), nullptr);
    const struct {
        std::string text;
        std::string expected;  ///< of tick, done, fail, done with its status, creation
    } cases[] = {
        {"SELECT * FROM CIM_InstCreation WHERE SourceInstance ISA CIM_ConcreteJob", "nnnny"},
        {"\r\n select * from cim_indication where sourceinstance isa 'cim_job' ", "yyyyy"},
        {kJobChange + "SourceInstance.CIM_ConcreteJob::PercentComplete <> "
                      "PreviousInstance.CIM_ConcreteJob::PercentComplete",
         "yyynn"},
        {kJobChange + "SourceInstance.JobState != PreviousInstance.JobState", "nyyyn"},
        {kJobChange + "SourceInstance.CIM_ConcreteJob::JobState = 7", "nynyn"},
        {kChange + "SourceInstance.JobState >= 7 AND NOT PreviousInstance.JobState >= 7", "nyyyn"},
        {kJobChange + "ANY SourceInstance.OperationalStatus[*] = 17 AND ANY "
                      "SourceInstance.CIM_ConcreteJob::OperationalStatus[*] = 2",
         "nnnyn"},
        {"SELECT * FROM CIM_InstIndication WHERE PreviousInstance IS NULL", "nnnny"},
        {kChange + "SourceInstance ISA CIM_Port OR (SourceInstance.JobState = 4)", "ynnnn"},
    };
    for (const auto& each : cases) {
        EXPECT_EQ(refusal(each.text), "") << each.text;
        const Query query(each.text);
        std::string matched;
        for (const auto& event : {tick, done, fail, doneWithStatus, made})
            matched += query.matches(*event) ? 'y' : 'n';
        EXPECT_EQ(matched, each.expected) << each.text;
    }
}

TEST(QueryTest, KnowsTrueFalseAndNeither) {
    const auto event = indication(job(4, 20, {2UL, 5UL}), job(4, 10, {2UL}));
    const struct {
        const char* condition;
        char truth;  ///< y, n, or ? for neither
    } cases[] = {
        {"S.JobState = 4", 'y'},
        {"S.JobState = 4.0 AND 3.9e0 < S.JobState AND S.JobState < 18446744073709551615", 'y'},
        {"S.ErrorCode < 0 AND S.ErrorCode <> 18446744073709551613 AND S.ErrorCode = -3", 'y'},
        {"S.Caption = 'Update of eth0''s \"UEFI\"' AND S.Caption = \"Update of eth0's \\\"UEFI\\\"\"", 'y'},
        {"S.Caption = 'update of eth0''s \"UEFI\"'", 'n'},
        {"S.Caption > 'Up' AND S.Caption <= 'Uq'", 'y'},
        {"S.StartTime > '20260101000000.000000+000' AND S.StartTime = '20260102040405.000000+060'", 'y'},
        {"S.StartTime > '00000001000000.000000:000'", '?'},
        {"S.StartTime > 'yesterday'", '?'},
        {"S.DeleteOnCompletion = FALSE AND S.DeleteOnCompletion <> TRUE", 'y'},
        {"S.DeleteOnCompletion < TRUE", '?'},
        {"S.JobState = '4'", '?'},
        {"S.DeleteOnCompletion = 0", '?'},
        {"S.Owner <> 'root'", '?'},
        {"S.Owner IS NULL AND S.Owner = NULL AND NULL = S.Owner AND NOT S.Owner <> NULL", 'y'},
        {"S.OperationalStatus[1] = 5 AND S.OperationalStatus[0] IS NOT NULL", 'y'},
        {"S.OperationalStatus[2] = 5", '?'},
        {"S.OperationalStatus[2] IS NULL", 'y'},
        {"ANY S.OperationalStatus[*] > 5", 'n'},
        {"ANY S.OperationalStatus[*] = 'two'", '?'},
        {"S.CIM_Port::JobState = 4", '?'},
        {"S.Caption ISA CIM_Job", '?'},
        {"S.Owner = 'x' OR S.JobState = 4", 'y'},
        {"S.Owner = 'x' AND S.JobState = 5", 'n'},
        {"S.Owner = 'x' AND S.JobState = 4", '?'},
        {"S.JobState = 5 OR S.JobState = 4 AND S.JobState = 5", 'n'},
    };
    for (const auto& each : cases) {
        std::string condition = each.condition;
        for (std::size_t place = 0; (place = condition.find("S.", place)) != std::string::npos; place += 14)
            condition.replace(place, 1, "SourceInstance");
        const bool isTrue = Query(kChange + condition).matches(*event);
        const bool isFalse = Query(kChange + "NOT (" + condition + ")").matches(*event);
        EXPECT_EQ(isTrue ? 'y' : isFalse ? 'n' : '?', each.truth) << each.condition;
    }
}

TEST(QueryTest, SaysWhatItDoesNotUnderstand) {
    const struct {
        std::string text;
        const char* expected;
    } cases[] = {
        // What the language has beyond what is understood here: named.
        {kChange + "SourceInstance.JobState#'Completed'", "29: queries are understood here without symbolic"},
        {kChange + "SourceInstance.JobState = #'Completed'",
         "29: queries are understood here without symbolic"},
        {kChange + "SourceInstance.Caption LIKE 'a%'", "29: queries are understood here without LIKE"},
        {kChange + "SourceInstance.Caption NOT LIKE 'a%'", "29: queries are understood here without LIKE"},
        {kChange + "SourceInstance.JobState IN (7, 8)", "29: queries are understood here without IN"},
        {kChange + "EVERY x IN y SATISFIES (x = 1)", "29: queries are understood here without EVERY"},
        {"SELECT * FROM CIM_InstCreation, CIM_InstDeletion", "29: queries are understood here without joins"},
        {"SELECT * FROM CIM_InstCreation AS c", "29: queries are understood here without aliases"},
        {"SELECT * FROM CIM_InstCreation c", "29: queries are understood here without aliases"},
        {"SELECT SourceInstance.* FROM CIM_InstCreation", "29: queries are understood here without X.*"},
        {"SELECT COUNT(*) FROM CIM_InstCreation", "29: queries are understood here without functions"},
        {"SELECT DISTINCT * FROM CIM_InstCreation", "29: queries are understood here without DISTINCT"},
        {"SELECT * FROM CIM_InstCreation ORDER BY x", "29: queries are understood here without ORDER BY"},
        {"SELECT * FROM CIM_InstCreation WITHIN 5 WHERE x = 1",
         "29: queries are understood here without WITHIN"},
        {kChange + "SourceInstance.JobState = 3 + 4", "29: queries are understood here without arithmetic"},
        {kChange + "SourceInstance.OperationalStatus = PreviousInstance.OperationalStatus", "29: arrays are"},
        {kChange + "SourceInstance = PreviousInstance", "29: objects are not compared"},
        // What does not read: where, and what would.
        {"", "15: the query cannot be read at character 1: expected SELECT, found the end"},
        {"SELECT FROM CIM_InstCreation",
         "15: the query cannot be read at character 8: expected * or the name"},
        {"SELECT * FROM CIM_InstCreation WHERE",
         "15: the query cannot be read at character 37: expected a prop"},
        {kChange + "SourceInstance.JobState < NULL", "15: the query cannot be read at character 66: NULL is"},
        {kChange + "NULL = NULL", "15: the query cannot be read at"},
        {kChange + "SourceInstance.JobState", "15: the query cannot be read at"},
        {kChange + "SourceInstance.OperationalStatus[*] = 2",
         "15: the query cannot be read at character 42: ANY"},
        {kChange + "ANY SourceInstance.JobState = 2", "15: the query cannot be read at character 42: ANY"},
        {kChange + "SourceInstance.JobState = 99999999999999999999", "15: the query cannot be read at"},
        {kChange + "SourceInstance.JobState = 7x", "15: the query cannot be read at"},
        {kChange + "SourceInstance.Caption = 'never", "15: the query cannot be read at character 67: a text"},
        {kChange + "(SourceInstance.JobState = 7",
         "15: the query cannot be read at character 70: expected AND"},
        {kChange + "SourceInstance.JobState = 7) x",
         "15: the query cannot be read at character 69: expected AND"},
        {kChange + std::string("x = 1\0", 6), "15: the query cannot be read at character 47"},
        // What can never be true.
        {"SELECT * FROM CIM_Job", "15: CIM_Job is no class of indications here"},
        {kChange + "TargetInstance ISA 'CIM_ConcreteJob'", "15: no class has the property TargetInstance"},
        {kChange + "SourceInstance.JobStat = 7",
         "15: no class has the property JobStat that SourceInstance.JobS"},
        {kChange + "SourceInstance.CIM_Port::JobState = 7", "15: no class has the property JobState"},
        {kChange + "SourceInstance.CIM_Prot::Caption = 'x'", "15: no class CIM_Prot can stand"},
        {kChange + "SourceInstance ISA CIM_Jobs", "15: no class CIM_Jobs is served"},
        {kChange + "SourceInstance.Caption ISA CIM_Job", "15: SourceInstance.Caption holds no object"},
        {kChange + "IndicationTime.Year = 5", "15: IndicationTime.Year goes on after IndicationTime"},
        {kChange + "SourceInstance.JobState[0] = 5", "15: SourceInstance.JobState[0] names an element"},
        {"SELECT SourceInstance.Name FROM CIM_InstCreation", "15: no class has the property Name"},
    };
    for (const auto& each : cases)
        EXPECT_TRUE(refusal(each.text).starts_with(each.expected)) << each.text << "\n" << refusal(each.text);
}

TEST(QueryTest, KeepsItsBounds) {
    const auto repeated = [](const std::string& part, int count) {
        std::string text;
        for (int i = 0; i < count; ++i)
            text += part;
        return text;
    };
    const std::string one = "SourceInstance.JobState = 1";
    // A condition has two nodes, itself and its path; the operator that joins them all is one more.
    const std::string many = one + repeated(" OR " + one, 30);
    EXPECT_EQ(refusal(kChange + many), "");
    EXPECT_TRUE(
        refusal(kChange + many + " OR " + one + " OR " + one).starts_with("29: the query has too many cond"));
    EXPECT_EQ(refusal(kChange + repeated("(", 15) + one + repeated(")", 15)), "");
    EXPECT_TRUE(
        refusal(kChange + repeated("(", 16) + one + repeated(")", 16)).starts_with("29: the query has too"));
    EXPECT_TRUE(
        refusal(kChange + repeated("NOT ", 16) + one).starts_with("29: the query has too many levels"));
    const std::string longest = kChange + one;
    EXPECT_EQ(refusal(longest + std::string(Query::kMostBytes - longest.size(), ' ')), "");
    EXPECT_TRUE(
        refusal(longest + std::string(Query::kMostBytes, ' ')).starts_with("29: the query has too many by"));
}

TEST(QueryTest, KeepsOfAnIndicationWhatWasSelected) {
    const Query all("SELECT * FROM CIM_Indication");
    EXPECT_TRUE(all.wants("SourceInstanceHost") && all.wants("SourceInstance", "JobState"));
    const Query some(
        "SELECT SourceInstance.CIM_ConcreteJob::jobstate, PreviousInstance FROM CIM_InstModification");
    EXPECT_EQ(some.className(), "CIM_InstModification");
    EXPECT_TRUE(some.wants("sourceinstance") && some.wants("SequenceNumber"));
    EXPECT_FALSE(some.wants("SourceInstanceHost"));
    EXPECT_TRUE(some.wants("SourceInstance", "JobState"));
    EXPECT_FALSE(some.wants("SourceInstance", "PercentComplete"));
    EXPECT_TRUE(some.wants("PreviousInstance", "PercentComplete"));
}

TEST(QueryTest, KnowsTheLanguagesByTheirNames) {
    for (const char* known : {"DMTF:CQL", "cim:cql", " CQL\n", "WQL", "wql1"})
        EXPECT_EQ(refusalOf([&] { indications::requireKnownLanguage(known); }), "") << known;
    for (const char* unknown : {"", " ", "DMTF:FQL", "CQLT", "WQL 1"}) {
        const std::string text = refusalOf([&] { indications::requireKnownLanguage(unknown); });
        EXPECT_EQ(text, "14: the query language is not known here; DMTF:CQL and WQL are") << unknown;
    }
}

}  // namespace
