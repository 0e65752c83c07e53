// SPDX-License-Identifier: Apache-2.0
#include "Framework/Model/CimValue.h"

#include <gtest/gtest.h>

namespace {

using core::CimScalar;
using core::CimType;

TEST(CimValueTest, KeepsNumbersToTheRangeOfTheirType) {
    struct Row {
        CimType type;
        const char* text;
        bool accepted;
    };
    for (const Row& row : {
             Row{CimType::Uint8, "256", false},
             Row{CimType::Uint8, "-1", false},
             Row{CimType::Uint16, " 0xFFFF ", true},
             Row{CimType::Sint8, "-128", true},
             Row{CimType::Sint8, "-129", false},
             Row{CimType::Uint32, "5x", false},
             Row{CimType::Uint64, "18446744073709551615", true},
             Row{CimType::Uint64, "18446744073709551616", false},
             Row{CimType::Sint64, "-9223372036854775808", true},
             Row{CimType::Boolean, "tRuE", true},
             Row{CimType::Boolean, "1", false},
             Row{CimType::Real64, "1.5e+03", true},
             Row{CimType::Datetime, "tomorrow", false},
             Row{CimType::Reference, "no path!", false},
         }) {
        EXPECT_EQ(core::parseScalar(row.type, row.text).has_value(), row.accepted) << row.text;
    }
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

}  // namespace
