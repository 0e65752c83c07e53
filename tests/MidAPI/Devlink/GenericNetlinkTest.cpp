// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/GenericNetlink.h"

#include <gtest/gtest.h>
#include <linux/devlink.h>
#include <linux/netlink.h>

#include <cerrno>

#include "Support/TestRoms.h"

namespace {

using namespace ma::devlink;

// Bytes as they are on a little-endian machine, which all are that this runs on.
TEST(GenericNetlinkTest, WritesRequestsByteForByte) {
    RequestWriter request(0x15, 58, 7);
    request.putText(1, "pci");
    EXPECT_EQ(28U, request.position());
    request.putText(123, "");
    request.putByte(153, 2);
    EXPECT_EQ(test::bytesOf("2c000000 1500 0500 07000000 00000000  3a 01 0000"
                            "0800 0100 70636900  0500 7b00 00000000  0500 9900 02000000"),
              request.take());
}

TEST(GenericNetlinkTest, ReadsAttributesUntilOneDoesNotFit) {
    // Nested and of another byte order, a length with padding, an empty one, one that says more than is
    // there.
    const Bytes message =
        test::bytesOf("0800 0180 78797a00  0500 0240 41ffffff  0400 0300  0900 0400 01020304");
    const std::vector<Attribute> attributes = readAttributes(message);
    ASSERT_EQ(3U, attributes.size());
    EXPECT_EQ("xyz", attributes[0].text());
    EXPECT_EQ(2, attributes[1].type);
    EXPECT_EQ("A", attributes[1].text()) << "a text may lack its NUL";
    EXPECT_EQ(0x41, attributes[1].number<std::uint8_t>());
    EXPECT_EQ(std::nullopt, attributes[1].number<std::uint16_t>());
    EXPECT_TRUE(attributes[2].payload.empty());
    EXPECT_TRUE(readAttributes(test::bytesOf("0300 0100 00000000")).empty()) << "shorter than its own header";
    EXPECT_EQ(1U, readAttributes(test::bytesOf("0500 0100 41")).size())
        << "the last one's padding may be missing";
    EXPECT_EQ("a?b?", (Attribute{0, test::bytesOf("611b62c3")}.text())) << "goes to terminals";
}

TEST(GenericNetlinkTest, ReadsAcknowledgements) {
    const std::string request = "1c000000 1500 0500 07000000 00000000";
    struct Case {
        std::uint16_t flags;
        std::string payload;
        int error;
        std::string text;
        std::optional<std::uint32_t> offset, missing;
    };
    const std::vector<Case> cases = {
        {0x100, "00000000" + request, 0, "", {}, {}},
        {0x300, "eaffffff" + request + "0800 0100 62616400  0800 0200 14000000", EINVAL, "bad", 20, {}},
        {0x300, "eaffffff" + request + "0800 0500 7a000000  0800 6300 01000000", EINVAL, "", {}, 122},
        // The request is repeated: 12 bytes beyond its header.
        {0x200,
         "a1ffffff" + request + "3a010000 0800 0100 70636900 0800 0100 6e6f0000",
         EOPNOTSUPP,
         "no",
         {},
         {}},
        // What it says of the request's length does not fit.
        {0x200, "a1ffffff ffffffff 1500 0500 07000000 00000000 0800 0100 6e6f0000", EOPNOTSUPP, "", {}, {}},
        {0, "a1ffffff" + request + "0800 0100 6e6f0000", EOPNOTSUPP, "", {}, {}},
    };
    for (const Case& each : cases) {
        const Bytes payload = test::bytesOf(each.payload);
        const auto result = readAcknowledgement({NLMSG_ERROR, each.flags, 7, payload});
        ASSERT_TRUE(result) << each.payload;
        EXPECT_EQ(each.error, result->error) << each.payload;
        EXPECT_EQ(each.text, result->text) << each.payload;
        EXPECT_EQ(each.offset, result->offset) << each.payload;
        EXPECT_EQ(each.missing, result->missingType) << each.payload;
    }
    for (const char* bad : {"", "00000000", "01000000", "00000080"}) {
        const Bytes payload = test::bytesOf(bad + (bad == std::string("00000000") ? "" : request));
        EXPECT_FALSE(readAcknowledgement({NLMSG_ERROR, 0, 7, payload})) << bad;
    }
}

TEST(GenericNetlinkTest, SplitsDatagramsIntoMessages) {
    const std::string one = "14000000 1500 0000 07000000 00000000 03010000";
    EXPECT_EQ(2U, readMessages(test::bytesOf(one + one)).size());
    EXPECT_EQ(1U, readMessages(test::bytesOf(one + "15000000 1500 0000 07000000 00000000 03010000")).size());
    EXPECT_TRUE(readMessages(test::bytesOf("0f000000 1500 0000 07000000 00000000")).empty());
    const Bytes empty = test::bytesOf("10000000 1500 0000 07000000 00000000");
    EXPECT_EQ(0, readMessages(empty).at(0).command());
    EXPECT_TRUE(readMessages(empty).at(0).attributes().empty());
}

}  // namespace
