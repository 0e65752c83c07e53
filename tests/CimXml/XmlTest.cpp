// SPDX-License-Identifier: Apache-2.0
#include "CimXml/Xml.h"

#include <gtest/gtest.h>

#include <random>
#include <string>

#include "CimXml/WireError.h"

namespace {

using namespace std::string_literals;
using cimxml::checkWellFormed;
using cimxml::WireError;

TEST(XmlGuardTest, TellsWhatIsWellFormed) {
    for (const char* good :
         {"\xEF\xBB\xBF<?xml version='1.0' encoding=\"UTF-8\" standalone='yes'?>\n<a/>",
          "<a b = '1' c=\"&lt;'\"><d >x &amp; &#x41; &#x10FFFF; ]] ></d ><![CDATA[<&]]></a>",
          "<?xml version='1.0'?><a>gr\xC3\xBC\xE2\x82\xAC\xF0\x9F\x98\x80\t\r\n</a>\n<!-- end --><?p x?>"})
        EXPECT_NO_THROW(checkWellFormed(good)) << good;
    for (const char* bad :
         {"", "<a>", "<a></b>", "<a/><b/>", "text<a/>", "<1a/>", "<![CDATA[x]]><a/>", "<!DOCTYPE a><a/>",
          " <?xml version='1.0'?><a/>", "<?xml version='1.0' encoding='utf-16'?><a/>",
          "<!DOCTYPE a [<!ENTITY x 'y'>]><a>&x;</a>"})
        EXPECT_THROW(checkWellFormed(bad), WireError) << bad;
    const std::string inside[] = {
        "<b c=1/>", "<b c='1' c='2'/>", "<b c='<'/>", "<b c='1/>", "<b c='&no;'/>", "<!ELEMENT b>",
        "<!-- -- -->", "<!-- ", "]]>", "&", "&unknown;", "&amp", "&#0;", "&#;", "&#-65;", "&#xD800;",
        "&#x110000;",
        // NUL, control, bare continuation, overlong, surrogate, beyond the last plane, cut short, FFFE.
        "\0"s, "\x01", "\x80", "\xC0\x80", "\xE0\x80\xAF", "\xED\xA0\x80", "\xF4\x90\x80\x80", "\xE2\x82",
        "\xEF\xBF\xBE"};
    for (const std::string& bad : inside)
        EXPECT_THROW(checkWellFormed("<a>" + bad + "</a>"), WireError) << bad;
}

TEST(XmlGuardTest, KeepsTheLimits) {
    const auto nested = [](std::size_t depth) {
        std::string text;
        for (std::size_t i = 0; i < depth; ++i)
            text = "<a>" + text + "</a>";
        return text;
    };
    EXPECT_NO_THROW(checkWellFormed(nested(64)));
    EXPECT_THROW(checkWellFormed(nested(65)), WireError);
    EXPECT_NO_THROW(checkWellFormed("<a><b/><b/></a>", {.elements = 3}));
    EXPECT_THROW(checkWellFormed("<a><b/><b/><b/></a>", {.elements = 3}), WireError);
    EXPECT_NO_THROW(checkWellFormed("<a b='' c=''/>", {.attributes = 2}));
    EXPECT_THROW(checkWellFormed("<a b='' c='' d=''/>", {.attributes = 2}), WireError);
}

TEST(XmlTextTest, AnyBytesBecomeTextThatIsAccepted) {
    const auto escaped = [](const std::string& text) {
        std::string out;
        cimxml::appendEscaped(out, text);
        return out;
    };
    EXPECT_EQ(escaped("a<b>&\"c' \t\r\n"), "a&lt;b&gt;&amp;&quot;c' \t\r\n");
    EXPECT_EQ(escaped("\0\x01x\x1Fy\x7F"s), "xy\x7F");
    EXPECT_EQ(escaped("\xC3\xBC\xF0\x9F\x98\x80"), "\xC3\xBC\xF0\x9F\x98\x80");
    EXPECT_EQ(escaped("a\xC3"), "a\xEF\xBF\xBD");
    EXPECT_EQ(escaped("\xED\xA0\x80"), "\xEF\xBF\xBD\xEF\xBF\xBD\xEF\xBF\xBD");
    // Plain text is passed over in blocks, wherever in them another byte stands.
    for (std::size_t at = 0; at < 40; ++at) {
        const std::string before(at, 'x');
        const std::string behind(40 - at, 'y');
        EXPECT_EQ(escaped(before + '<' + behind), before + "&lt;" + behind);
        EXPECT_EQ(escaped(before + '\x1F' + behind), before + behind);
        EXPECT_EQ(escaped(before + "\xE2\x82\xAC" + behind), before + "\xE2\x82\xAC" + behind);
        EXPECT_NO_THROW(checkWellFormed("<a>" + before + "&lt;\xC3\xBC" + behind + "</a>"));
        for (const char* bad : {"\x1F", "\x80", "\xEF\xBF\xBF"})
            EXPECT_THROW(checkWellFormed("<a>" + before + bad + behind + "</a>"), WireError) << at;
    }
    std::mt19937 random(1);
    for (int round = 0; round < 2000; ++round) {
        std::string bytes(random() % 40, ' ');
        for (char& byte : bytes)
            byte = static_cast<char>(random() % 3 == 0 ? 0x80 + random() % 128 : random());
        const std::string text = escaped(bytes);
        ASSERT_NO_THROW(checkWellFormed("<a b=\"" + text + "\">" + text + "</a>")) << text;
    }
}

}  // namespace
