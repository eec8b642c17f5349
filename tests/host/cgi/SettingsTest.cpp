#include <cstring>
#include <string>

#include "platform/System.h"
#include "tests/host/cgi/SessionFixture.h"

namespace {

TEST(Settings, HoldATimeoutBetweenAMinuteAndAYear) {
    Host host;
    EXPECT_EQ(TLIBCConfGetORBTimeout(), 30);
    const struct {
        const char* text;
        int minutes;
    } rows[] = {
        {"1", 1},           {"15", 15},     {"007", 7},
        {"527040", 527040}, {"527041", 30}, {"0", 30},
        {"-1", 30},         {"+5", 30},     {"", 30},
        {"abc", 30},        {"15m", 30},    {"1.5", 30},
        {"1e2", 30},        {"0x10", 30},   {"1 5", 30},
        {"2147483648", 30}, {" 15 ", 30},   {"99999999999999999999999", 30},
    };
    for (const auto& row : rows) {
        host.Configure("session_timeout=\"" + std::string(row.text) + "\"\n");
        EXPECT_EQ(TLIBCConfGetORBTimeout(), row.minutes) << row.text;
    }
}

TEST(LowerCase, IsMadeOfAsciiLettersOnly) {
    const struct {
        const char* text;
        size_t size;
        const char* lowered;
    } rows[] = {
        {"", 0, ""},
        {"ABCXYZ", 0, "abcxyz"},
        {"aB1-_ zZ", 0, "ab1-_ zz"},
        {"@[`{", 0, "@[`{"},
        {"\xC3\x89\xFF", 0, "\xC3\x89\xFF"},
        {"ABCDEF", 3, "abcDEF"},
        {"ABC", 1, "aBC"},
        {"ABC", 100, "abc"},
    };
    for (const auto& row : rows) {
        std::string text = row.text;
        text += '\0';
        TLIBCStrCaseLower(&text[0], row.size);
        EXPECT_STREQ(text.c_str(), row.lowered) << row.text;
    }
    TLIBCStrCaseLower(nullptr, 0);
}

TEST(LowerCase, StaysWithinItsSizeAndItsText) {
    char open[3] = {'A', 'B', 'C'};
    TLIBCStrCaseLower(open, sizeof open);
    EXPECT_EQ(std::memcmp(open, "abc", 3), 0);
    char two[] = "AB\0CD";
    TLIBCStrCaseLower(two, sizeof two);
    EXPECT_EQ(std::memcmp(two, "ab\0CD", sizeof two), 0);
}

}  // namespace
