// SPDX-License-Identifier: Apache-2.0
#include "Framework/Model/CimValue.h"

#include <gtest/gtest.h>

#include "Support/TempFolder.h"

namespace {

using core::CimPath;
using core::CimScalar;
using core::CimType;

TEST(CimValueTest, KeepsNumbersToTheRangeOfTheirType) {
    const std::tuple<CimType, const char*, bool> table[] = {
        {CimType::Uint8, "256", false},
        {CimType::Uint8, "-1", false},
        {CimType::Uint16, " 0xFFFF ", true},
        {CimType::Sint8, "-128", true},
        {CimType::Sint8, "-129", false},
        {CimType::Uint32, "5x", false},
        {CimType::Uint64, "18446744073709551615", true},
        {CimType::Uint64, "18446744073709551616", false},
        {CimType::Sint64, "-9223372036854775808", true},
        {CimType::Boolean, "tRuE", true},
        {CimType::Boolean, "1", false},
        {CimType::Real64, "1.5e+03", true},
        {CimType::Datetime, "tomorrow", false},
        {CimType::Reference, "no path!", false},
    };
    for (const auto& [type, text, isAccepted] : table)
        EXPECT_EQ(core::parseScalar(type, text).has_value(), isAccepted) << text;
    EXPECT_EQ(std::get<std::uint64_t>(*core::parseScalar(CimType::Uint16, "0x1F4")), 500U);
}

TEST(CimValueTest, ReadsBackDatetimesOf25Characters) {
    EXPECT_EQ(core::datetimeText(utils::Time(90061002003ULL)), "00000001010101.002000:000");
    EXPECT_EQ(core::datetimeText(utils::Time(~0ULL)).size(), 25U);
    EXPECT_EQ(core::datetimeText(utils::Time()).size(), 25U);
    for (const char* text :
         {"20240229235959.123000+000", "19700101000000.000000+000", "00000003040506.007000:000"}) {
        const auto time = core::parseDatetime(text);
        ASSERT_TRUE(time) << text;
        EXPECT_EQ(core::datetimeText(*time), text);
    }
    // An hour east of UTC is an hour earlier in UTC, across the end of the year.
    EXPECT_EQ(core::datetimeText(*core::parseDatetime("20240101003000.000000+060")),
              "20231231233000.000000+000");
    for (const char* text :
         {"20240230000000.000000+000", "20240229******.******+000", "20240229235960.000000+000",
          "2024022923595.123000+0000", "00000000240000.000000:000", "19691231000000.000000+000"}) {
        EXPECT_FALSE(core::parseDatetime(text)) << text;
    }
}

TEST(CimValueTest, ConvertsWithoutLoss) {
    EXPECT_TRUE(core::convertScalar(CimType::Uint16, CimScalar(std::int64_t{5})));
    EXPECT_FALSE(core::convertScalar(CimType::Uint16, CimScalar(std::int64_t{-5})));
    EXPECT_FALSE(core::convertScalar(CimType::Sint64, CimScalar(~std::uint64_t{0})));
    EXPECT_FALSE(core::convertScalar(CimType::Boolean, CimScalar(std::uint64_t{1})));
    EXPECT_TRUE(core::convertScalar(CimType::Reference, CimScalar(std::string("A.B=1"))));
}

TEST(CimPathTest, ReadsBackTheTextThatItWrites) {
    for (const std::vector<std::string>& row : test::readTestTable(QUENX_FRAMEWORK_SAMPLES "/paths")) {
        const CimPath path(row[0]);
        EXPECT_TRUE(path.isValid()) << row[0];
        EXPECT_EQ(path.toString(), row[0]);
    }
}

TEST(CimPathTest, KeepsATextThatDoesNotParseAndNamesNothing) {
    using namespace std::string_literals;
    for (const std::string& text :
         {""s, "."s, "1Class"s, "Class."s, "Class.Key="s, "Class.Key=\"open"s, "Class.Key=\"end\\"s,
          "Class.Key=\"a\"x"s, "Class.Key=\"a\","s, "Class.A=1,a=2"s, "//host"s, "Class.Key=word"s,
          "a b:c d.e=\"f\""s, "Class.K=\"a\0b\"\0"s}) {
        const CimPath path(text);
        EXPECT_FALSE(path.isValid()) << text;
        EXPECT_EQ(path.toString(), text);
        EXPECT_FALSE(path.isSameObjectAs(path)) << text;
    }
}

TEST(CimPathTest, ComparesNamesWithoutCaseAndValuesByType) {
    for (const auto& row : test::readTestTable(QUENX_FRAMEWORK_SAMPLES "/paths-compared")) {
        const CimPath left(row[0]);
        const CimPath right(row.at(1));
        const bool isSame = row.at(2) == "same";
        EXPECT_TRUE(left.isSameObjectAs(right) == isSame && right.isSameObjectAs(left) == isSame) << row[1];
    }
    // A reference as a value, and the same as the quoted text that a path holds.
    const CimPath value("Link", {{"From", core::CimScalar(CimPath(std::string("Thing.Name=\"x\"")))}});
    EXPECT_TRUE(value.isSameObjectAs(CimPath(std::string("LINK.from=\"root/x:thing.NAME=\\\"x\\\"\""))));
    EXPECT_FALSE(value.isSameObjectAs(CimPath(std::string("Link.From=\"Thing.Name=\\\"y\\\"\""))));
}

}  // namespace
