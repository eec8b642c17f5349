#include "hosts/linux/relay/Hops.h"

#include <gtest/gtest.h>

#include <string>

namespace {

struct HopRow {
    const char* name;
    const char* came;
    int goesOn;  // 0 for not at all
};

class NextHop : public ::testing::TestWithParam<HopRow> {};

TEST_P(NextHop, CountsOneMoreUpToFour) {
    int hops = 0;
    EXPECT_EQ(host::NextHop(GetParam().came, &hops), GetParam().goesOn != 0);
    EXPECT_EQ(hops, GetParam().goesOn);
}

const HopRow kRows[] = {
    {"FromAClient", nullptr, 1},
    {"Empty", "", 1},
    {"Zero", "0", 1},
    {"Three", "3", 4},
    {"Four", "4", 0},
    {"ThreeWithZeros", "0003", 4},
    {"FourWithZeros", "00000000000000000004", 0},
    {"Forty", "40", 0},
    {"MoreThanAnInteger", "99999999999999999999", 0},
    {"MoreThanAnIntegerThatWrapsToZero", "18446744073709551616", 0},
    {"Negative", "-9", 1},
    {"WithSign", "+4", 1},
    {"WithBlank", " 4", 1},
    {"BlankBehind", "4 ", 1},
    {"TwoNumbers", "4, 4", 1},
    {"Hexadecimal", "0x9", 1},
    {"Words", "many", 1},
    {"OtherDigits", "\xD9\xA4", 1},
};

INSTANTIATE_TEST_SUITE_P(Rows, NextHop, ::testing::ValuesIn(kRows),
                         [](const auto& row) { return std::string(row.param.name); });

}  // namespace
