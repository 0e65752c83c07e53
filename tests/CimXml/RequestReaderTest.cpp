// SPDX-License-Identifier: Apache-2.0
#include "CimXml/Request.h"

#include <gtest/gtest.h>

#include "CimXml/WireCheck.h"
#include "CimXml/WireError.h"

namespace {

using cimxml::Request;
using cimxml::WireFault;

template <class T>
T held(const Request& request, std::string_view name) {
    for (const cimxml::Parameter& each : std::get<cimxml::IntrinsicCall>(request.call).parameters) {
        if (each.name == name) return std::get<T>(each.value);
    }
    ADD_FAILURE() << name;
    return T{};
}

TEST(RequestReaderTest, ReadsWhatClientsSend) {
    for (const std::string& name : test::sampleNames()) {
        const std::string sample = test::readSample(name);
        const Request request = cimxml::readRequest(sample);
        EXPECT_EQ(request.messageId, name.starts_with("w-") ? "4711" : "1001");
        EXPECT_EQ(name.substr(2), request.name() + ".xml");
        for (std::size_t length = 0; length < sample.find("</CIM>") + 6; ++length)
            EXPECT_THROW(cimxml::readRequest(sample.substr(0, length)), cimxml::WireError) << length;
        if (name == "w-CreateInstance.xml") continue;  // of the instance only its name is kept
        const std::string written = cimxml::writeRequest(request);
        EXPECT_EQ(cimxml::writeRequest(cimxml::readRequest(written)), written) << name;
    }
    const Request get = cimxml::readRequest(test::readSample("w-GetInstance.xml"));
    EXPECT_EQ(std::get<cimxml::IntrinsicCall>(get.call).namespaceName, "root/cimv2");
    EXPECT_EQ(held<std::string>(get, "LocalOnly"), "FALSE");
    EXPECT_EQ(held<core::CimPath>(get, "InstanceName").toString(),
              "root/cimv2:Quenx_ConcreteJob.InstanceID=\"Quenx:FirmwareUpdate@Job#1\"");
    const Request walk = cimxml::readRequest(test::readSample("p-Associators.xml"));
    EXPECT_EQ(held<cimxml::ClassName>(walk, "AssocClass").name, "CIM_ElementCapabilities");
    EXPECT_EQ(held<std::vector<std::string>>(walk, "PropertyList"), std::vector<std::string>{"Name"});
    const Request open = cimxml::readRequest(test::readSample("p-OpenEnumerateInstances.xml"));
    held<std::monostate>(open, "FilterQuery");
}

/// The call inside an envelope that is right.
std::string wrapped(const std::string& call) {
    return "<CIM CIMVERSION=\"2.3\" DTDVERSION=\"2.1\"><MESSAGE ID=\"1\" "
           "PROTOCOLVERSION=\"1.1\"><SIMPLEREQ>" +
           call + "</SIMPLEREQ></MESSAGE></CIM>";
}

std::string parameterWith(const std::string& value) {
    return wrapped(
        "<IMETHODCALL NAME=\"X\"><LOCALNAMESPACEPATH><NAMESPACE NAME=\"root\"/></LOCALNAMESPACEPATH>"
        "<IPARAMVALUE NAME=\"P\">" +
        value + "</IPARAMVALUE></IMETHODCALL>");
}

TEST(RequestReaderTest, KeepsTextsAsTheyAre) {
    for (const auto& [text, expected] : std::initializer_list<std::pair<const char*, const char*>>{
             {"<VALUE>  two  </VALUE>", "  two  "},
             {"<VALUE> </VALUE>", " "},
             {"<VALUE/>", ""},
             {"<VALUE>&lt;a&#x20AC;<![CDATA[<&>]]>&amp;</VALUE>", "<a\xE2\x82\xAC<&>&"},
             {"\n <VALUE>a<!-- c -->b</VALUE>\n", "ab"}}) {
        EXPECT_EQ(held<std::string>(cimxml::readRequest(parameterWith(text)), "P"), expected);
    }
}

TEST(RequestReaderTest, RefusesEachFaultByItsName) {
    const std::string good = test::readSample("w-GetInstance.xml");
    const auto changed = [&](const std::string& from, const std::string& to) {
        std::string text = good;
        EXPECT_NE(text.find(from), std::string::npos) << from;
        return text.replace(text.find(from), from.size(), to);
    };
    const std::string place = "<LOCALNAMESPACEPATH><NAMESPACE NAME=\"root\"/></LOCALNAMESPACEPATH>";
    const std::pair<std::string, WireFault> table[] = {
        {"<CIM/>", WireFault::NotValid},
        {changed("CIMVERSION=\"2.0\"", "CIMVERSION=\"3.0\""), WireFault::UnsupportedCimVersion},
        {changed("DTDVERSION=\"2.0\"", "DTDVERSION=\"1.0\""), WireFault::UnsupportedDtdVersion},
        {changed("PROTOCOLVERSION=\"1.0\"", "PROTOCOLVERSION=\"2.0\""), WireFault::UnsupportedProtocol},
        {changed("PROTOCOLVERSION=\"1.0\"", ""), WireFault::NotValid},
        {changed("ID=\"4711\"", ""), WireFault::NotValid},
        {changed("NAME=\"GetInstance\"", ""), WireFault::NotValid},
        {changed("<SIMPLEREQ>", "<SIMPLEREQ>text"), WireFault::NotValid},
        {changed("</IMETHODCALL>", ""), WireFault::NotWellFormed},
        {"<CIM CIMVERSION='2.0' DTDVERSION='2.0'><MESSAGE ID='1' "
         "PROTOCOLVERSION='1.0'><MULTIREQ/></MESSAGE></CIM>",
         WireFault::MultipleRequests},
        {wrapped(""), WireFault::NotValid},
        {wrapped("<OTHERCALL/>"), WireFault::NotValid},
        {wrapped("<IMETHODCALL NAME='X'/>"), WireFault::NotValid},
        {wrapped("<IMETHODCALL NAME='X'><LOCALNAMESPACEPATH/></IMETHODCALL>"), WireFault::NotValid},
        {wrapped("<METHODCALL NAME='X'>" + place + "</METHODCALL>"), WireFault::NotValid},
        {parameterWith("<VALUE/><VALUE/>"), WireFault::NotValid},
        {parameterWith("<VALUE><B/></VALUE>"), WireFault::NotValid},
        {parameterWith("<UNKNOWN/>"), WireFault::NotValid},
        {parameterWith("<VALUE.ARRAY><CLASSNAME NAME='x'/></VALUE.ARRAY>"), WireFault::NotValid},
        {parameterWith(
             "<INSTANCENAME CLASSNAME='C'><KEYVALUE>1</KEYVALUE><KEYVALUE>2</KEYVALUE></INSTANCENAME>"),
         WireFault::NotValid},
    };
    for (const auto& [message, fault] : table) {
        try {
            cimxml::readRequest(message);
            ADD_FAILURE() << "accepted: " << message;
        } catch (const cimxml::WireError& error) {
            EXPECT_STREQ(cimxml::cimErrorHeader(error.fault()), cimxml::cimErrorHeader(fault)) << message;
            EXPECT_STRNE(error.what(), "");
        }
    }
}

}  // namespace
