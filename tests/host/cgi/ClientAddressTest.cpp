#include <string>

#include "hosts/linux/cgi/RemoteAddress.h"
#include "platform/Cgi.h"
#include "tests/host/cgi/SessionFixture.h"

namespace {

std::string Hops(size_t count, const std::string& hop, const std::string& first) {
    std::string header = first;
    for (size_t index = 0; index < count; ++index) {
        header += ", " + hop;
    }
    return header;
}

struct Row {
    const char* what;
    std::string peer;
    std::string forwardedFor;
    std::string trusted;
    std::string client;
};

void ExpectRows(const std::vector<Row>& rows) {
    for (const Row& row : rows) {
        EXPECT_EQ(host::ClientAddress(row.peer, row.forwardedFor, row.trusted), row.client)
            << row.what;
    }
}

TEST(ClientAddress, IsThePeerWithoutATrustedProxy) {
    ExpectRows({
        {"plain", "192.0.2.1", "", "", "192.0.2.1"},
        {"nobody is trusted", "192.0.2.1", "198.51.100.7", "", "192.0.2.1"},
        {"another is trusted", "192.0.2.1", "198.51.100.7", "10.0.0.0/8", "192.0.2.1"},
        {"trusted without a header", "10.0.0.1", "", "10.0.0.0/8", "10.0.0.1"},
        {"a list that is garbage", "10.0.0.1", "198.51.100.7", "proxy.local,,/8,10.0.0.0/33",
         "10.0.0.1"},
        {"IPv6", "2001:DB8:0:0::1", "", "", "2001:db8::1"},
        {"IPv4 written as IPv6", "::ffff:192.0.2.1", "", "", "192.0.2.1"},
        {"IPv4 written as IPv6 in hex", "::FFFF:c000:0201", "", "", "192.0.2.1"},
    });
}

TEST(ClientAddress, IsNothingForAPeerThatIsNoAddress) {
    for (const char* peer :
         {"", " ", "localhost", "unix:", "192.0.2", "192.0.2.1:80", "192.0.2.256", "[::1]",
          "fe80::1%eth0", "192.0.2.1 ", "0x7f.1", "192.0.2.01"}) {
        EXPECT_EQ(host::ClientAddress(peer, "198.51.100.7", "0.0.0.0/0,::/0"), "") << peer;
    }
    EXPECT_EQ(host::ClientAddress(std::string("192.0.2.1\0x", 11), "", ""), "");
}

TEST(ClientAddress, IsTheLastHopThatIsNoProxy) {
    const std::string trusted = "10.0.0.0/8, 192.0.2.9 ,fd00::/8";
    ExpectRows({
        {"one hop", "10.0.0.1", "198.51.100.7", trusted, "198.51.100.7"},
        {"what it claims itself", "10.0.0.1", "203.0.113.5, 198.51.100.7", trusted, "198.51.100.7"},
        {"two proxies", "10.0.0.1", "198.51.100.7, 10.0.0.2", trusted, "198.51.100.7"},
        {"a single address is trusted", "192.0.2.9", "198.51.100.7", trusted, "198.51.100.7"},
        {"its neighbour is not", "192.0.2.8", "198.51.100.7", trusted, "192.0.2.8"},
        {"a stranger between proxies", "10.0.0.1", "198.51.100.7, 203.0.113.5, 10.0.0.2", trusted,
         "203.0.113.5"},
        {"only proxies", "10.0.0.1", "10.0.0.3, 10.0.0.2", trusted, "10.0.0.3"},
        {"an invented proxy in front", "10.0.0.1", "10.0.0.2, 198.51.100.7", trusted,
         "198.51.100.7"},
        {"IPv6 behind IPv6", "fd00::1", "2001:DB8::7", trusted, "2001:db8::7"},
        {"IPv6 behind IPv4", "10.0.0.1", "2001:db8::7", trusted, "2001:db8::7"},
        {"a proxy written as IPv6", "::ffff:10.0.0.1", "198.51.100.7", trusted, "198.51.100.7"},
        {"a hop written as IPv6", "10.0.0.1", "198.51.100.7, ::ffff:10.0.0.2", trusted,
         "198.51.100.7"},
        {"the network written as IPv6", "10.0.0.1", "198.51.100.7", "::ffff:10.0.0.0/104",
         "198.51.100.7"},
    });
}

TEST(ClientAddress, ForgivesBlanksAroundHopsAndNetworks) {
    ExpectRows({
        {"no blanks", "10.0.0.1", "198.51.100.7,10.0.0.2", "10.0.0.0/8", "198.51.100.7"},
        {"many blanks", "10.0.0.1", " \t 198.51.100.7 \t ,  10.0.0.2  ", "  10.0.0.0/8  ",
         "198.51.100.7"},
    });
}

// Whoever reported it could have been told anything.
TEST(ClientAddress, IsTheProxyThatReportedAHopThatIsNoAddress) {
    const std::string trusted = "10.0.0.0/8";
    for (const std::string& hop :
         {std::string("unknown"), std::string("_hidden"), std::string(), std::string(" "),
          std::string("198.51.100.7:4711"), std::string("[2001:db8::7]"),
          std::string("\"198.51.100.7\""), std::string("198.51.100"), std::string("localhost"),
          std::string("198.51.100.7;10.0.0.2"), std::string("fe80::1%eth0"),
          std::string("198.51.100.7\0", 13), std::string(70000, '1'), std::string("\xFF\xFE"),
          std::string("198.51.100.7\r\nX: y")}) {
        EXPECT_EQ(host::ClientAddress("10.0.0.1", "203.0.113.5, " + hop, trusted), "10.0.0.1")
            << hop.substr(0, 40);
        EXPECT_EQ(host::ClientAddress("10.0.0.1", "203.0.113.5, " + hop + ", 10.0.0.2", trusted),
                  "10.0.0.2")
            << hop.substr(0, 40);
    }
    EXPECT_EQ(host::ClientAddress("10.0.0.1", ",", trusted), "10.0.0.1");
    EXPECT_EQ(host::ClientAddress("10.0.0.1", "198.51.100.7,", trusted), "10.0.0.1");
}

TEST(ClientAddress, LooksAt32HopsFromTheEnd) {
    const std::string trusted = "10.0.0.0/8";
    const std::string client = "198.51.100.7";
    EXPECT_EQ(host::ClientAddress("10.0.0.1", Hops(31, "10.0.0.2", client), trusted), client);
    EXPECT_EQ(host::ClientAddress("10.0.0.1", Hops(32, "10.0.0.2", client), trusted), "10.0.0.2");
    EXPECT_EQ(host::ClientAddress("10.0.0.1", Hops(33, "10.0.0.2", client), trusted), "10.0.0.2");
    EXPECT_EQ(host::ClientAddress("10.0.0.1", Hops(20000, "10.0.0.2", client), trusted),
              "10.0.0.2");
    EXPECT_EQ(host::ClientAddress("10.0.0.1", Hops(1, client, Hops(20000, "x", "")), trusted),
              client);
}

class RemoteIP : public ::testing::Test {
  protected:
    static std::string Asked(size_t size = 65) {
        std::string buffer(66, '#');
        return TaloCgiGetRemoteIP(&buffer[0], size) == 0 ? buffer.c_str() : "refused";
    }

    Host host;
};

TEST_F(RemoteIP, ReadsEnvironmentAndConfiguration) {
    EXPECT_EQ(Asked(), "refused");
    host.Say("REMOTE_ADDR", "10.0.0.1");
    host.Say("HTTP_X_FORWARDED_FOR", "198.51.100.7");
    EXPECT_EQ(Asked(), "10.0.0.1");
    host.Configure("trusted_proxies=\"10.0.0.0/8,fd00::/8\"\n");
    EXPECT_EQ(Asked(), "198.51.100.7");
    host.Say("REMOTE_ADDR", "nonsense");
    EXPECT_EQ(Asked(), "refused");
}

TEST_F(RemoteIP, IsWrittenWholeOrNotAtAll) {
    host.Say("REMOTE_ADDR", "192.0.2.100");
    char buffer[] = "untouched-buffer";
    EXPECT_LT(TaloCgiGetRemoteIP(buffer, 11), 0);
    EXPECT_LT(TaloCgiGetRemoteIP(buffer, 0), 0);
    EXPECT_STREQ(buffer, "untouched-buffer");
    EXPECT_EQ(TaloCgiGetRemoteIP(buffer, 12), 0);
    EXPECT_STREQ(buffer, "192.0.2.100");
    EXPECT_LT(TaloCgiGetRemoteIP(nullptr, 65), 0);
}

}  // namespace
