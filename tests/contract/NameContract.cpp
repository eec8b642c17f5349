#include <string>

#include "platform/System.h"
#include "tests/contract/World.h"

namespace {

TEST(AddressFamily, IsToldOfFullFormsOnly) {
    const struct {
        const char* text;
        int family;
    } rows[] = {
        {"10.0.0.1", 2},   {"::1", 10},       {"2001:db8::1", 10}, {"10.1", 0},
        {"localhost", 0},  {"", 0},           {"fe80::1%lo", 0},   {"[::1]", 0},
        {"10.0.0.1/8", 0}, {"10.0.0.256", 0},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(TALONetGetAddrType(row.text), row.family) << row.text;
    }
}

TEST(Name, IsADomainOrAHost) {
    const std::string label(63, 'a');
    const struct {
        std::string text;
        bool isDomain;
        bool isHost;
    } rows[] = {
        {"nas", true, true},  {"nas.example.org", true, true}, {"nas.example.org.", true, false},
        {label, true, true},  {label + "a", false, false},     {"", false, false},
        {".", false, false},  {"a..b", false, false},          {"-a", false, false},
        {"a-", false, false}, {"a_b", false, false},           {"10.0.0.1", false, false},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(BlTLIBIsDomain(row.text.c_str()) != 0, row.isDomain) << row.text;
        EXPECT_EQ(BlTLIBIsHostname(row.text.c_str()) != 0, row.isHost) << row.text;
    }
}

}  // namespace
