// SPDX-License-Identifier: Apache-2.0
#include <gmock/gmock.h>

#include <filesystem>

#include "CimXml/Request.h"
#include "CimXml/Response.h"
#include "CimXml/WireCheck.h"
#include "CimXml/WireError.h"
#include "Framework/Requests/AnswerMeter.h"
#include "Support/TempFolder.h"

namespace {

using cimxml::IntrinsicResult;
using cimxml::Request;
using cimxml::WireError;
using core::CimPath;
using core::CimType;
using core::CimValue;
using ::testing::HasSubstr;

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

/// A call with this parameter, in an envelope that is right.
std::string parameterWith(const std::string& value) {
    return "<CIM CIMVERSION='2.3' DTDVERSION='2.1'><MESSAGE ID='1' PROTOCOLVERSION='1.1'><SIMPLEREQ>"
           "<IMETHODCALL NAME='X'><LOCALNAMESPACEPATH><NAMESPACE NAME='root'/></LOCALNAMESPACEPATH>"
           "<IPARAMVALUE NAME='P'>" +
           value + "</IPARAMVALUE></IMETHODCALL></SIMPLEREQ></MESSAGE></CIM>";
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

TEST(RequestReaderTest, RefusesEachFaultByItsName) {
    // The text of a path doubles with each path that has it as a key.
    held<CimPath>(cimxml::readRequest(test::readSample("accepted-requests/paths-four-deep.xml")), "P");
    std::string said;
    for (const std::string& name : test::sampleNames("refused-requests/")) {
        // Behind the fault, some have what it consists of.
        const std::string fault = std::filesystem::path(name).stem().stem();
        try {
            cimxml::readRequest(test::readSample(name));
            ADD_FAILURE() << name;
        } catch (const WireError& error) {
            EXPECT_EQ(error.fault().cimError, fault);
            said += std::filesystem::path(name).filename().string() + ": " + error.what() + "\n";
        }
    }
    EXPECT_EQ(said, test::readSample("texts/refused-requests"));
}

TEST(RequestReaderTest, NotesAnArgumentThatIsNotOfItsStatedType) {
    const auto mistyped = [](const std::string& name) {
        const Request request = cimxml::readRequest(test::readSample(name));
        return std::get<cimxml::MethodCall>(request.call).mistypedArgument;
    };
    for (const std::string& name : test::sampleNames("arguments-as-stated/"))
        EXPECT_EQ(mistyped(name), "") << name;
    for (const std::string& name : test::sampleNames("arguments-of-another-type/"))
        EXPECT_EQ(mistyped(name), "P") << name;
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
    result.kind = cimxml::ResultKind::Instance;
    result.instances = {oddValues()};
    auto origins = std::make_shared<cimxml::Origins>();
    (*origins)["t_job"]["flag"] = "T_Root";
    result.origins = origins;
    const auto written = [](const IntrinsicResult& content) {
        return cimxml::writeResponse({"4711", "Op", false, "host:5989", content});
    };
    const std::string message = written(result);
    EXPECT_EQ(test::faultsOf(message), "");
    EXPECT_EQ(test::linesOf(message), test::readSample("responses/instance.xml"));
    // A client tells an empty list from a missing one.
    result.instances.clear();
    EXPECT_THAT(written(result), HasSubstr("<IRETURNVALUE></IRETURNVALUE>"));
    EXPECT_THAT(written({}), ::testing::Not(HasSubstr("IRETURNVALUE")));
    result.kind = cimxml::ResultKind::Qualifiers;
    result.qualifiers = {{"Old", CimValue::of(CimType::Boolean, true), {"CLASS"}, false, false, true}};
    EXPECT_THAT(written(result), HasSubstr("<VALUE>TRUE</VALUE></QUALIFIER.DECLARATION>"));
}

TEST(ResponseWriterTest, CountsWhatAnAnswerHolds) {
    const core::CimPath path("T_Job.ID=\"a\",Other=5");
    IntrinsicResult result;
    result.paths = {path, path};
    result.instances = {oddValues()};
    EXPECT_EQ(cimxml::bytesOf(result), 2 * core::bytesOf(path) + core::bytesOf(result.instances.front()));
    EXPECT_GT(core::bytesOf(oddValues()), core::bytesOf(oddValues().path));
    EXPECT_EQ(cimxml::sizeOf({"ab", "", "c"}), 3U);
}

/// Of an operation that returns these elements.
IntrinsicResult resultOf(const std::string& elements) {
    return std::get<IntrinsicResult>(
        cimxml::readResponse(
            "<CIM CIMVERSION='2.3' DTDVERSION='2.1'><MESSAGE ID='1' PROTOCOLVERSION='1.1'><SIMPLERSP>"
            "<IMETHODRESPONSE NAME='X'>" +
            elements + "</IMETHODRESPONSE></SIMPLERSP></MESSAGE></CIM>")
            .content);
}

std::string shown(const core::CimValue& value) {
    std::string text{core::typeName(value.type)};
    if (value.isArray) text += "[]";
    return text + (value.isNull() ? " null" : " " + core::valueText(value));
}

TEST(ResponseReaderTest, ReadsEachFormOfAResult) {
    for (const auto& row : test::readTestTable(QUENX_CIM_XML_TEST_DIR "/samples/texts/results")) {
        const IntrinsicResult result = resultOf(row[0]);
        std::string said{cimxml::resultElement(result.kind)};
        for (const CimPath& path : result.paths)
            said += "; " + path.toString();
        for (const core::InstanceValue& instance : result.instances) {
            said += "; " + instance.path.toString();
            for (const core::PropertyValue& each : instance.properties)
                said += ", " + each.name + (each.isKey ? " (key) " : " ") + shown(each.value) +
                        (each.referenceClass.empty() ? "" : " of " + each.referenceClass);
        }
        for (const core::Argument& output : result.outputs)
            said += "; " + output.name + " " + shown(output.value);
        EXPECT_EQ(said, row.at(1)) << row[0];
    }
}

TEST(ResponseReaderTest, ReadsKeysAsTheirAttributesSay) {
    const auto read = [](const std::string& keys) {
        return resultOf("<IRETURNVALUE><INSTANCENAME CLASSNAME='C'>" + keys +
                        "</INSTANCENAME></IRETURNVALUE>")
            .paths.at(0)
            .toString();
    };
    const std::pair<const char*, const char*> table[] = {
        {"<KEYVALUE>one</KEYVALUE>", "C.=\"one\""},
        {"<KEYVALUE VALUETYPE='numeric'>7</KEYVALUE>", "C.=7"},
        {"<KEYVALUE VALUETYPE='numeric'>-7</KEYVALUE>", "C.=-7"},
        {"<KEYVALUE VALUETYPE='Numeric'>0.5</KEYVALUE>", "C.=0.5"},
        {"<KEYVALUE VALUETYPE='numeric'>seven</KEYVALUE>", "C.=\"seven\""},
        {"<KEYVALUE VALUETYPE='boolean'>true</KEYVALUE>", "C.=TRUE"},
        {"<KEYVALUE VALUETYPE='string'>7</KEYVALUE>", "C.=\"7\""},
        {"<KEYVALUE VALUETYPE='numeric' TYPE='uint8'>7</KEYVALUE>", "C.=7"},
        {"<KEYVALUE VALUETYPE='numeric' TYPE='uint8'>700</KEYVALUE>", "C.=\"700\""},
        {"<KEYVALUE VALUETYPE='numeric' TYPE='string'>7</KEYVALUE>", "C.=\"7\""},
        {"<KEYBINDING NAME='A'><KEYVALUE>a</KEYVALUE></KEYBINDING><KEYBINDING NAME='B'><VALUE.REFERENCE>"
         "<INSTANCENAME CLASSNAME='D'/></VALUE.REFERENCE></KEYBINDING>",
         "C.A=\"a\",B=\"D\""},
        {"<VALUE.REFERENCE><INSTANCEPATH><NAMESPACEPATH><HOST>h</HOST><LOCALNAMESPACEPATH><NAMESPACE "
         "NAME='a'/><NAMESPACE NAME='b'/></LOCALNAMESPACEPATH></NAMESPACEPATH><INSTANCENAME CLASSNAME='D'/>"
         "</INSTANCEPATH></VALUE.REFERENCE>",
         "C.=\"//h/a/b:D\""}};
    for (const auto& [keys, path] : table)
        EXPECT_EQ(read(keys), path) << keys;
}

TEST(ResponseReaderTest, RefusesWhatIsNoResponse) {
    std::string said;
    for (const std::string& name : test::sampleNames("refused-responses/")) {
        try {
            cimxml::readResponse(test::readSample(name));
            ADD_FAILURE() << name;
        } catch (const WireError& error) {
            said += std::filesystem::path(name).filename().string() + ": " + error.what() + "\n";
        }
    }
    EXPECT_EQ(said, test::readSample("texts/refused-responses"));
}

}  // namespace
