#include "src/base/Utf8.h"

#include <gtest/gtest.h>

#include <string>

namespace {

struct Row {
    const char* name;
    std::string bytes;
    size_t length;
};

const Row kRows[] = {
    {"zero byte", std::string(1, '\0'), 1},
    {"ASCII", "a", 1},
    {"last ASCII", "\x7F", 1},
    {"ASCII before more", "ab", 1},
    {"first of two bytes", "\xC2\x80", 2},
    {"last of two bytes", "\xDF\xBF", 2},
    {"first of three bytes", "\xE0\xA0\x80", 3},
    {"last before the surrogates", "\xED\x9F\xBF", 3},
    {"first after the surrogates", "\xEE\x80\x80", 3},
    {"last of three bytes", "\xEF\xBF\xBF", 3},
    {"first of four bytes", "\xF0\x90\x80\x80", 4},
    {"U+10FFFF", "\xF4\x8F\xBF\xBF", 4},
    {"two bytes before more", "\xC3\xA9\xC3", 2},
    {"stray continuation, lowest", "\x80", 0},
    {"stray continuation, highest", "\xBF", 0},
    {"overlong slash in two bytes", "\xC0\xAF", 0},
    {"overlong two bytes, highest", "\xC1\xBF", 0},
    {"overlong three bytes, highest", "\xE0\x9F\xBF", 0},
    {"overlong four bytes, highest", "\xF0\x8F\xBF\xBF", 0},
    {"first surrogate", "\xED\xA0\x80", 0},
    {"last surrogate", "\xED\xBF\xBF", 0},
    {"above U+10FFFF", "\xF4\x90\x80\x80", 0},
    {"lead F5", "\xF5\x80\x80\x80", 0},
    {"lead FF", "\xFF\xBF\xBF\xBF", 0},
    {"two bytes cut", "\xC3", 0},
    {"three bytes cut after one", "\xE2", 0},
    {"three bytes cut after two", "\xE2\x82", 0},
    {"four bytes cut after three", "\xF0\x9F\x98", 0},
    {"two bytes, second ASCII", "\xC3(", 0},
    {"two bytes, second a lead", "\xC3\xC3", 0},
    {"three bytes, third ASCII", "\xE2\x82(", 0},
    {"three bytes, third a lead", "\xE2\x82\xC2", 0},
    {"four bytes, third ASCII", "\xF0\x9F(\x80", 0},
    {"four bytes, fourth ASCII", "\xF0\x9F\x98(", 0},
};

TEST(Utf8, AnswersTheLengthOfTheSequence) {
    for (const Row& row : kRows) {
        SCOPED_TRACE(row.name);
        const char* begin = row.bytes.data();
        EXPECT_EQ(TALO::Utf8SequenceLength(begin, begin + row.bytes.size()), row.length);
    }
}

std::string Encoded(unsigned code) {
    const auto byte = [](unsigned value) { return static_cast<char>(value); };
    const auto next = [&](unsigned shift) { return byte(0x80 | (code >> shift & 0x3F)); };
    if (code < 0x80) {
        return {byte(code)};
    }
    if (code < 0x800) {
        return {byte(0xC0 | code >> 6), next(0)};
    }
    if (code < 0x10000) {
        return {byte(0xE0 | code >> 12), next(6), next(0)};
    }
    return {byte(0xF0 | code >> 18), next(12), next(6), next(0)};
}

TEST(Utf8, AcceptsEveryCodePointButTheSurrogates) {
    unsigned wrong = 0;
    for (unsigned code = 0; code < 0x110000; ++code) {
        const std::string bytes = Encoded(code);
        const bool surrogate = code >= 0xD800 && code <= 0xDFFF;
        const size_t wanted = surrogate ? 0 : bytes.size();
        if (TALO::Utf8SequenceLength(bytes.data(), bytes.data() + bytes.size()) != wanted) {
            ++wrong;
        }
    }
    EXPECT_EQ(wrong, 0u);
}

}  // namespace
