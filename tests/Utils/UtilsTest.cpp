// SPDX-License-Identifier: Apache-2.0
#include "Utils/Utils.h"

#include <gtest/gtest.h>

#include "Support/SyslogCapture.h"
#include "Support/TempFolder.h"
#include "Utils/Uri.h"

using utils::Uri;
using Texts = std::vector<std::string>;

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

TEST(UriTest, GivesSchemePathAndLogLine) {
    const test::LogLevelGuard guard(2);
    const Texts schemes{"unknown", "reserved", "data", "file", "ftp", "http", "https", "nfs", "tftp"};
    for (const Texts& row : test::readTestTable(QUENX_UTILS_SAMPLES "/uris")) {
        test::SyslogCapture::clear();
        const Uri uri(row[0]);
        SCOPED_TRACE(row[0]);
        const std::string& scheme = schemes.at(static_cast<std::size_t>(uri.getScheme()));
        EXPECT_EQ(scheme + ":" + uri.getSourcePath(), row.at(1));
        EXPECT_EQ(uri.IsUriSupported(), scheme == "file");
        EXPECT_EQ(test::SyslogCapture::messages(), Texts(row.begin() + 2, row.end()));
    }
    Uri reused("file:///kept");
    reused.parseUri("no scheme");
    EXPECT_EQ(reused.getScheme(), Uri::SupportedURISchemes::Unknown);
    EXPECT_EQ(reused.getSourcePath(), "/kept");
    test::SyslogCapture::clear();
    EXPECT_EQ(Uri("").getScheme(), Uri::SupportedURISchemes::Unknown);
    EXPECT_EQ(test::SyslogCapture::messages(), Texts{});
}
