#include "hosts/linux/download/HttpDate.h"

#include <gtest/gtest.h>
#include <locale.h>

namespace {

constexpr time_t kExample = 784111777;  // 6 November 1994, 08:49:37
constexpr time_t k2024 = 1709164800;    // 29 February 2024
constexpr time_t kUntouched = 4711;

time_t Read(const std::string& text, time_t now = k2024) {
    time_t when = kUntouched;
    const bool good = host::ParseHttpDate(text, now, &when);
    EXPECT_TRUE(good || when == kUntouched) << text;
    return when;
}

TEST(HttpDate, IsWrittenInOneForm) {
    EXPECT_EQ(host::HttpDate(kExample), "Sun, 06 Nov 1994 08:49:37 GMT");
    EXPECT_EQ(host::HttpDate(0), "Thu, 01 Jan 1970 00:00:00 GMT");
    EXPECT_EQ(host::HttpDate(-1), "Wed, 31 Dec 1969 23:59:59 GMT");
    EXPECT_EQ(host::HttpDate(k2024), "Thu, 29 Feb 2024 00:00:00 GMT");
    EXPECT_EQ(host::HttpDate(253402300799), "Fri, 31 Dec 9999 23:59:59 GMT");
}

TEST(HttpDate, IsEmptyForAYearWithoutFourDigits) {
    EXPECT_EQ(host::HttpDate(253402300800), "");
    EXPECT_EQ(host::HttpDate(-62135596800 - 86400), "");
    EXPECT_EQ(host::HttpDate(9223372036854775807), "");
}

TEST(HttpDate, IsReadInItsThreeForms) {
    EXPECT_EQ(Read("Sun, 06 Nov 1994 08:49:37 GMT"), kExample);
    EXPECT_EQ(Read("Sunday, 06-Nov-94 08:49:37 GMT"), kExample);
    EXPECT_EQ(Read("Sun Nov  6 08:49:37 1994"), kExample);
    EXPECT_EQ(Read("Sat Nov 26 08:49:37 1994"), kExample + 20 * 86400);
    EXPECT_EQ(Read("Thu, 29 Feb 2024 00:00:00 GMT"), k2024);
    EXPECT_EQ(Read("Sat, 31 Dec 2016 23:59:60 GMT"), 1483228800);
}

// 2024 is now.
TEST(HttpDate, OfAYearOfTwoDigitsLiesAtMost50YearsAhead) {
    struct Row {
        const char* year;
        const char* full;
    };
    for (const Row& row : {Row{"24", "2024"}, Row{"00", "2000"}, Row{"74", "2074"},
                           Row{"75", "1975"}, Row{"99", "1999"}}) {
        EXPECT_EQ(host::HttpDate(Read(std::string("Sunday, 01-Jun-") + row.year + " 00:00:00 GMT"))
                      .substr(12, 4),
                  row.full);
    }
    const time_t in2090 = 3786912000;
    EXPECT_EQ(host::HttpDate(Read("Sunday, 01-Jun-10 00:00:00 GMT", in2090)).substr(12, 4), "2110");
}

TEST(HttpDate, IsRefusedInAnyOtherForm) {
    for (const std::string& text : {std::string(),
                                    std::string("0"),
                                    std::string("784111777"),
                                    std::string("1994-11-06T08:49:37Z"),
                                    std::string("Sun, 06 Nov 1994 08:49:37"),
                                    std::string("Sun, 06 Nov 1994 08:49:37 UTC"),
                                    std::string("Sun, 06 Nov 1994 08:49:37 GMT "),
                                    std::string(" Sun, 06 Nov 1994 08:49:37 GMT"),
                                    std::string("Sun, 6 Nov 1994 08:49:37 GMT"),
                                    std::string("sun, 06 Nov 1994 08:49:37 GMT"),
                                    std::string("Sun, 06 Nov 94 08:49:37 GMT"),
                                    std::string("Sun, 00 Nov 1994 08:49:37 GMT"),
                                    std::string("Sun, 31 Nov 1994 08:49:37 GMT"),
                                    std::string("Wed, 29 Feb 2023 00:00:00 GMT"),
                                    std::string("Sun, 06 Nov 1994 24:00:00 GMT"),
                                    std::string("Sun, 06 Nov 1994 08:60:00 GMT"),
                                    std::string("Sun, 06 Nov 1994 08:49:61 GMT"),
                                    std::string("Sun, 06 Nov 1994 -8:49:37 GMT"),
                                    std::string("Sun, 06 Noo 1994 08:49:37 GMT"),
                                    std::string("Sun, 06-Nov-94 08:49:37 GMT"),
                                    std::string("Sun Nov 6 08:49:37 1994"),
                                    std::string("Sun Nov 06 08:49:37 1994 GMT"),
                                    std::string("Sun, 06 Nov"),
                                    std::string("Sun, 06 Nov 1994 08:49:37 GMT\0", 30),
                                    std::string(100000, 'S')}) {
        EXPECT_EQ(Read(text), kUntouched) << text.substr(0, 60);
    }
}

}  // namespace
