// SPDX-License-Identifier: Apache-2.0
#include "Utils/Uri.h"

#include <gtest/gtest.h>

#include "Support/SyslogCapture.h"

using utils::Uri;
using Scheme = Uri::SupportedURISchemes;
using Lines = std::vector<std::string>;

TEST(UriTest, GivesSchemePathAndLogLine) {
    const test::LogLevelGuard guard(2);
    const struct {
        const char* text;
        Scheme scheme;
        const char* path;
        const char* line;  // the message of the debug line, null for none
    } rows[] = {
        {"file:///opt/fw/image.bin", Scheme::File, "/opt/fw/image.bin", nullptr},
        {"FiLe:///x", Scheme::File, "/x", nullptr},
        {"file://server/x", Scheme::File, "server/x", nullptr},
        {"file:///a:b::c:", Scheme::File, "/a:b::c:", nullptr},
        {"file:///a%20b%2F", Scheme::File, "/a%20b%2F", nullptr},
        {"file://", Scheme::File, "", nullptr},
        {"data://x", Scheme::Data, "x", nullptr},
        {"ftp://x", Scheme::Ftp, "x", nullptr},
        {"http://x", Scheme::Http, "x", nullptr},
        {"https://host:80/x", Scheme::Https, "host:80/x", nullptr},
        {"nfs://x", Scheme::Nfs, "x", nullptr},
        {"tftp://x", Scheme::Tftp, "x", nullptr},
        {"file:/x", Scheme::Unknown, "", "Uknown URI format of 'file:/x'"},
        {"://x", Scheme::Unknown, "", "Uknown URI format of '://x'"},
        {" file:///x", Scheme::Unknown, "", "Uknown URI format of ' file:///x'"},
        {"/opt/%n%s", Scheme::Unknown, "", "Incorrect URI format of '/opt/%n%s'"},
        {"", Scheme::Unknown, "", nullptr},
    };
    for (const auto& row : rows) {
        test::SyslogCapture::clear();
        const Uri uri(row.text);
        SCOPED_TRACE(row.text);
        EXPECT_EQ(uri.getScheme(), row.scheme);
        EXPECT_EQ(uri.getSourcePath(), row.path);
        EXPECT_EQ(uri.IsUriSupported(), row.scheme == Scheme::File);
        EXPECT_EQ(test::SyslogCapture::messages(), row.line == nullptr ? Lines{} : Lines{row.line});
    }
    Uri reused("file:///kept");
    reused.parseUri("no scheme");
    EXPECT_EQ(reused.getScheme(), Scheme::Unknown);
    EXPECT_EQ(reused.getSourcePath(), "/kept");
}
