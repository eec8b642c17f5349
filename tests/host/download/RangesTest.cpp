#include "hosts/linux/download/Ranges.h"

#include <gtest/gtest.h>

namespace {

using host::ByteRange;
using host::RangeAnswer;

// "whole", "none", or the pieces as first-last.
std::string Read(const std::string& header, uint64_t size) {
    std::vector<ByteRange> parts = {{7, 7}};
    switch (host::ReadRanges(header, size, &parts)) {
        case RangeAnswer::Whole:
            return parts.size() == 1 && parts[0].first == 7 ? "whole" : "whole, but changed";
        case RangeAnswer::Unsatisfiable:
            return parts.size() == 1 && parts[0].first == 7 ? "none" : "none, but changed";
        case RangeAnswer::Parts:
            break;
    }
    std::string text;
    for (const ByteRange& part : parts) {
        text += (text.empty() ? "" : " ") + std::to_string(part.first) + "-" +
                std::to_string(part.first + part.length - 1);
    }
    return text;
}

struct Row {
    const char* what;
    std::string header;
    std::string answer;
};

void ExpectRows(uint64_t size, const std::vector<Row>& rows) {
    for (const Row& row : rows) {
        EXPECT_EQ(Read(row.header, size), row.answer) << row.what;
    }
}

TEST(Ranges, AreReadOfAThousandBytes) {
    ExpectRows(1000, {
                         {"the first byte", "bytes=0-0", "0-0"},
                         {"the last byte", "bytes=999-999", "999-999"},
                         {"the whole", "bytes=0-999", "0-999"},
                         {"in the middle", "bytes=500-599", "500-599"},
                         {"to the end", "bytes=500-", "500-999"},
                         {"beyond the end", "bytes=500-5000", "500-999"},
                         {"the last bytes", "bytes=-300", "700-999"},
                         {"more last bytes than there are", "bytes=-5000", "0-999"},
                         {"unit in capitals", "BYTES=1-2", "1-2"},
                         {"leading zeros", "bytes=0001-0002", "1-2"},
                         {"a number beyond 64 bits", "bytes=1-99999999999999999999999", "1-999"},
                         {"the largest number", "bytes=1-18446744073709551615", "1-999"},
                         {"several", "bytes=0-1,4-5,-2", "0-1 4-5 998-999"},
                         {"several, as they were asked for", "bytes=500-501,-1,0-1",
                          "500-501 999-999 0-1"},
                         {"blanks and empty members", "bytes= ,0-1 ,\t, 4-5 , ", "0-1 4-5"},
                         {"one of them behind the end", "bytes=5000-,3-4", "3-4"},
                     });
}

TEST(Ranges, AreNoneWhenAllOfThemLieBehindTheEnd) {
    ExpectRows(1000, {
                         {"at the end", "bytes=1000-", "none"},
                         {"behind it", "bytes=1000-2000", "none"},
                         {"far behind it", "bytes=99999999999999999999999-", "none"},
                         {"no last bytes", "bytes=-0", "none"},
                         {"several", "bytes=1000-,2000-3000,-0", "none"},
                     });
    ExpectRows(0, {
                      {"the first byte of nothing", "bytes=0-0", "none"},
                      {"all of nothing", "bytes=0-", "none"},
                      {"no last bytes of nothing", "bytes=-0", "none"},
                  });
}

TEST(Ranges, AreTheWholeForAHeaderThatIsWrongAnywhere) {
    for (const std::string& header : {std::string(),
                                      std::string("bytes"),
                                      std::string("bytes="),
                                      std::string("bytes=,"),
                                      std::string("bytes= , ,"),
                                      std::string("bytes=-"),
                                      std::string("bytes=--1"),
                                      std::string("bytes=5"),
                                      std::string("bytes=5-4"),
                                      std::string("bytes=a-b"),
                                      std::string("bytes=1-b"),
                                      std::string("bytes=1-2-3"),
                                      std::string("bytes=+1-2"),
                                      std::string("bytes=0x1-2"),
                                      std::string("bytes=1 - 2"),
                                      std::string("bytes=1-2;3-4"),
                                      std::string("bytes =1-2"),
                                      std::string(" bytes=1-2"),
                                      std::string("lines=1-2"),
                                      std::string("bytes=0-1,x"),
                                      std::string("bytes=x,0-1"),
                                      std::string("bytes=5000-,4-3"),
                                      std::string("bytes=1-2\0,3-4", 14),
                                      std::string("bytes=\xEF\xBC\x91-2")}) {
        EXPECT_EQ(Read(header, 1000), "whole") << header;
    }
}

TEST(Ranges, OfTheLastBytesOfNothingAreTheWhole) {
    EXPECT_EQ(Read("bytes=-5", 0), "whole");
    EXPECT_EQ(Read("bytes=-00010", 0), "whole");
    EXPECT_EQ(Read("bytes=0-,-5", 0), "whole");
}

TEST(Ranges, BecomeOneWhereTheyOverlapOrTouch) {
    ExpectRows(1000, {
                         {"the same twice", "bytes=3-4,3-4", "3-4"},
                         {"overlapping", "bytes=0-10,5-20", "0-20"},
                         {"touching", "bytes=0-10,11-20", "0-20"},
                         {"a byte apart", "bytes=0-10,12-20", "0-10 12-20"},
                         {"one within another", "bytes=0-100,5-6", "0-100"},
                         {"one around another", "bytes=5-6,0-100", "0-100"},
                         {"backwards", "bytes=11-20,0-10", "0-20"},
                         {"what closes a gap", "bytes=0-1,500-501,4-5,2-3", "0-5 500-501"},
                         {"what swallows all", "bytes=900-901,0-1,4-5,-1000", "0-999"},
                         {"in the place of the first", "bytes=800-801,5-6,900-901,3-7",
                          "800-801 3-7 900-901"},
                     });
}

TEST(Ranges, AreTheWholeWhenMoreThan64AreAskedFor) {
    const auto header = [](size_t count, const char* member) {
        std::string text = "bytes=";
        for (size_t index = 0; index < count; ++index) {
            text +=
                std::string(index == 0 ? "" : ",") +
                (member != nullptr ? member
                                   : std::to_string(index * 2) + "-" + std::to_string(index * 2));
        }
        return text;
    };
    std::vector<ByteRange> parts;
    EXPECT_EQ(host::ReadRanges(header(64, nullptr), 1000, &parts), RangeAnswer::Parts);
    EXPECT_EQ(parts.size(), 64u);
    EXPECT_EQ(Read(header(65, nullptr), 1000), "whole");
    EXPECT_EQ(Read(header(64, "0-"), 1000), "0-999");
    EXPECT_EQ(Read(header(65, "0-"), 1000), "whole");
    EXPECT_EQ(Read(header(65, "5000-"), 1000), "whole");
    EXPECT_EQ(Read(header(100000, "0-"), 1000), "whole");
}

TEST(Ranges, AreTheWholeForAHeaderOfMoreThan8KiB) {
    const std::string start = "bytes=0-1";
    EXPECT_EQ(Read(start + std::string(8192 - start.size(), ','), 1000), "0-1");
    EXPECT_EQ(Read(start + std::string(8193 - start.size(), ','), 1000), "whole");
}

TEST(Ranges, ReachTheEndOfTheLargestFile) {
    const uint64_t size = 9223372036854775807u;
    EXPECT_EQ(Read("bytes=-1", size), "9223372036854775806-9223372036854775806");
    EXPECT_EQ(Read("bytes=0-", size), "0-9223372036854775806");
    EXPECT_EQ(Read("bytes=9223372036854775807-", size), "none");
}

}  // namespace
