#include "Utils/Utils.h"

#include <gtest/gtest.h>

TEST(Utils, FormatsAreCutAt511) {
    EXPECT_EQ(fmt("%s", std::string(511, 'a').c_str()).size(), 511U);
    EXPECT_EQ(fmt("%s", std::string(512, 'a').c_str()), std::string(511, 'a'));
    // A failure of the C library counts as a text that is too long.
    EXPECT_EQ(utils::formatStr("a%ls", L"\xD800").size(), 511U);
}

TEST(Utils, SplittingKeepsEmptyPieces) {
    using utils::split;
    EXPECT_EQ(split("::a:", ':'), (utils::StringArray{"", "", "a", ""}));
    EXPECT_EQ(split("", ':'), (utils::StringArray{""}));
    EXPECT_EQ(utils::trim(" \t a b\t "), "a b");
    EXPECT_EQ(utils::trim(" \t"), "");
    EXPECT_EQ(utils::trim("a\n"), "a\n");
}

TEST(Utils, NumbersMustPrintBackTheSame) {
    const struct {
        const char* text;
        std::int64_t value;  // negative: refused
    } rows[] = {
        {" 7 ", 7},
        {"2147483647", 2147483647},
        {"2147483648", -1},
        {"4294967297", -1},
        {"00", -1},
        {"-1", -1},
        {"", -1},
        {" ", -1},
        {"\t5", -1},
        {"0X01f4", 500},
        {"0xFFFFFFFF", 4294967295},
        {"0x100000000", -1},
        {"0x", -1},
        {"0x0x1", -1},
    };
    for (const auto& row : rows) {
        std::uint32_t value = 77;
        EXPECT_EQ(utils::toUint(row.text, value), row.value >= 0) << row.text;
        EXPECT_EQ(value, row.value >= 0 ? static_cast<std::uint32_t>(row.value) : 77U) << row.text;
    }
}

TEST(Utils, AddressesPrintInHexadecimal) {
    EXPECT_EQ(utils::formatPCIAddr({0x0a, 0x1f, 7, false, "x"}), "0a:1f.7");
    EXPECT_EQ(utils::formatPCIAddr({0xff, 0, 0, true, ""}), "ff:00");
}
