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

/// Why the document is refused; empty where it is well-formed.
std::string faultOf(const std::string& document) try {
    checkWellFormed(document);
    return "";
} catch (const WireError& error) {
    return error.what();
}

TEST(XmlGuardTest, TellsWhatIsWellFormed) {
    for (const char* good :
         {"\xEF\xBB\xBF<?xml version='1.0' encoding=\"UTF-8\" standalone='yes'?>\n<a/>",
          "<?xml\tversion='1.1' encoding='US-ascii'?><a/>", " \t\r\n<a/>\n",
          "<a b = '1' c=\"&lt;'\"><d >x &amp; &#x41; &#x10FFFF; ]] ></d ><![CDATA[<&]]></a>",
          "<a>&quot;&apos;&gt;&#00000000000065;</a>", "<_:.-9 _=''/>", "<a><b/><b></b></a>",
          "<?xml version='1.0'?><a>gr\xC3\xBC\xE2\x82\xAC\xF0\x9F\x98\x80\t\r\n</a>\n<!-- end --><?p x?>"})
        EXPECT_EQ(faultOf(good), "") << good;
    const std::pair<std::string, const char*> outside[] = {
        {"", "the document has no element"},
        {"<!-- x -->", "the document has no element"},
        {"<a>", "the document ends inside an element"},
        {"<a></b>", "an end tag has no start tag"},
        {"</a>", "an end tag has no start tag"},
        {"<a></a b>", "an end tag is not ended"},
        {"<a/><b/>", "a second root element"},
        {"text<a/>", "text outside the root element"},
        {"<a/>&amp;", "text outside the root element"},
        {"<![CDATA[x]]><a/>", "text outside the root element"},
        {"<1a/>", "a name was expected"},
        {"<", "a name was expected"},
        {"<a", "a tag is not ended"},
        {"<a / >", "a tag is not ended"},
        {"<!DOCTYPE a><a/>", "a document type is not accepted"},
        {"<!DOCTYPE a [<!ENTITY x 'y'>]><a>&x;</a>", "a document type is not accepted"},
        {" <?xml version='1.0'?><a/>", "an XML declaration in the middle"},
        {"<?xml?><a/>", "an XML declaration in the middle"},
        {"<?xml-stylesheet x?><a/>", "an XML declaration in the middle"},
        {"<?xml ?><a/>", "the XML declaration has no version 1"},
        {"<?xml version='2.0'?><a/>", "the XML declaration has no version 1"},
        {"<?xml encoding='utf-8'?><a/>", "the XML declaration has no version 1"},
        {"<?xml version='1.0'><a/>", "the XML declaration is not ended"},
        {"<?xml version='1.0' encoding='utf-16'?><a/>", "the document is not in UTF-8"},
        {"<?xml version='1.0' standalone='no' encoding='latin1'?><a/>", "the document is not in UTF-8"},
        {"<?p x", "a processing instruction is not ended"}};
    for (const auto& [bad, fault] : outside)
        EXPECT_EQ(faultOf(bad), fault) << bad;
    const std::pair<std::string, const char*> inside[] = {{"<b c=1/>", "an attribute is not quoted"},
                                                          {"<b c", "an attribute has no value"},
                                                          {"<b c='1' c='2'/>", "an attribute is repeated"},
                                                          {"<b c='<'/>", "an attribute holds '<'"},
                                                          {"<b c='1/>", "an attribute is not ended"},
                                                          {"<b c='1'd=''/>", "a tag is not ended"},
                                                          {"<!ELEMENT b>", "a document type is not accepted"},
                                                          {"<!-- -- -->", "a comment holds two hyphens"},
                                                          {"<!-- ", "a comment is not ended"},
                                                          {"<![CDATA[x]>", "a CDATA section is not ended"},
                                                          {"]]>", "']]>' in text"}};
    for (const auto& [bad, fault] : inside)
        EXPECT_EQ(faultOf("<a>" + bad + "</a>"), fault) << bad;
    for (const std::string entity : {"&", "&unknown;", "&amp", "&#0;", "&#;", "&#-65;", "&#x;", "&#65",
                                     "&#xD800;", "&#x110000;", "&#000000000000065;"}) {
        EXPECT_EQ(faultOf("<a>" + entity + "</a>"), "an entity that is not one of the five") << entity;
        EXPECT_EQ(faultOf("<a b='" + entity + "'/>"), "an entity that is not one of the five") << entity;
    }
    // NUL, control, bare continuation, overlong, surrogate, beyond the last plane, cut short, FFFE.
    for (const std::string& bytes : {"\0"s, "\x01"s, "\x80"s, "\xC0\x80"s, "\xE0\x80\xAF"s, "\xED\xA0\x80"s,
                                     "\xF4\x90\x80\x80"s, "\xE2\x82"s, "\xEF\xBF\xBE"s})
        EXPECT_EQ(faultOf("<a>" + bytes + "</a>"), "a byte that is no character of XML in UTF-8");
}

TEST(XmlTextTest, KnowsEveryCharacter) {
    const auto encoded = [](std::uint32_t number, int length) {
        constexpr unsigned int kLeads[] = {0, 0, 0xC0, 0xE0, 0xF0};
        std::string text(static_cast<std::size_t>(length), ' ');
        for (int i = length - 1; i > 0; --i, number >>= 6)
            text[static_cast<std::size_t>(i)] = static_cast<char>(0x80U | (number & 0x3FU));
        text[0] = static_cast<char>(kLeads[length] | number);
        return text;
    };
    for (std::uint32_t number = 0; number < 0x120000; ++number) {
        const int shortest = number < 0x80 ? 1 : number < 0x800 ? 2 : number < 0x10000 ? 3 : 4;
        const bool isOfXml = number == 9 || number == 10 || number == 13 ||
                             (number >= 0x20 && number <= 0xD7FF) || (number >= 0xE000 && number <= 0xFFFD) ||
                             (number >= 0x10000 && number <= 0x10FFFF);
        const auto expected = static_cast<std::size_t>(isOfXml ? shortest : 0);
        ASSERT_EQ(cimxml::xmlCharacterLength(encoded(number, shortest)), expected) << number;
        ASSERT_TRUE(shortest == 4 || cimxml::xmlCharacterLength(encoded(number, shortest + 1)) == 0)
            << number;
    }
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
    std::string attributes;
    for (int i = 0; i < 32; ++i)
        attributes += " a" + std::to_string(i) + "=''";
    EXPECT_EQ(faultOf("<a" + attributes + "/>"), "");
    EXPECT_EQ(faultOf("<a" + attributes + " b=''/>"), "too many attributes");
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
