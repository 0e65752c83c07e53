// SPDX-License-Identifier: Apache-2.0
#include "Framework/Model/CimValue.h"

#include <gtest/gtest.h>

#include <limits>

#include "Support/TempFolder.h"

namespace {

using core::CimPath;
using core::CimScalar;
using core::CimType;

TEST(CimValueTest, KeepsNumbersToTheRangeOfTheirType) {
    const auto textOf = [](const std::optional<CimScalar>& value) {
        return value ? core::scalarText(*value) : "none";
    };
    for (const std::vector<std::string>& row : test::readTestTable(QUENX_FRAMEWORK_SAMPLES "/values")) {
        const CimType type = core::typeByName(row[0]).value();
        for (std::size_t i = 1; i < row.size(); ++i) {
            const std::string text = row[i].substr(0, row[i].find(" = "));
            EXPECT_EQ(text + " = " + textOf(core::parseScalar(type, text)), row[i]) << row[0];
        }
    }
    EXPECT_EQ(textOf(core::parseScalar(CimType::Reference, "no path!")), "none");
    // What JSON and CMPI hold may be none of these.
    EXPECT_EQ(core::scalarText(CimScalar(std::numeric_limits<double>::infinity())), "inf");
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
    EXPECT_EQ(core::datetimeText(*core::parseDatetime("20231231233000.000000-060")),
              "20240101003000.000000+000");
    EXPECT_EQ(core::datetimeText(*core::parseDatetime("12345678235959.999999:000")),
              "12345678235959.999000:000");
    for (const char* text :
         {"20240230000000.000000+000", "20240229******.******+000", "20240229235960.000000+000",
          "20240229236000.000000+000", "20240229240000.000000+000", "2024022923595.123000+0000",
          "00000000240000.000000:000", "00000000000000.000000:001", "19691231000000.000000+000",
          "19700101000000.000000+001", "20240229000000.000000*000", "20240229000000,000000+000",
          "+0240229000000.000000+000", "20240229000000.000000+0x0", "20241301000000.000000+000"}) {
        EXPECT_FALSE(core::parseDatetime(text)) << text;
    }
}

TEST(CimValueTest, ConvertsWithoutLoss) {
    EXPECT_TRUE(core::convertScalar(CimType::Uint16, CimScalar(std::int64_t{5})));
    EXPECT_FALSE(core::convertScalar(CimType::Uint16, CimScalar(std::int64_t{-5})));
    EXPECT_FALSE(core::convertScalar(CimType::Sint64, CimScalar(~std::uint64_t{0})));
    EXPECT_FALSE(core::convertScalar(CimType::Sint8, CimScalar(std::uint64_t{128})));
    EXPECT_TRUE(core::convertScalar(CimType::Sint8, CimScalar(std::uint64_t{127})));
    const CimScalar time(utils::Time(0));
    const CimScalar values[] = {true, 0.5, time, CimPath("A"), std::string("A.B=1"), std::int64_t{1}};
    const CimType types[] = {CimType::Boolean,   CimType::Real32, CimType::Datetime,
                             CimType::Reference, CimType::String, CimType::Uint8};
    std::string converted;
    for (const CimType type : types) {
        for (const CimScalar& value : values) {
            const auto held = core::convertScalar(type, value);
            converted += held ? core::scalarText(*held) + " " : "- ";
        }
        converted += "\n";
    }
    EXPECT_EQ(converted,
              "TRUE - - - - - \n"
              "- 0.5 - - - - \n"
              "- - 00000000000000.000000:000 - - - \n"
              "- - - A A.B=1 - \n"
              "- - - - A.B=1 - \n"
              "- - - - - 1 \n");
    const CimScalar written(std::string("00000000000000.000000:000"));
    EXPECT_TRUE(core::sameValue(core::convertScalar(CimType::Datetime, written).value(), time));
}

TEST(CimValueTest, TellsWhatIsTheSame) {
    const std::pair<CimScalar, CimScalar> same[] = {
        {std::uint64_t{7}, std::int64_t{7}},
        {utils::Time(5000000), std::string("00000000000005.000000:000")},
        {0.0, -0.0},
        {CimPath("A.B=1,C=\"x\""), CimPath("a.c=\"x\",b=1")}};
    for (const auto& [left, right] : same)
        EXPECT_TRUE(core::sameValue(left, right) && core::sameValue(right, left)) << core::scalarText(left);
    const CimScalar others[] = {std::uint64_t{8}, 0.5, true, std::string("7"), CimPath("A.B=2")};
    for (const auto& [left, right] : same)
        for (const CimScalar& other : others)
            EXPECT_FALSE(core::sameValue(left, other)) << core::scalarText(left);
    EXPECT_FALSE(core::sameValue(CimScalar(utils::Time(0)), CimScalar(utils::Time(1000))));
}

TEST(CimValueTest, ShowsAListAsFarAsIsEnough) {
    std::vector<CimScalar> numbers;
    for (std::uint64_t i = 0; i < 9; ++i)
        numbers.emplace_back(i);
    const auto list = core::CimValue::arrayOf(CimType::Uint8, std::move(numbers));
    EXPECT_EQ(core::valueText(list), "0,1,2,3,4,5,6,7,8");
    EXPECT_EQ(core::valueText(list, 4), "0,1,2");
    EXPECT_EQ(core::valueText(list, 0), "0");
    EXPECT_EQ(core::valueText(core::CimValue::of(CimType::Uint8, CimScalar(std::uint64_t{12})), 0), "12");
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
