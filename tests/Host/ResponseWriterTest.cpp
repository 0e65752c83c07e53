#include "Host/CimXml/ResponseWriter.h"

#include <gtest/gtest.h>

#include "Host/CimXml/ResponseReader.h"
#include "Host/CimXml/WireError.h"
#include "Host/WireCheck.h"

namespace {

using cimxml::IntrinsicResult;
using cimxml::Response;
using cimxml::ResultKind;
using core::CimPath;
using core::CimScalar;
using core::CimType;
using core::CimValue;

const std::string kOdd = "<&>\"' \xC3\xBC\x01";

CimPath jobPath() {
    CimPath path("root/cimv2:T_Job.ID=\"J#1\",Number=7,Flag=TRUE");
    return path;
}

CimPath ownerPath() {
    return CimPath("root/cimv2:T_Owner.Owned=\"root/cimv2:T_Job.ID=\\\"J#1\\\"\"");
}

/// An instance with every type of property, null and not.
core::InstanceValue everyType() {
    core::InstanceValue instance;
    instance.path = jobPath();
    const auto add = [&](std::string name, CimValue value, std::string referenceClass = "") {
        instance.properties.push_back({std::move(name), std::move(value), false, std::move(referenceClass)});
    };
    add("ID", CimValue::of(CimType::String, std::string("J#1")));
    add("Odd", CimValue::of(CimType::String, kOdd));
    add("Empty", CimValue::of(CimType::String, std::string()));
    add("Null", CimValue::null(CimType::Uint8));
    add("Flag", CimValue::of(CimType::Boolean, true));
    add("Large", CimValue::of(CimType::Uint64, std::uint64_t{18446744073709551615U}));
    add("Small", CimValue::of(CimType::Sint8, std::int64_t{-128}));
    add("Real", CimValue::of(CimType::Real64, 1.5));
    add("Lasts", CimValue::of(CimType::Datetime, utils::Time(300000000ULL)));
    add("Began", CimValue::of(CimType::Datetime, utils::Time(2024, 2, 29, 23, 59, 59)));
    add("Codes", CimValue::arrayOf(CimType::Uint16, {std::uint64_t{2}, std::uint64_t{3}}));
    add("NoCodes", CimValue::arrayOf(CimType::Uint16, {}));
    add("NullCodes", CimValue::null(CimType::String, true));
    add("Owner", CimValue::of(CimType::Reference, ownerPath()), "T_Owner");
    add("NullOwner", CimValue::null(CimType::Reference), "T_Owner");
    return instance;
}

Response answer(IntrinsicResult result) {
    return {"4711", "Op", false, "host:5989", std::move(result)};
}

TEST(ResponseWriterTest, WritesInstancesThatReadBackEqual) {
    for (const ResultKind kind :
         {ResultKind::NamedInstances, ResultKind::ObjectsWithPath, ResultKind::InstancesWithPath}) {
        IntrinsicResult result;
        result.kind = kind;
        result.instances = {everyType(), everyType()};
        const std::string message = cimxml::writeResponse(answer(result));
        EXPECT_EQ(test::faultsOf(message), "") << message;
        const Response read = cimxml::readResponse(message);
        const auto& back = std::get<IntrinsicResult>(read.content);
        ASSERT_EQ(back.instances.size(), 2U);
        const core::InstanceValue& instance = back.instances[1];
        const bool hasHost = kind != ResultKind::NamedInstances;
        EXPECT_EQ(instance.path.getHost(), hasHost ? "host:5989" : "");
        EXPECT_TRUE(instance.path.names(jobPath()));
        EXPECT_TRUE(instance.find("ID")->isKey);
        ASSERT_EQ(instance.properties.size(), everyType().properties.size());
        for (const core::PropertyValue& sent : everyType().properties) {
            const core::PropertyValue& got = *instance.find(sent.name);
            EXPECT_EQ(got.value.type, sent.value.type) << sent.name;
            EXPECT_EQ(got.value.isArray, sent.value.isArray) << sent.name;
            ASSERT_EQ(got.value.data.index(), sent.value.data.index()) << sent.name;
            if (sent.value.scalar() != nullptr && sent.name != "Odd") {
                EXPECT_TRUE(core::sameValue(*got.value.scalar(), *sent.value.scalar())) << sent.name;
            }
        }
        EXPECT_EQ(std::get<std::string>(*instance.find("Odd")->value.scalar()), "<&>\"' \xC3\xBC");
        EXPECT_EQ(instance.find("Codes")->value.elements()->size(), 2U);
    }
}

TEST(ResponseWriterTest, WritesTextsAsClientsExpectThem) {
    IntrinsicResult result;
    result.kind = ResultKind::Instance;
    result.instances = {everyType()};
    auto origins = std::make_shared<cimxml::Origins>();
    (*origins)["t_job"]["flag"] = "T_Root";
    result.origins = origins;
    const std::string message = cimxml::writeResponse(answer(result));
    EXPECT_EQ(test::faultsOf(message), "");
    for (const char* part :
         {"<PROPERTY NAME=\"Flag\" TYPE=\"boolean\" CLASSORIGIN=\"T_Root\"><VALUE>TRUE</VALUE></PROPERTY>",
          "<PROPERTY NAME=\"Empty\" TYPE=\"string\"><VALUE></VALUE></PROPERTY>",
          "<PROPERTY NAME=\"Null\" TYPE=\"uint8\"></PROPERTY>", "<VALUE>00000000000500.000000:000</VALUE>",
          "<VALUE>20240229235959.000000+000</VALUE>", "<VALUE.ARRAY></VALUE.ARRAY>",
          "<PROPERTY.ARRAY NAME=\"NullCodes\" TYPE=\"string\"></PROPERTY.ARRAY>",
          "<PROPERTY.REFERENCE NAME=\"NullOwner\" REFERENCECLASS=\"T_Owner\"></PROPERTY.REFERENCE>"}) {
        EXPECT_NE(message.find(part), std::string::npos) << part << "\n" << message;
    }
}

TEST(ResponseWriterTest, WritesPathsInEachForm) {
    for (const ResultKind kind :
         {ResultKind::InstanceNames, ResultKind::ObjectPaths, ResultKind::InstancePaths}) {
        IntrinsicResult result;
        result.kind = kind;
        result.paths = {jobPath(), ownerPath()};
        const std::string message = cimxml::writeResponse(answer(result));
        EXPECT_EQ(test::faultsOf(message), "") << message;
        const Response read = cimxml::readResponse(message);
        const auto& back = std::get<IntrinsicResult>(read.content);
        ASSERT_EQ(back.paths.size(), 2U);
        EXPECT_TRUE(back.paths[0].names(jobPath()));
        EXPECT_TRUE(back.paths[1].names(ownerPath())) << back.paths[1].toString();
    }
}

TEST(ResponseWriterTest, WritesClassesThatReadBackEqual) {
    const cimxml::Qualifier key{"Key", CimValue::of(CimType::Boolean, true), false};
    const cimxml::Qualifier values{"Values", CimValue::arrayOf(CimType::String, {std::string("a<b")}), true};
    const cimxml::Qualifier out{"Out", CimValue::of(CimType::Boolean, true), true};
    cimxml::ClassElement element{"T_Job", "T_Root", {key}, {}, {}};
    element.properties = {{{"ID", CimType::String, false, true, ""}, "T_Root", true, {key}},
                          {{"Codes", CimType::Uint16, true, false, ""}, "", false, {values}},
                          {{"Owner", CimType::Reference, false, false, "T_Owner"}, "", false, {}}};
    cimxml::ClassMethod method{"Work", CimType::Uint32, "T_Job", false, {}, {}};
    using core::CimDirection;
    method.parameters = {{{"Job", CimType::Reference, false, CimDirection::Out, true, "T_Job"}, {out}},
                         {{"Many", CimType::Reference, true, CimDirection::In, false, "T_Job"}, {}},
                         {{"Codes", CimType::Uint16, true, CimDirection::In, false, ""}, {}},
                         {{"Text", CimType::String, false, CimDirection::In, false, ""}, {}}};
    element.methods = {method};
    IntrinsicResult result;
    result.kind = ResultKind::Classes;
    result.classes = {element};
    const std::string message = cimxml::writeResponse(answer(result));
    EXPECT_EQ(test::faultsOf(message), "") << message;
    const Response read = cimxml::readResponse(message);
    // Written again it must be the same text, so nothing was lost on the way.
    IntrinsicResult again;
    again.kind = ResultKind::Classes;
    again.classes = std::get<IntrinsicResult>(read.content).classes;
    ASSERT_EQ(again.classes.size(), 1U);
    EXPECT_TRUE(again.classes[0].properties[0].declaration.isKey);
    EXPECT_EQ(again.classes[0].methods[0].parameters[0].declaration.direction, CimDirection::Out);
    EXPECT_EQ(cimxml::writeResponse(answer(again)), message);
}

TEST(ResponseWriterTest, WritesNamesQualifiersAndOutputs) {
    IntrinsicResult names;
    names.kind = ResultKind::ClassNames;
    names.classNames = {"A", "B"};
    names.outputs = {{"EndOfSequence", CimValue::of(CimType::Boolean, false)},
                     {"EnumerationContext", CimValue::of(CimType::String, std::string("E1"))},
                     {"Nothing", CimValue::null(CimType::String)}};
    IntrinsicResult qualifiers;
    qualifiers.kind = ResultKind::Qualifiers;
    qualifiers.qualifiers = {
        {"Key",
         CimType::Boolean,
         false,
         false,
         {"PROPERTY", "REFERENCE"},
         CimValue::of(CimType::Boolean, false)},
        {"Values", CimType::String, true, true, {}, CimValue::null(CimType::String, true)}};
    IntrinsicResult empty;
    empty.kind = ResultKind::InstanceNames;
    for (const IntrinsicResult& result : {names, qualifiers, empty, IntrinsicResult()}) {
        const std::string message = cimxml::writeResponse(answer(result));
        EXPECT_EQ(test::faultsOf(message), "") << message;
        EXPECT_EQ(message.find("IRETURNVALUE") == std::string::npos, result.kind == ResultKind::Nothing);
    }
    const auto read = cimxml::readResponse(cimxml::writeResponse(answer(names)));
    EXPECT_EQ(std::get<IntrinsicResult>(read.content).classNames, names.classNames);
    EXPECT_EQ(std::get<IntrinsicResult>(read.content).outputs.size(), 2U);
}

TEST(ResponseWriterTest, WritesMethodResultsAndErrors) {
    cimxml::ExtrinsicResult result;
    result.result.returnValue = 4096;
    result.result.outputs = {{"Job", CimValue::of(CimType::Reference, jobPath())},
                             {"Codes", CimValue::arrayOf(CimType::Uint16, {std::uint64_t{7}})},
                             {"Null", CimValue::null(CimType::String)}};
    const Response method{"x&y", "Install", true, "", result};
    const Response failure{"1", "Install", true, "", cimxml::Failure{core::CimStatus::NotFound, kOdd}};
    for (const Response& response : {method, failure}) {
        EXPECT_EQ(test::faultsOf(cimxml::writeResponse(response)), "");
    }
    const Response read = cimxml::readResponse(cimxml::writeResponse(method));
    EXPECT_EQ(read.messageId, "x&y");
    EXPECT_TRUE(read.isMethod);
    const auto& back = std::get<cimxml::ExtrinsicResult>(read.content).result;
    EXPECT_EQ(back.returnValue, 4096U);
    ASSERT_EQ(back.outputs.size(), 2U);
    EXPECT_TRUE(std::get<CimPath>(*back.outputs[0].value.scalar()).names(jobPath()));
    const Response refused = cimxml::readResponse(cimxml::writeResponse(failure));
    EXPECT_EQ(std::get<cimxml::Failure>(refused.content).status, core::CimStatus::NotFound);
}

TEST(WireCheckTest, FindsWhatClientsCannotRead) {
    const std::string good = cimxml::writeResponse(answer(IntrinsicResult()));
    ASSERT_EQ(test::faultsOf(good), "");
    const auto with = [&](const std::string& from, const std::string& to) {
        return std::string(good).replace(good.find(from), from.size(), to);
    };
    const std::string open = "<IMETHODRESPONSE NAME=\"Op\">";
    for (const std::string& bad :
         {good.substr(1), with(open, open + "<VALUE></VALUE>"), with(open, open + "<IRETURNVALUE/>"),
          with(open, open + "<!-- -->"), with("NAME=\"Op\"", ""), with("ID=", "NEW=\"\" ID=")}) {
        EXPECT_NE(test::faultsOf(bad), "") << bad;
    }
}

TEST(ResponseReaderTest, RefusesWhatIsNoResponse) {
    const auto inside = [](const std::string& content) {
        return "<CIM CIMVERSION='2.0' DTDVERSION='2.0'><MESSAGE ID='1' PROTOCOLVERSION='1.0'><SIMPLERSP>" +
               content + "</SIMPLERSP></MESSAGE></CIM>";
    };
    for (const std::string& bad :
         {std::string("<html/>"), inside(""), inside("<IMETHODCALL NAME='X'/>"),
          inside("<IMETHODRESPONSE NAME='X'><ERROR CODE='six'/></IMETHODRESPONSE>"),
          inside("<IMETHODRESPONSE NAME='X'><IRETURNVALUE><NEW/></IRETURNVALUE></IMETHODRESPONSE>"),
          inside("<METHODRESPONSE NAME='X'><RETURNVALUE><VALUE>x</VALUE></RETURNVALUE></METHODRESPONSE>"),
          inside("<IMETHODRESPONSE NAME='X'><IRETURNVALUE><INSTANCE CLASSNAME='C'><PROPERTY NAME='P' "
                 "TYPE='uint8'><VALUE>300</VALUE></PROPERTY></INSTANCE></IRETURNVALUE></IMETHODRESPONSE>")}) {
        EXPECT_THROW(cimxml::readResponse(bad), cimxml::WireError) << bad;
    }
}

}  // namespace
