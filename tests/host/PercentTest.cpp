#include "hosts/linux/util/Percent.h"

#include <gtest/gtest.h>

#include <string>

namespace {

TEST(Percent, ComesBackForEveryByte) {
    std::string all;
    for (int byte = 0; byte < 256; ++byte) {
        all += static_cast<char>(byte);
    }
    const std::string encoded = host::PercentEncode(all);
    EXPECT_EQ(encoded.find_first_not_of("ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz"
                                        "0123456789-_.~%"),
              std::string::npos);
    EXPECT_EQ(host::PercentDecode(encoded, true), all);
    EXPECT_EQ(host::PercentDecode(encoded, false), all);
}

TEST(Percent, DecodesHexadecimalDigitsOfEitherCaseAndNothingElse) {
    for (int first = 0; first < 256; ++first) {
        for (int second = 0; second < 256; ++second) {
            const std::string text = {'%', static_cast<char>(first), static_cast<char>(second)};
            const bool digits = first < 128 && second < 128 && isxdigit(first) && isxdigit(second);
            const std::string decoded = host::PercentDecode(text, false);
            if (digits) {
                ASSERT_EQ(
                    decoded,
                    std::string(1, static_cast<char>(std::stoi(text.substr(1), nullptr, 16))));
            } else {
                ASSERT_EQ(decoded, text);
            }
        }
    }
}

}  // namespace
