#include <gtest/gtest.h>

#include <string>

#include "platform/System.h"

namespace {

struct AddressRow {
    const char* name;
    std::string text;
    int family;
};

const AddressRow kAddresses[] = {
    {"IPv4", "192.168.1.20", 2},
    {"IPv4, lowest", "0.0.0.0", 2},
    {"IPv4, highest", "255.255.255.255", 2},
    {"IPv4, one part too high", "255.255.255.256", 0},
    {"IPv4, first part too high", "256.0.0.1", 0},
    {"IPv4, four digits", "1000.0.0.1", 0},
    {"IPv4, three parts", "10.0.1", 0},
    {"IPv4, two parts", "10.1", 0},
    {"IPv4, one number", "167772161", 0},
    {"IPv4, five parts", "10.0.0.0.1", 0},
    {"IPv4, leading zero", "010.0.0.1", 0},
    {"IPv4, hexadecimal part", "0xa.0.0.1", 0},
    {"IPv4, empty part", "10..0.1", 0},
    {"IPv4, dot behind", "10.0.0.1.", 0},
    {"IPv4, dot in front", ".10.0.0.1", 0},
    {"IPv4, sign", "+10.0.0.1", 0},
    {"IPv4, negative part", "10.0.0.-1", 0},
    {"IPv4, port", "10.0.0.1:80", 0},
    {"IPv4, prefix", "10.0.0.1/8", 0},
    {"IPv4, blank in front", " 10.0.0.1", 0},
    {"IPv4, blank behind", "10.0.0.1 ", 0},
    {"IPv4, end of line", "10.0.0.1\n", 0},
    {"IPv4, digits of another script", "\xD9\xA1.0.0.1", 0},

    {"IPv6, loopback", "::1", 10},
    {"IPv6, unspecified", "::", 10},
    {"IPv6, whole", "2001:0db8:0000:0000:0000:0000:0000:0001", 10},
    {"IPv6, upper case", "2001:DB8::A", 10},
    {"IPv6, highest", "ffff:ffff:ffff:ffff:ffff:ffff:ffff:ffff", 10},
    {"IPv6, shortened in front", "::2:3:4:5:6:7:8", 10},
    {"IPv6, shortened behind", "1:2:3:4:5:6:7::", 10},
    {"IPv6 with IPv4", "::ffff:10.0.0.1", 10},
    {"IPv6 with IPv4, whole", "1:2:3:4:5:6:10.0.0.1", 10},
    {"IPv6 with IPv4, part too high", "::ffff:10.0.0.256", 0},
    {"IPv6 with IPv4, not at the end", "::10.0.0.1:1", 0},
    {"IPv6, seven groups", "1:2:3:4:5:6:7", 0},
    {"IPv6, nine groups", "1:2:3:4:5:6:7:8:9", 0},
    {"IPv6, shortened twice", "1::2::3", 0},
    {"IPv6, three colons", ":::", 0},
    {"IPv6, one colon", ":", 0},
    {"IPv6, colon behind", "1:2:3:4:5:6:7:8:", 0},
    {"IPv6, colon in front", ":1:2:3:4:5:6:7:8", 0},
    {"IPv6, five digits", "12345::", 0},
    {"IPv6, no hexadecimal digit", "2001:db8::g", 0},
    {"IPv6, zone by name", "fe80::1%eth0", 0},
    {"IPv6, zone by number", "fe80::1%1", 0},
    {"IPv6, zone of the loopback", "::1%lo", 0},
    {"IPv6, empty zone", "fe80::1%", 0},
    {"IPv6, escaped zone", "fe80::1%25eth0", 0},
    {"IPv6, brackets", "[::1]", 0},
    {"IPv6, brackets and port", "[::1]:80", 0},
    {"IPv6, prefix", "fd00::/8", 0},
    {"IPv6, blank behind", "::1 ", 0},

    {"empty", "", 0},
    {"blank", " ", 0},
    {"host name", "localhost", 0},
    {"domain", "example.org", 0},
    {"star", "*", 0},
    {"long text", std::string(100000, '1'), 0},
    {"many colons", std::string(100000, ':'), 0},
};

TEST(AddressFamily, FollowsTheText) {
    for (const AddressRow& row : kAddresses) {
        EXPECT_EQ(TALONetGetAddrType(row.text.c_str()), row.family) << row.name;
    }
}

TEST(AddressFamily, IsNeitherForNull) {
    EXPECT_EQ(TALONetGetAddrType(nullptr), 0);
}

}  // namespace
