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
        {"S.JobState <= 4 AND S.JobState >= 4 AND NOT (S.JobState < 4 OR S.JobState > 4)", 'y'},
        {"S.JobState = +4 AND S.JobState = 40E-1 AND S.JobState = 0.4e+1\tAND S.JobState = 4e0", 'y'},
        {"S.JobState = 4.0 AND 3.9e0 < S.JobState AND S.JobState < 18446744073709551615", 'y'},
        {"S.ErrorCode < 0 AND S.ErrorCode <> 18446744073709551613 AND S.ErrorCode = -3", 'y'},
        {"S.Caption = 'Update of eth0''s \"UEFI\"' AND S.Caption = \"Update of eth0's \\\"UEFI\\\"\"", 'y'},
        {"S.Caption = 'update of eth0''s \"UEFI\"'", 'n'},
        {"S.Caption > 'Up' AND S.Caption <= 'Uq'", 'y'},
        {"S.StartTime > '20260101000000.000000+000' AND S.StartTime = '20260102040405.000000+060'", 'y'},
        {"S.StartTime = PreviousInstance.StartTime AND TRUE = TRUE", 'y'},
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
        {"S.OperationalStatus[2] IS NULL AND S.OperationalStatus IS NOT NULL AND "
         "SourceInstance IS NOT NULL",
         'y'},
        {"S.JobState[0] = 4", '?'},
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

TEST(QueryTest, NamesWhatOfTheLanguageItIsWithout) {
    const struct {
        std::string text;
        std::string feature;
    } cases[] = {
        {kChange + "SourceInstance.JobState#'Completed'", "symbolic constants, write the number"},
        {kChange + "SourceInstance.JobState = #'Completed'", "symbolic constants, write the number"},
        {kChange + "SourceInstance.Caption LIKE 'a%'", "LIKE"},
        {kChange + "SourceInstance.Caption NOT LIKE 'a%'", "LIKE"},
        {kChange + "SourceInstance.JobState IN (7, 8)", "IN"},
        {kChange + "EVERY x IN y SATISFIES (x = 1)", "EVERY"},
        {kChange + "x SATISFIES (y = 1)", "SATISFIES"},
        {kChange + "x BETWEEN 1 AND 2", "BETWEEN"},
        {kChange + "x = 1 HAVING y = 1", "HAVING"},
        {kChange + "x = $y$", "templates"},
        {kChange + "x || 'a' = 'ba'", "joining texts"},
        {kChange + "x = 3 + 4", "arithmetic"},
        {kChange + "x - y = 1", "arithmetic"},
        {kChange + "x / 2 = 1", "arithmetic"},
        {kChange + "x % 2 = 1", "arithmetic"},
        {kChange + "2 * x = 1", "arithmetic"},
        {kChange + "NULL(x) = 1", "functions"},
        {kChange + "UPPER(x) = 'A'", "functions"},
        {kChange + "x = [1]", "ranges of elements"},
        {kChange + "x[1..2] = 1", "ranges of elements"},
        {kChange + "x[1,2] = 1", "ranges of elements"},
        {"SELECT x[0] FROM CIM_InstCreation", "elements of arrays in the select list, name the array"},
        {"SELECT x[*] FROM CIM_InstCreation", "elements of arrays in the select list, name the array"},
        {"SELECT SourceInstance.* FROM CIM_InstCreation", "X.*, name the properties"},
        {"SELECT COUNT(*) FROM CIM_InstCreation", "functions"},
        {"SELECT DISTINCT * FROM CIM_InstCreation", "DISTINCT"},
        {"SELECT FIRST 5 x FROM CIM_InstCreation", "FIRST"},
        {"SELECT * FROM CIM_InstCreation, CIM_InstDeletion", "joins"},
        {"SELECT * FROM CIM_InstCreation JOIN CIM_InstDeletion", "joins"},
        {"SELECT * FROM CIM_InstCreation AS c", "aliases"},
        {"SELECT * FROM CIM_InstCreation c", "aliases"},
        {"SELECT * FROM CIM_InstCreation GROUP BY x", "GROUP"},
        {"SELECT * FROM CIM_InstCreation ORDER BY x", "ORDER BY"},
        {"SELECT * FROM CIM_InstCreation WITHIN 5 WHERE x = 1", "WITHIN, events come as they happen"},
    };
    for (const auto& each : cases)
        EXPECT_EQ(refusal(each.text), "29: queries are understood here without " + each.feature) << each.text;
}

TEST(QueryTest, SaysWhereItCannotBeReadAndWhatCould) {
    const std::string nullCompared = "NULL is compared by IS NULL or IS NOT NULL only, and with a property";
    const std::string anyTogether = "ANY and [*] stand together only: ANY Property[*] = value";
    const struct {
        std::string text;
        int place;
        std::string reason;
    } cases[] = {
        {"", 1, "expected SELECT, found the end"},
        {"SELECT * CIM_InstCreation", 10, "expected FROM, found \"CIM_InstCreation\""},
        {"SELECT FROM CIM_InstCreation", 8, "expected * or the name of a property, found \"FROM\""},
        {"SELECT 5 FROM CIM_InstCreation", 8, "expected * or the name of a property, found a value"},
        {"SELECT * FROM 'CIM_InstCreation'", 15, "expected the name of a class, found a value"},
        {"SELECT * FROM CIM_InstCreation 5", 32, "expected WHERE or the end, found a value"},
        {"SELECT * FROM CIM_InstCreation WHERE", 37, "expected a property or a value, found the end"},
        {kChange + "x. = 5", 45, "expected the name of a property, found \"=\""},
        {kChange + "x::5 = 5", 45, "expected the name of a property, found a value"},
        {kChange + "x[0].y = 5", 47, "expected an index in the last step of a path only, found \"y\""},
        {kChange + "ANY x[*].y = 5", 51, "expected an index in the last step of a path only, found \"y\""},
        {kChange + "x[y] = 5", 44, "expected the number of an element, or *, found \"y\""},
        {kChange + "x['y'] = 5", 44, "expected the number of an element, or *, found a value"},
        {kChange + "x[1 = 5", 46, "expected ], found \"=\""},
        {kChange + "x IS 5", 47, "expected NULL, found a value"},
        {kChange + "x ISA 5", 48, "expected the name of a class, found a value"},
        {kChange + "x ISA NULL", 48, "expected the name of a class, found \"NULL\""},
        {kChange + "x", 43, "expected a comparison, found the end"},
        {kChange + "x NOT 5", 48, "expected a comparison, found a value"},
        {kChange + "x < NULL", 44, nullCompared},
        {kChange + "NULL >= x", 47, nullCompared},
        {kChange + "NULL = NULL", 47, nullCompared},
        {kChange + "ANY x[*] = NULL", 51, nullCompared},
        {kChange + "x[*] = 2", 42, anyTogether},
        {kChange + "ANY x = 2", 42, anyTogether},
        {kChange + "ANY x[*] = y[*]", 51, "ANY and [*] stand on the left side only"},
        {kChange + "x = 99999999999999999999", 46, "the number 99999999999999999999 is too large"},
        {kChange + "x = -9999999999999999999", 46, "the number -9999999999999999999 is too large"},
        {kChange + "x = 1e999", 46, "the number 1e999 is too large"},
        {kChange + "x = 7x", 47, "a number ends in letters; write it in decimal digits"},
        {kChange + "x = 7e+", 46, "the exponent of a number has no digits"},
        {kChange + "x = 7.", 47, "expected AND, OR or the end, found \".\""},
        {kChange + "x = 'never", 46, "a text in quotes has no end"},
        {kChange + "x = ;", 46, "expected a property or a value, found \";\""},
        {kChange + "x = ?", 46, "this character stands in texts in quotes only"},
        {kChange + "(x = 7", 48, "expected AND, OR or ), found the end"},
        {kChange + "x = 7) y", 47, "expected AND, OR or the end, found \")\""},
        {kChange + std::string("x = 1\0", 6), 47, "this character stands in texts in quotes only"},
    };
    for (const auto& each : cases) {
        const std::string expected = std::to_string(each.place) + ": " + each.reason;
        EXPECT_EQ(refusal(each.text), "15: the query cannot be read at character " + expected) << each.text;
    }
    for (const std::string word :
         {"SELECT", "FROM", "WHERE", "AND", "OR", "NOT", "ISA", "IS", "NULL", "TRUE", "FALSE", "ANY", "BY"}) {
        const std::string found = "* or the name of a property, found \"" + word + '"';
        EXPECT_EQ(refusal("SELECT " + word + " FROM CIM_InstCreation"),
                  "15: the query cannot be read at character 8: expected " + found);
    }
}

TEST(QueryTest, RefusesWhatCanNeverBeTrue) {
    const struct {
        std::string text;
        std::string expected;
    } cases[] = {
        {"SELECT * FROM CIM_Job", "15: CIM_Job is no class of indications here"},
        {"SELECT SourceInstance.Name FROM CIM_InstCreation",
         "15: no class has the property Name that SourceInstance.Name names"},
        {"SELECT _ FROM CIM_InstCreation", "15: no class has the property _ that _ names"},
        {kChange + "TargetInstance ISA 'CIM_ConcreteJob'",
         "15: no class has the property TargetInstance that TargetInstance names"},
        {kChange + "SourceInstance.JobStat = 7",
         "15: no class has the property JobStat that SourceInstance.JobStat names"},
        {kChange + "7 = SourceInstance.CIM_Port::JobState",
         "15: no class has the property JobState that SourceInstance.CIM_Port::JobState names"},
        {kChange + "NOT TargetInstance IS NULL",
         "15: no class has the property TargetInstance that TargetInstance names"},
        {kChange + "SourceInstance.CIM_Prot::Caption = 'x'",
         "15: no class CIM_Prot can stand where SourceInstance.CIM_Prot::Caption has it"},
        {kChange + "SourceInstance ISA CIM_Jobs",
         "15: no class CIM_Jobs is served, of which objects could be"},
        {kChange + "SourceInstance.Caption ISA CIM_Job",
         "15: SourceInstance.Caption holds no object, so it is of no class"},
        {kChange + "IndicationTime.Year = 5",
         "15: IndicationTime.Year goes on after IndicationTime, which holds no object"},
        {kChange + "SourceInstance.JobState[0] = 5",
         "15: SourceInstance.JobState[0] names an element, and JobState is no array"},
        {kChange + "ANY SourceInstance.JobState[*] = 5",
         "15: SourceInstance.JobState[*] names an element, and JobState is no array"},
        {kChange + "SourceInstance.OperationalStatus = 5",
         "29: arrays are not compared as a whole; write ANY SourceInstance.OperationalStatus[*], or an "
         "index"},
        {kChange + "SourceInstance = PreviousInstance",
         "29: objects are not compared as a whole; SourceInstance can be tested by ISA and IS NULL"},
    };
    for (const auto& each : cases)
        EXPECT_EQ(refusal(each.text), each.expected) << each.text;
}

TEST(QueryTest, KeepsItsBounds) {
    const auto repeated = [](const std::string& part, int count) {
        std::string text;
        for (int i = 0; i < count; ++i)
            text += part;
        return text;
    };
    const std::string one = "SourceInstance.JobState = 1";
    const auto tooMany = [](const std::string& what) {
        return "29: the query has too many " + what + " are understood here";
    };
    // A condition has two nodes, itself and its path; the operator that joins them all is one more, NOT the
    // last.
    const std::string many = kChange + one + repeated(" OR " + one, 29) + " OR NOT " + one;
    EXPECT_EQ(refusal(many), "");
    EXPECT_EQ(refusal(many + " AND 1 = 1"), tooMany("conditions and paths; at most 64"));
    for (const auto& [open, close] : {std::pair("(", ")"), std::pair("NOT ", "")}) {
        EXPECT_EQ(refusal(kChange + repeated(open, 15) + one + repeated(close, 15)), "");
        EXPECT_EQ(refusal(kChange + repeated(open, 16) + one + repeated(close, 16)),
                  tooMany("levels; at most 16"));
    }
    const std::string longest =
        kChange + one + std::string(Query::kMostBytes - kChange.size() - one.size(), ' ');
    EXPECT_EQ(refusal(longest), "");
    EXPECT_EQ(refusal(longest + ' '), tooMany("bytes; at most 2048"));
}

TEST(QueryTest, KeepsOfAnIndicationWhatWasSelected) {
    const Query all("SELECT * FROM CIM_Indication");
    EXPECT_TRUE(all.wants("SourceInstanceHost") && all.wants("SourceInstance", "JobState"));
    const Query some(
        "SELECT SourceInstance.CIM_ConcreteJob::jobstate, PreviousInstance FROM CIM_InstModification");
    EXPECT_EQ(some.className(), "CIM_InstModification");
    EXPECT_TRUE(some.wants("sourceinstance"));
    for (const char* always : {"SequenceContext", "SequenceNumber", "IndicationFilterName",
                               "IndicationIdentifier", "IndicationTime"})
        EXPECT_TRUE(some.wants(always)) << always;
    EXPECT_FALSE(some.wants("SourceInstanceHost"));
    EXPECT_TRUE(some.wants("SourceInstance", "JobState"));
    EXPECT_FALSE(some.wants("SourceInstance", "PercentComplete"));
    EXPECT_TRUE(some.wants("PreviousInstance", "PercentComplete"));
}

TEST(QueryTest, KnowsTheLanguagesByTheirNames) {
    for (const char* known : {"DMTF:CQL", "cim:cql", "\t\r\n CQL\n\r\t ", "WQL", "wql1"})
        EXPECT_EQ(refusalOf([&] { indications::requireKnownLanguage(known); }), "") << known;
    for (const char* unknown : {"", " ", "DMTF:FQL", "CQLT", "WQL 1"}) {
        const std::string text = refusalOf([&] { indications::requireKnownLanguage(unknown); });
        EXPECT_EQ(text, "14: the query language is not known here; DMTF:CQL and WQL are") << unknown;
    }
}

}  // namespace
