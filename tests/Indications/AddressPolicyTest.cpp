// SPDX-License-Identifier: Apache-2.0
#include "Indications/Delivery/AddressPolicy.h"

#include <arpa/inet.h>
#include <gtest/gtest.h>

#include <cstring>

namespace {

using indications::AddressPolicy;
using indications::machineAddress;
using indications::MachineAddress;
using indications::networkIn;

bool allows(const AddressPolicy& policy, const std::string& address, std::uint16_t port = 5000) {
    sockaddr_storage storage{};
    sockaddr_in ipv4{};
    sockaddr_in6 ipv6{};
    if (::inet_pton(AF_INET, address.c_str(), &ipv4.sin_addr) == 1) {
        ipv4.sin_family = AF_INET;
        ipv4.sin_port = htons(port);
        std::memcpy(&storage, &ipv4, sizeof ipv4);
    } else {
        EXPECT_EQ(::inet_pton(AF_INET6, address.c_str(), &ipv6.sin6_addr), 1) << address;
        ipv6.sin6_family = AF_INET6;
        ipv6.sin6_port = htons(port);
        std::memcpy(&storage, &ipv6, sizeof ipv6);
    }
    return policy.allows(reinterpret_cast<const sockaddr&>(storage));
}

AddressPolicy toNetworks(std::initializer_list<const char*> texts) {
    std::vector<indications::Network> networks;
    for (const char* text : texts)
        networks.push_back(networkIn(text).value());
    return AddressPolicy::onlyTo(std::move(networks));
}

TEST(AddressPolicyTest, LetsIndicationsGoToTheSubscriberAlone) {
    const auto policy = AddressPolicy::onlyTo(machineAddress("192.0.2.7").value());
    EXPECT_TRUE(allows(policy, "192.0.2.7") && allows(policy, "::ffff:192.0.2.7"));
    EXPECT_TRUE(allows(policy, "192.0.2.7", 80) && allows(policy, "192.0.2.7", 443) &&
                allows(policy, "192.0.2.7", 1024));
    EXPECT_FALSE(allows(policy, "192.0.2.7", 22) || allows(policy, "192.0.2.7", 1023));
    EXPECT_FALSE(allows(policy, "192.0.2.8") || allows(policy, "127.0.0.1") || allows(policy, "::1"));
    const auto local = AddressPolicy::onlyTo(machineAddress("::1").value());
    EXPECT_TRUE(allows(local, "127.0.0.1") && allows(local, "127.1.2.3") && allows(local, "::1"));
    EXPECT_FALSE(allows(local, "192.0.2.7"));
    EXPECT_EQ(machineAddress("fe80::1%eth0"), machineAddress("fe80::1"));
}

TEST(AddressPolicyTest, LetsThemGoNowhereThatIsNoOtherMachine) {
    const MachineAddress elsewhere = machineAddress("198.51.100.4").value();
    const auto policies = {AddressPolicy::anywhere(elsewhere), toNetworks({"0.0.0.0/0", "::/0"})};
    for (const AddressPolicy& policy : policies) {
        for (const char* address :
             {"192.0.2.7", "2001:db8::1", "1.0.0.0", "126.255.255.255", "128.0.0.0", "169.253.255.255",
              "169.255.0.0", "223.255.255.255", "::2", "fe7f::1", "fec0::1", "feff::1"})
            EXPECT_TRUE(allows(policy, address)) << address;
        for (const char* address :
             {"127.0.0.1", "::1", "::ffff:127.0.0.1", "127.255.255.255", "0.0.0.0", "0.255.255.255",
              "::", "224.0.0.1", "ff02::1", "255.255.255.255", "169.254.0.0", "169.254.169.254",
              "::ffff:169.254.169.254", "fe80::1", "febf::1"})
            EXPECT_FALSE(allows(policy, address)) << address;
    }
    sockaddr local{};
    local.sa_family = AF_UNIX;
    EXPECT_FALSE(AddressPolicy::anywhere(elsewhere).allows(local));
    const auto here = AddressPolicy::anywhere(machineAddress("127.0.0.1").value());
    EXPECT_TRUE(allows(here, "127.0.0.1") && allows(here, "::1") && allows(here, "192.0.2.7"));
    EXPECT_FALSE(allows(here, "0.0.0.0") || allows(here, "169.254.169.254"));
}

TEST(AddressPolicyTest, ObeysAListOfNetworks) {
    const auto policy = toNetworks({"192.0.2.128/25", "2001:db8:4::/46", "127.0.0.1"});
    EXPECT_TRUE(allows(policy, "192.0.2.128") && allows(policy, "192.0.2.255", 22));
    EXPECT_FALSE(allows(policy, "192.0.2.127") || allows(policy, "192.0.3.128"));
    EXPECT_TRUE(allows(policy, "2001:db8:7:ffff::1"));
    EXPECT_FALSE(allows(policy, "2001:db8:8::1"));
    EXPECT_TRUE(allows(policy, "127.0.0.1"));
    EXPECT_FALSE(allows(policy, "127.0.0.2"));
    for (const char* right : {"192.0.2.0/32", "192.0.2.0/0", "::/128"})
        EXPECT_TRUE(networkIn(right).has_value()) << right;
    for (const char* wrong :
         {"", "h", "192.0.2.0/33", "192.0.2.0/", "192.0.2.0/-1", "::/129", "1.2.3/8", "/8"})
        EXPECT_FALSE(networkIn(wrong).has_value()) << wrong;
}

}  // namespace
