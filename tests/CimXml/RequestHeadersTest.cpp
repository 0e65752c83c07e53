// SPDX-License-Identifier: Apache-2.0
#include <gtest/gtest.h>

#include "CimXml/Request.h"
#include "CimXml/WireError.h"

namespace {

using cimxml::Request;
using cimxml::RequestHeaders;

bool areAccepted(const RequestHeaders& headers, const Request& request) {
    try {
        cimxml::checkHeadersAgainst(headers, request);
        return true;
    } catch (const cimxml::WireError& error) {
        EXPECT_EQ(error.fault(), cimxml::WireFault::HeaderMismatch);
        return false;
    }
}

RequestHeaders withObject(const char* object) {
    RequestHeaders headers;
    headers.object = object;
    return headers;
}

TEST(RequestHeadersTest, HaveToNameTheNamespaceOfAnOperation) {
    const Request request{"1", cimxml::IntrinsicCall{"GetInstance", "root/cimv2", {}}};
    for (const char* same :
         {"root/cimv2", "root%2fcimv2", "Root%2FCIMv2", "/root/cimv2/", "//host:1/root/cimv2"})
        EXPECT_TRUE(areAccepted(withObject(same), request)) << same;
    for (const char* other : {"", "root", "root/cimv2/x", "root/cimv2:CIM_Service", "interop", "%"})
        EXPECT_FALSE(areAccepted(withObject(other), request)) << other;
}

TEST(RequestHeadersTest, HaveToNameTheObjectOfAMethod) {
    core::CimPath object("C_Job", {{"ID", std::string("a\"b\\c")}, {"Number", std::string("0x5")}});
    object.setNamespace("root/cimv2");
    const Request request{"1", cimxml::MethodCall{"Kill", object, false, {}}};
    for (const char* same :
         {"root/cimv2:C_Job.ID=\"a\\\"b\\\\c\",Number=5", "//h/root/cimv2:c_job.number=5,id=\"a\\\"b\\\\c\"",
          "root%2Fcimv2%3AC_Job.ID=%22a%5C%22b%5C%5Cc%22,Number=5",
          "root/cimv2:C_Job.ID=\"a\"b\\c\",Number=0x5"}) {  // a client that escapes nothing
        EXPECT_TRUE(areAccepted(withObject(same), request)) << same;
    }
    for (const char* other :
         {"", "root/cimv2", "root/cimv2:C_Job", "root/interop:C_Job.ID=\"a\\\"b\\\\c\",Number=5",
          "root/cimv2:C_Other.ID=\"a\\\"b\\\\c\",Number=5", "root/cimv2:C_Job.ID=\"x\",Number=5",
          "root/cimv2:C_Job.ID=\"a\\\"b\\\\c\",Number=6", "root/cimv2:C_Job.ID=\"a\\\"b\\\\c\"",
          "root/cimv2:C_Other.ID=\"a\"b\""}) {
        EXPECT_FALSE(areAccepted(withObject(other), request)) << other;
    }
    RequestHeaders method;
    method.method = "K%69LL";
    EXPECT_TRUE(areAccepted(method, request));
    method.method = "Start";
    EXPECT_FALSE(areAccepted(method, request));
}

}  // namespace
