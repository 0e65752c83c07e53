// SPDX-License-Identifier: Apache-2.0
#include "Utils/Utils.h"

#include <gtest/gtest.h>

TEST(UtilsTest, CutsFormatsAt511) {
    EXPECT_EQ(fmt("%s", std::string(511, 'a').c_str()).size(), 511U);
    EXPECT_EQ(fmt("%s", std::string(512, 'a').c_str()), std::string(511, 'a'));
    // A failure of the C library counts as a text that is too long.
    EXPECT_EQ(utils::formatStr("a%ls", L"\xD800").size(), 511U);
}

TEST(UtilsTest, FoldsLettersOfAsciiOnly) {
    EXPECT_EQ(utils::lowerCase("AZ[\xC3\x84@az"), "az[\xC3\x84@az");
    EXPECT_TRUE(utils::equalsIgnoringCase("Quenx_Z", "qUENX_z"));
    EXPECT_FALSE(utils::equalsIgnoringCase("a", "ab"));
    EXPECT_FALSE(utils::equalsIgnoringCase("[", "{"));
}
