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
