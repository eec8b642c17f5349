#include "hosts/linux/cipher/Base64Url.h"

#include <gtest/gtest.h>

namespace {

struct Row {
    const char* name;
    std::string bytes;
    std::string text;
};

const Row kRows[] = {
    {"nothing", "", ""},
    {"one byte", "f", "Zg"},
    {"two bytes", "fo", "Zm8"},
    {"three bytes", "foo", "Zm9v"},
    {"six bytes", "foobar", "Zm9vYmFy"},
    {"both odd characters", "\xfb\xff\xfe", "-__-"},
    {"zeros", std::string(4, '\0'), "AAAAAA"},
    {"the highest", "\xff", "_w"},
};

TEST(Base64Url, IsOneTextForOneValue) {
    for (const Row& row : kRows) {
        std::string bytes = "untouched";
        EXPECT_EQ(host::ToBase64Url(row.bytes), row.text) << row.name;
        EXPECT_TRUE(host::FromBase64Url(row.text.data(), row.text.size(), &bytes)) << row.name;
        EXPECT_EQ(bytes, row.bytes) << row.name;
    }
}

TEST(Base64Url, RefusesEveryOtherText) {
    const Row rows[] = {
        {"a single character", "", "A"},
        {"five characters", "", "AAAAA"},
        {"padding of one byte", "", "Zg=="},
        {"padding of two bytes", "", "Zm8="},
        {"bits left over behind one byte", "", "Zh"},
        {"bits left over behind two bytes", "", "Zm9"},
        {"the other alphabet's plus", "", "+__-"},
        {"the other alphabet's slash", "", "-_/-"},
        {"a blank within", "", "Zm 9v"},
        {"a line's end", "", "Zm9v\n"},
        {"a NUL", "", std::string("Zm\0v", 4)},
        {"a letter that is none of ASCII", "", "Z\xc3\xa4v"},
        {"the highest byte", "", "Zm9\xff"},
    };
    for (const Row& row : rows) {
        std::string bytes = "untouched";
        EXPECT_FALSE(host::FromBase64Url(row.text.data(), row.text.size(), &bytes)) << row.name;
        EXPECT_EQ(bytes, "untouched") << row.name;
    }
}

TEST(Base64Url, TakesItsAlphabetAndNothingElse) {
    const std::string alphabet = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-_";
    for (int byte = 0; byte < 256; ++byte) {
        const std::string text = std::string("AAA") + static_cast<char>(byte);
        std::string bytes;
        EXPECT_EQ(host::FromBase64Url(text.data(), text.size(), &bytes),
                  alphabet.find(text[3]) != std::string::npos)
            << byte;
    }
}

TEST(Base64Url, CarriesAMegabyte) {
    std::string bytes;
    for (unsigned value = 1; bytes.size() < (1u << 20) + 1; value = value * 1103515245u + 12345u) {
        bytes += static_cast<char>(value >> 16);
    }
    const std::string text = host::ToBase64Url(bytes);
    std::string again;
    ASSERT_TRUE(host::FromBase64Url(text.data(), text.size(), &again));
    EXPECT_TRUE(again == bytes);
}

}  // namespace
