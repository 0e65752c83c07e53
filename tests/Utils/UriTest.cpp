// SPDX-License-Identifier: Apache-2.0
#include "Utils/Uri.h"

#include <gtest/gtest.h>

#include "Support/SyslogCapture.h"

using utils::Uri;
using Scheme = Uri::SupportedURISchemes;
using Lines = std::vector<std::string>;

TEST(UriTest, GivesSchemePathAndLogLine) {
    const test::LogLevelGuard guard(2);
    const std::tuple<const char*, Scheme, const char*, Lines> table[] = {
        {"file:///opt/fw/image.bin", Scheme::File, "/opt/fw/image.bin", {}},
        {"FiLe:///x", Scheme::File, "/x", {}},
        {"file://server/x", Scheme::File, "server/x", {}},
        {"file:///a:b::c:", Scheme::File, "/a:b::c:", {}},
        {"file:///a%20b%2F", Scheme::File, "/a%20b%2F", {}},
        {"file://", Scheme::File, "", {}},
        {"data://x", Scheme::Data, "x", {}},
        {"ftp://x", Scheme::Ftp, "x", {}},
        {"http://x", Scheme::Http, "x", {}},
        {"https://host:80/x", Scheme::Https, "host:80/x", {}},
        {"nfs://x", Scheme::Nfs, "x", {}},
        {"tftp://x", Scheme::Tftp, "x", {}},
        {"file:/x", Scheme::Unknown, "", {"Uknown URI format of 'file:/x'"}},
        {"://x", Scheme::Unknown, "", {"Uknown URI format of '://x'"}},
        {" file:///x", Scheme::Unknown, "", {"Uknown URI format of ' file:///x'"}},
        {"/opt/%n%s", Scheme::Unknown, "", {"Incorrect URI format of '/opt/%n%s'"}},
        {"", Scheme::Unknown, "", {}},
    };
    for (const auto& [text, scheme, path, lines] : table) {
        test::SyslogCapture::clear();
        const Uri uri(text);
        SCOPED_TRACE(text);
        EXPECT_EQ(uri.getScheme(), scheme);
        EXPECT_EQ(uri.getSourcePath(), path);
        EXPECT_EQ(uri.IsUriSupported(), scheme == Scheme::File);
        EXPECT_EQ(test::SyslogCapture::messages(), lines);
    }
    Uri reused("file:///kept");
    reused.parseUri("no scheme");
    EXPECT_EQ(reused.getScheme(), Scheme::Unknown);
    EXPECT_EQ(reused.getSourcePath(), "/kept");
}
