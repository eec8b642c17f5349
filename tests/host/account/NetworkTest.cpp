#include "hosts/linux/util/Network.h"

#include <gtest/gtest.h>

namespace {

struct MembershipRow {
    const char* name;
    const char* address;
    const char* network;
    bool inside;
};

const MembershipRow kMemberships[] = {
    {"first address", "192.168.0.0", "192.168.0.0/16", true},
    {"last address", "192.168.255.255", "192.168.0.0/16", true},
    {"one below", "192.167.255.255", "192.168.0.0/16", false},
    {"one above", "192.169.0.0", "192.168.0.0/16", false},
    {"odd prefix inside", "10.0.0.127", "10.0.0.0/25", true},
    {"odd prefix outside", "10.0.0.128", "10.0.0.0/25", false},
    {"prefix 31", "10.0.0.1", "10.0.0.0/31", true},
    {"prefix 31 outside", "10.0.0.2", "10.0.0.0/31", false},
    {"prefix 32", "10.0.0.1", "10.0.0.1/32", true},
    {"prefix 32 of a neighbour", "10.0.0.1", "10.0.0.2/32", false},
    {"single address", "10.0.0.1", "10.0.0.1", true},
    {"another single address", "10.0.0.1", "10.0.0.2", false},
    {"all of IPv4", "203.0.113.9", "0.0.0.0/0", true},
    {"host bits are ignored", "192.168.77.1", "192.168.3.4/16", true},
    {"IPv6 inside", "fd12:3456::1", "fd00::/8", true},
    {"IPv6 outside", "fe80::1", "fd00::/8", false},
    {"IPv6 odd prefix inside", "2001:db8:7fff::1", "2001:db8::/33", true},
    {"IPv6 odd prefix outside", "2001:db8:8000::1", "2001:db8::/33", false},
    {"IPv6 single", "::1", "::1", true},
    {"IPv6 prefix 128", "2001:db8::1", "2001:db8::1/128", true},
    {"IPv6 spelled in another way", "2001:0DB8:0:0::1", "2001:db8::1", true},
    {"all of IPv6", "2001:db8::1", "::/0", true},
    {"IPv4 is not in IPv6", "10.0.0.1", "::/0", false},
    {"IPv6 is not in IPv4", "::1", "0.0.0.0/0", false},
    {"mapped address is IPv4", "::ffff:10.1.2.3", "10.0.0.0/8", true},
    {"mapped address in hexadecimal", "::ffff:a01:203", "10.0.0.0/8", true},
    {"mapped address outside", "::ffff:11.1.2.3", "10.0.0.0/8", false},
    {"mapped address is not IPv6", "::ffff:10.1.2.3", "::/0", false},
    {"mapped network", "10.1.2.3", "::ffff:10.0.0.0/104", true},
    {"mapped network outside", "11.1.2.3", "::ffff:10.0.0.0/104", false},
    {"mapped single", "10.1.2.3", "::ffff:10.1.2.3", true},
    {"all of IPv4, mapped", "10.1.2.3", "::ffff:0:0/96", true},
    {"wider than mapped stays IPv6", "10.1.2.3", "::ffff:0:0/95", false},
};

TEST(InNetwork, FollowsThePrefix) {
    for (const MembershipRow& row : kMemberships) {
        EXPECT_EQ(row.inside, host::InNetwork(row.address, row.network)) << row.name;
    }
}

TEST(InNetwork, RefusesWhatIsNoAddress) {
    const std::string texts[] = {
        "",           " 10.0.0.1", "10.0.0.1 ",  "10.0.0.1\n",   "10.1",        "10.0.0.256",
        "10.0.0.1.1", "1",         "0x0a000001", "010.0.0.1",    "10.0.0.1/32", "localhost",
        "::1%lo",     ":::",       "[::1]",      "10.0.0.1:80",  "2001:db8::g", "::ffff:10.0.0",
        "unknown",    "-",         "+1.2.3.4",   "1.2.3.4.5.6.", "12345::",     "1::2::3"};
    for (const std::string& text : texts) {
        EXPECT_FALSE(host::IsAddress(text)) << text;
        EXPECT_FALSE(host::InNetwork(text, "0.0.0.0/0")) << text;
        EXPECT_FALSE(host::InNetwork(text, "::/0")) << text;
        EXPECT_EQ("", host::CanonicalAddress(text)) << text;
    }
    const std::string withNul("10.0.0.1\0x", 10);
    EXPECT_FALSE(host::IsAddress(withNul));
    EXPECT_FALSE(host::InNetwork(withNul, "10.0.0.0/8"));
}

TEST(InNetwork, RefusesWhatIsNoNetwork) {
    const std::string texts[] = {"",
                                 "/",
                                 "/8",
                                 "10.0.0.0/",
                                 "10.0.0.0/33",
                                 "10.0.0.0/-1",
                                 "10.0.0.0/+8",
                                 "10.0.0.0/ 8",
                                 "10.0.0.0/8 ",
                                 "10.0.0.0/08",
                                 "10.0.0.0/8/8",
                                 "10.0.0.0/0x8",
                                 "10/8",
                                 "::/129",
                                 "::/1000",
                                 "::/00",
                                 "any",
                                 "10.0.0.0/a",
                                 "10.0.0.0/255.0.0.0",
                                 "10.0.0.0/4294967304"};
    for (const std::string& text : texts) {
        EXPECT_FALSE(host::IsNetwork(text)) << text;
        EXPECT_FALSE(host::InNetwork("10.0.0.1", text)) << text;
        EXPECT_FALSE(host::InNetwork("::1", text)) << text;
    }
    EXPECT_FALSE(host::IsNetwork(std::string("10.0.0.0\0/8", 11)));
    EXPECT_FALSE(host::IsNetwork(std::string("10.0.0.0/8\0", 11)));
}

TEST(CanonicalAddress, HasOneSpellingForEachAddress) {
    EXPECT_EQ("10.1.2.3", host::CanonicalAddress("10.1.2.3"));
    EXPECT_EQ("10.1.2.3", host::CanonicalAddress("::ffff:10.1.2.3"));
    EXPECT_EQ("10.1.2.3", host::CanonicalAddress("::FFFF:0A01:0203"));
    EXPECT_EQ("2001:db8::1", host::CanonicalAddress("2001:0DB8:0:0:0::1"));
}

}  // namespace
