// SPDX-License-Identifier: Apache-2.0
#include "CimXml/Response.h"

#include <gtest/gtest.h>

#include "CimXml/WireCheck.h"
#include "CimXml/WireError.h"

namespace {

using cimxml::IntrinsicResult;
using cimxml::Response;
using cimxml::ResultKind;
using core::CimPath;
using core::CimType;
using core::CimValue;

/// An instance with the values whose texts are easily wrong.
core::InstanceValue oddValues() {
    core::InstanceValue instance;
    instance.path = CimPath("root/cimv2:T_Job.ID=\"J#1\",Number=7,Flag=TRUE");
    const auto add = [&](std::string name, CimValue value, std::string referenceClass = "") {
        instance.properties.push_back({std::move(name), std::move(value), false, std::move(referenceClass)});
    };
    add("Odd", CimValue::of(CimType::String, std::string("<&>\"' \xC3\xBC\x01")));
    add("Empty", CimValue::of(CimType::String, std::string()));
    add("Null", CimValue::null(CimType::Uint8));
    add("Flag", CimValue::of(CimType::Boolean, true));
    add("Lasts", CimValue::of(CimType::Datetime, utils::Time(300000000ULL)));
    add("Began", CimValue::of(CimType::Datetime, utils::Time(2024, 2, 29, 23, 59, 59)));
    add("NoCodes", CimValue::arrayOf(CimType::Uint16, {}));
    add("NullCodes", CimValue::null(CimType::String, true));
    add("NullOwner", CimValue::null(CimType::Reference), "T_Owner");
    return instance;
}

Response answer(IntrinsicResult result) {
    return {"4711", "Op", false, "host:5989", std::move(result)};
}

TEST(ResponseWriterTest, WritesTextsAsClientsExpectThem) {
    IntrinsicResult result;
    result.kind = ResultKind::Instance;
    result.instances = {oddValues()};
    auto origins = std::make_shared<cimxml::Origins>();
    (*origins)["t_job"]["flag"] = "T_Root";
    result.origins = origins;
    const std::string message = cimxml::writeResponse(answer(result));
    EXPECT_EQ(test::faultsOf(message), "");
    for (const char* part :
         {"<PROPERTY NAME=\"Flag\" TYPE=\"boolean\" CLASSORIGIN=\"T_Root\"><VALUE>TRUE</VALUE></PROPERTY>",
          "<VALUE>&lt;&amp;&gt;&quot;' \xC3\xBC</VALUE>",
          "<PROPERTY NAME=\"Empty\" TYPE=\"string\"><VALUE></VALUE></PROPERTY>",
          "<PROPERTY NAME=\"Null\" TYPE=\"uint8\"></PROPERTY>", "<VALUE>00000000000500.000000:000</VALUE>",
          "<VALUE>20240229235959.000000+000</VALUE>", "<VALUE.ARRAY></VALUE.ARRAY>",
          "<PROPERTY.ARRAY NAME=\"NullCodes\" TYPE=\"string\"></PROPERTY.ARRAY>",
          "<PROPERTY.REFERENCE NAME=\"NullOwner\" REFERENCECLASS=\"T_Owner\"></PROPERTY.REFERENCE>"}) {
        EXPECT_NE(message.find(part), std::string::npos) << part << "\n" << message;
    }
    // A client tells an empty list from a missing one.
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
          inside("<METHODRESPONSE NAME='X'></METHODRESPONSE>"),
          inside("<METHODRESPONSE NAME='X'><RETURNVALUE><VALUE>x</VALUE></RETURNVALUE></METHODRESPONSE>"),
          inside("<IMETHODRESPONSE NAME='X'><IRETURNVALUE><INSTANCE CLASSNAME='C'><PROPERTY NAME='P' "
                 "TYPE='uint8'><VALUE>300</VALUE></PROPERTY></INSTANCE></IRETURNVALUE></IMETHODRESPONSE>")}) {
        EXPECT_THROW(cimxml::readResponse(bad), cimxml::WireError) << bad;
    }
}

}  // namespace
