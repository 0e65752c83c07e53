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

const CimPath kJob("root/cimv2:T_Job.ID=\"J#1\",Number=7,Flag=TRUE");
const CimPath kOwner("root/cimv2:T_Owner.Owned=\"root/cimv2:T_Job.ID=\\\"J#1\\\"\"");

/// An instance with every type of property, null and not.
core::InstanceValue everyType() {
    core::InstanceValue instance;
    instance.path = kJob;
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
    add("Owner", CimValue::of(CimType::Reference, kOwner), "T_Owner");
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
        EXPECT_EQ(instance.path.getHost(), kind == ResultKind::NamedInstances ? "" : "host:5989");
        EXPECT_TRUE(instance.path.names(kJob));
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
    // An empty list is no missing one.
    result.instances.clear();
    EXPECT_NE(cimxml::writeResponse(answer(result)).find("<IRETURNVALUE></IRETURNVALUE>"), std::string::npos);
    EXPECT_EQ(cimxml::writeResponse(answer({})).find("IRETURNVALUE"), std::string::npos);
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
