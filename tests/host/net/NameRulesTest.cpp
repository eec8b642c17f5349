#include <gtest/gtest.h>

#include <string>

#include "platform/System.h"

namespace {

// Labels of 63 characters and dots, cut to a length.
std::string NameOf(size_t length) {
    std::string name;
    while (name.size() < length) {
        name += std::string(63, 'a') + ".";
    }
    return name.substr(0, length);
}

struct NameRow {
    const char* name;
    std::string text;
    bool isDomain;
    bool isHost;
};

const NameRow kNames[] = {
    {"one label", "nas", true, true},
    {"one letter", "a", true, true},
    {"domain", "example.org", true, true},
    {"deep", "a.b.c.d.e.f.example.org", true, true},
    {"upper case", "NAS.Example.ORG", true, true},
    {"digit in front", "3com.com", true, true},
    {"digits behind", "nas01", true, true},
    {"numeric label that is not the last", "1.example", true, true},
    {"hyphen inside", "my-nas.my-home", true, true},
    {"hyphens inside", "a--b.xn--p1ai", true, true},

    {"empty", "", false, false},
    {"a dot", ".", false, false},
    {"two dots", "..", false, false},
    {"dot behind", "example.org.", true, false},
    {"dot behind one label", "nas.", true, false},
    {"two dots behind", "example.org..", false, false},
    {"dot in front", ".example.org", false, false},
    {"empty label", "example..org", false, false},

    {"label of 63", std::string(63, 'a'), true, true},
    {"label of 64", std::string(64, 'a'), false, false},
    {"last label of 63", "a." + std::string(63, 'a'), true, true},
    {"last label of 64", "a." + std::string(64, 'a'), false, false},
    {"first label of 64", std::string(64, 'a') + ".a", false, false},
    {"label of 63 and a dot", std::string(63, 'a') + ".", true, false},
    {"label of 64 and a dot", std::string(64, 'a') + ".", false, false},
    {"252 in all", NameOf(252), true, true},
    {"253 in all", NameOf(253), true, true},
    {"254 in all", NameOf(254), false, false},
    {"253 and a dot", NameOf(253) + ".", true, false},
    {"254 and a dot", NameOf(254) + ".", false, false},
    {"255 in all", NameOf(255), false, false},
    {"253 and two dots", NameOf(253) + "..", false, false},
    {"very long", NameOf(100001), false, false},

    {"hyphen", "-", false, false},
    {"hyphen in front", "-nas", false, false},
    {"hyphen behind", "nas-", false, false},
    {"hyphen in front of a later label", "nas.-example", false, false},
    {"hyphen behind the first label", "nas-.example", false, false},
    {"hyphen before the final dot", "nas-.", false, false},

    {"number", "123", false, false},
    {"zero", "0", false, false},
    {"number and a dot", "123.", false, false},
    {"IPv4", "10.0.0.1", false, false},
    {"IPv4 and a dot", "10.0.0.1.", false, false},
    {"short IPv4", "10.1", false, false},
    {"numeric last label", "example.1", false, false},
    {"almost numeric last label", "example.1a", true, true},
    {"number with a hyphen", "1-2", true, true},

    {"underscore", "my_nas", false, false},
    {"underscore in front", "_http._tcp.example.org", false, false},
    {"star", "*.example.org", false, false},
    {"IPv6", "::1", false, false},
    {"port", "example.org:80", false, false},
    {"path", "example.org/", false, false},
    {"user", "me@example.org", false, false},
    {"percent", "a%41", false, false},
    {"blank in front", " nas", false, false},
    {"blank behind", "nas ", false, false},
    {"blank inside", "my nas", false, false},
    {"end of line", "nas\n", false, false},
    {"second line", "nas\nevil", false, false},
};

TEST(NameRules, TellDomainsAndHosts) {
    for (const NameRow& row : kNames) {
        EXPECT_EQ(BlTLIBIsDomain(row.text.c_str()) != 0, row.isDomain) << row.name;
        EXPECT_EQ(BlTLIBIsHostname(row.text.c_str()) != 0, row.isHost) << row.name;
    }
}

TEST(NameRules, AllowLettersDigitsAndInnerHyphensOfAscii) {
    const std::string allowed = "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789-.";
    for (int code = 1; code < 128; ++code) {
        const char byte = static_cast<char>(code);
        const bool passes = allowed.find(byte) != std::string::npos;
        const std::string name = std::string("a") + byte + "b";
        EXPECT_EQ(BlTLIBIsDomain(name.c_str()) != 0, passes) << code;
        EXPECT_EQ(BlTLIBIsHostname(name.c_str()) != 0, passes) << code;
    }
}

TEST(NameRules, RefuseNull) {
    EXPECT_EQ(BlTLIBIsDomain(nullptr), 0);
    EXPECT_EQ(BlTLIBIsHostname(nullptr), 0);
}

}  // namespace
