// SPDX-License-Identifier: Apache-2.0
#include <gmock/gmock.h>

#include "CimXml/Request.h"
#include "CimXml/Response.h"
#include "CimXml/WireCheck.h"
#include "CimXml/WireError.h"

namespace {

using cimxml::IntrinsicResult;
using cimxml::Request;
using cimxml::ResultKind;
using cimxml::WireError;
using core::CimPath;
using core::CimType;
using core::CimValue;
using ::testing::HasSubstr;
using ::testing::Not;
using ::testing::ResultOf;
using ::testing::StrEq;
using ::testing::Throws;

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
            EXPECT_THROW(cimxml::readRequest(sample.substr(0, length)), WireError) << length;
        if (name == "w-CreateInstance.xml") continue;  // of the instance only its name is kept
        const std::string written = cimxml::writeRequest(request);
        EXPECT_EQ(cimxml::writeRequest(cimxml::readRequest(written)), written) << name;
    }
    const Request get = cimxml::readRequest(test::readSample("w-GetInstance.xml"));
    EXPECT_EQ(std::get<cimxml::IntrinsicCall>(get.call).namespaceName, "root/cimv2");
    EXPECT_EQ(held<std::string>(get, "LocalOnly"), "FALSE");
    EXPECT_EQ(held<CimPath>(get, "InstanceName").toString(),
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
             {"\n <VALUE>a<!-- c -->b</VALUE>\n", "ab"}})
        EXPECT_EQ(held<std::string>(cimxml::readRequest(parameterWith(text)), "P"), expected);
}

/// A path whose key is a path, and so on.
std::string nested(int levels) {
    return "<INSTANCENAME CLASSNAME='C'>" +
           (levels == 0 ? "<KEYVALUE>\"</KEYVALUE>"
                        : "<VALUE.REFERENCE>" + nested(levels - 1) + "</VALUE.REFERENCE>") +
           "</INSTANCENAME>";
}

TEST(RequestReaderTest, RefusesEachFaultByItsName) {
    const std::string good = test::readSample("w-GetInstance.xml");
    const auto changed = [&](const std::string& from, const std::string& to) {
        std::string text = good;
        EXPECT_NE(text.find(from), std::string::npos) << from;
        return text.replace(text.find(from), from.size(), to);
    };
    // Its text is 2^n quotes long.
    held<CimPath>(cimxml::readRequest(parameterWith(nested(3))), "P");
    const std::string place = "<LOCALNAMESPACEPATH><NAMESPACE NAME='root'/></LOCALNAMESPACEPATH>";
    const std::pair<const char*, std::vector<std::string>> table[] = {
        {"unsupported-cim-version", {changed("CIMVERSION=\"2.0\"", "CIMVERSION=\"3.0\"")}},
        {"unsupported-dtd-version", {changed("DTDVERSION=\"2.0\"", "DTDVERSION=\"1.0\"")}},
        {"unsupported-protocol-version", {changed("PROTOCOLVERSION=\"1.0\"", "PROTOCOLVERSION=\"2.0\"")}},
        {"request-not-well-formed", {changed("</IMETHODCALL>", "")}},
        {"multiple-requests-unsupported",
         {"<CIM CIMVERSION='2.0' DTDVERSION='2.0'><MESSAGE ID='1' "
          "PROTOCOLVERSION='1.0'><MULTIREQ/></MESSAGE></CIM>"}},
        {"request-not-valid",
         {"<CIM/>", changed("PROTOCOLVERSION=\"1.0\"", ""), changed("ID=\"4711\"", ""),
          changed("4711", std::string(1025, '1')), changed("NAME=\"GetInstance\"", ""),
          changed("<SIMPLEREQ>", "<SIMPLEREQ>text"), wrapped(""), wrapped("<OTHERCALL/>"),
          wrapped("<IMETHODCALL NAME='X'/>"),
          wrapped("<IMETHODCALL NAME='X'><LOCALNAMESPACEPATH/></IMETHODCALL>"),
          wrapped("<METHODCALL NAME='X'>" + place + "</METHODCALL>"), parameterWith("<VALUE/><VALUE/>"),
          parameterWith("<VALUE><B/></VALUE>"), parameterWith("<UNKNOWN/>"), parameterWith(nested(4)),
          parameterWith("<VALUE.REFARRAY><VALUE.REFERENCE>" + nested(4) +
                        "</VALUE.REFERENCE></VALUE.REFARRAY>"),
          parameterWith("<VALUE.ARRAY><CLASSNAME NAME='x'/></VALUE.ARRAY>"),
          parameterWith("<INSTANCENAME CLASSNAME='C'><KEYVALUE>1</KEYVALUE>"
                        "<KEYVALUE>2</KEYVALUE></INSTANCENAME>")}},
    };
    for (const auto& [fault, messages] : table) {
        const auto isIt =
            ResultOf([](const WireError& error) { return error.fault().cimError; }, StrEq(fault));
        for (const std::string& message : messages)
            EXPECT_THAT([&] { cimxml::readRequest(message); }, Throws<WireError>(isIt)) << message;
    }
}

TEST(RequestReaderTest, NotesAnArgumentThatIsNotOfItsStatedType) {
    const auto mistyped = [](const std::string& argument) {
        const Request request = cimxml::readRequest(
            wrapped("<METHODCALL NAME='X'><LOCALCLASSPATH><LOCALNAMESPACEPATH><NAMESPACE NAME='root'/>"
                    "</LOCALNAMESPACEPATH><CLASSNAME NAME='C'/></LOCALCLASSPATH><PARAMVALUE NAME='P' " +
                    argument + "</PARAMVALUE></METHODCALL>"));
        return std::get<cimxml::MethodCall>(request.call).mistypedArgument;
    };
    const std::string reference = "<VALUE.REFERENCE><CLASSNAME NAME='C'/></VALUE.REFERENCE>";
    const std::string array = "<VALUE.ARRAY><VALUE>5</VALUE></VALUE.ARRAY>";
    for (const std::string& good : {">" + reference, "PARAMTYPE='reference'>" + reference,
                                    "PARAMTYPE='uint8'>" + array, std::string(">")})
        EXPECT_EQ(mistyped(good), "") << good;
    for (const std::string& bad :
         {"PARAMTYPE='string'>" + reference, std::string("PARAMTYPE='reference'><VALUE>C</VALUE>"),
          std::string("><VALUE.ARRAY><VALUE>x</VALUE><VALUE.NULL/></VALUE.ARRAY>")})
        EXPECT_EQ(mistyped(bad), "P") << bad;
}

TEST(RequestHeadersTest, HaveToNameWhatIsCalled) {
    const auto check = [](const Request& request, const char* object,
                          std::optional<std::string> method = {}) {
        cimxml::checkHeadersAgainst({{}, std::move(method), object, {}}, request);
    };
    const Request get{"1", cimxml::IntrinsicCall{"GetInstance", "root/cimv2", {}}};
    for (const char* same : {"root/cimv2", "Root%2fCIMv2", "/root/cimv2/", "//host:1/root/cimv2"})
        EXPECT_NO_THROW(check(get, same)) << same;
    for (const char* other : {"", "root", "root/cimv2/x", "root/cimv2:CIM_Service", "interop", "%"})
        EXPECT_THROW(check(get, other), WireError) << other;

    CimPath object("C_Job", {{"ID", std::string("a\"b\\c")}, {"Number", std::string("0x5")}});
    object.setNamespace("root/cimv2");
    const Request kill{"1", cimxml::MethodCall{"Kill", object, {}}};
    const char* const right = "root/cimv2:C_Job.ID=\"a\\\"b\\\\c\",Number=5";
    for (const char* same : {right, "//h/root/cimv2:c_job.number=5,id=\"a\\\"b\\\\c\"",
                             "root%2Fcimv2%3AC_Job.ID=%22a%5C%22b%5C%5Cc%22,Number=5",
                             "root/cimv2:C_Job.ID=\"a\"b\\c\",Number=0x5"})  // a client that escapes nothing
        EXPECT_NO_THROW(check(kill, same)) << same;
    for (const char* other :
         {"", "root/cimv2", "root/cimv2:C_Job", "root/interop:C_Job.ID=\"a\\\"b\\\\c\",Number=5",
          "root/cimv2:C_Other.ID=\"a\\\"b\\\\c\",Number=5", "root/cimv2:C_Job.ID=\"x\",Number=5",
          "root/cimv2:C_Job.ID=\"a\\\"b\\\\c\",Number=6", "root/cimv2:C_Job.ID=\"a\\\"b\\\\c\"",
          "root/cimv2:C_Other.ID=\"a\"b\""})
        EXPECT_THROW(check(kill, other), WireError) << other;
    EXPECT_NO_THROW(check(kill, right, "K%69LL"));
    EXPECT_THROW(check(kill, right, "Start"), WireError);
}

/// An instance with the values whose texts are easily wrong.
core::InstanceValue oddValues() {
    const auto property = [](const char* name, CimValue value, const char* referenceClass = "") {
        return core::PropertyValue{name, std::move(value), false, referenceClass};
    };
    return {CimPath("root/cimv2:T_Job.ID=\"J#1\",Number=7,Flag=TRUE"),
            {property("Odd", CimValue::of(CimType::String, std::string("<&>\"' \xC3\xBC\x01"))),
             property("Empty", CimValue::of(CimType::String, std::string())),
             property("Null", CimValue::null(CimType::Uint8)),
             property("Flag", CimValue::of(CimType::Boolean, true)),
             property("Lasts", CimValue::of(CimType::Datetime, utils::Time(300000000ULL))),
             property("Began", CimValue::of(CimType::Datetime, utils::Time(2024, 2, 29, 23, 59, 59))),
             property("NoCodes", CimValue::arrayOf(CimType::Uint16, {})),
             property("NullCodes", CimValue::null(CimType::String, true)),
             property("NullOwner", CimValue::null(CimType::Reference), "T_Owner")}};
}

TEST(ResponseWriterTest, WritesTextsAsClientsExpectThem) {
    IntrinsicResult result;
    result.kind = ResultKind::Instance;
    result.instances = {oddValues()};
    auto origins = std::make_shared<cimxml::Origins>();
    (*origins)["t_job"]["flag"] = "T_Root";
    result.origins = origins;
    const auto written = [](const IntrinsicResult& content) {
        return cimxml::writeResponse({"4711", "Op", false, "host:5989", content});
    };
    const std::string message = written(result);
    EXPECT_EQ(test::faultsOf(message), "");
    for (const char* part :
         {"<PROPERTY NAME=\"Flag\" TYPE=\"boolean\" CLASSORIGIN=\"T_Root\"><VALUE>TRUE</VALUE></PROPERTY>",
          "<VALUE>&lt;&amp;&gt;&quot;' \xC3\xBC</VALUE>",
          "<PROPERTY NAME=\"Empty\" TYPE=\"string\"><VALUE></VALUE></PROPERTY>",
          "<PROPERTY NAME=\"Null\" TYPE=\"uint8\"></PROPERTY>", "<VALUE>00000000000500.000000:000</VALUE>",
          "<VALUE>20240229235959.000000+000</VALUE>", "<VALUE.ARRAY></VALUE.ARRAY>",
          "<PROPERTY.ARRAY NAME=\"NullCodes\" TYPE=\"string\"></PROPERTY.ARRAY>",
          "<PROPERTY.REFERENCE NAME=\"NullOwner\" REFERENCECLASS=\"T_Owner\"></PROPERTY.REFERENCE>"})
        EXPECT_THAT(message, HasSubstr(part));
    // A client tells an empty list from a missing one.
    result.instances.clear();
    EXPECT_THAT(written(result), HasSubstr("<IRETURNVALUE></IRETURNVALUE>"));
    EXPECT_THAT(written({}), Not(HasSubstr("IRETURNVALUE")));
}

TEST(ResponseReaderTest, RefusesWhatIsNoResponse) {
    const auto inside = [](const std::string& content) {
        return "<CIM CIMVERSION='2.0' DTDVERSION='2.0'><MESSAGE ID='1' PROTOCOLVERSION='1.0'><SIMPLERSP>" +
               content + "</SIMPLERSP></MESSAGE></CIM>";
    };
    for (const std::string& bad :
         {std::string("<html/>"), inside("<IMETHODCALL NAME='X'/>"),
          inside("<IMETHODRESPONSE NAME='X'><ERROR CODE='six'/></IMETHODRESPONSE>"),
          inside("<IMETHODRESPONSE NAME='X'><IRETURNVALUE>" + nested(4) +
                 "</IRETURNVALUE></IMETHODRESPONSE>"),
          inside(
              "<IMETHODRESPONSE NAME='X'><IRETURNVALUE><INSTANCE CLASSNAME='C'><PROPERTY NAME='P' "
              "TYPE='uint8'/><PROPERTY NAME='p' TYPE='uint8'/></INSTANCE></IRETURNVALUE></IMETHODRESPONSE>"),
          inside("<IMETHODRESPONSE NAME='X'><IRETURNVALUE><CLASS NAME='A{};&#10;#pragma include'/>"
                 "</IRETURNVALUE></IMETHODRESPONSE>"),
          inside("<IMETHODRESPONSE NAME='X'><IRETURNVALUE><NEW/></IRETURNVALUE></IMETHODRESPONSE>"),
          inside("<METHODRESPONSE NAME='X'><RETURNVALUE><VALUE>x</VALUE></RETURNVALUE></METHODRESPONSE>"),
          inside("<IMETHODRESPONSE NAME='X'><IRETURNVALUE><INSTANCE CLASSNAME='C'><PROPERTY NAME='P' "
                 "TYPE='uint8'><VALUE>300</VALUE></PROPERTY></INSTANCE></IRETURNVALUE></IMETHODRESPONSE>")})
        EXPECT_THROW(cimxml::readResponse(bad), WireError) << bad;
}

}  // namespace
