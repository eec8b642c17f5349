#include <gtest/gtest.h>

#include <string>

#include "tests/host/upload/Transcript.h"

namespace {

using host::MultipartLimits;
using Result = host::MultipartParser::Result;

Result ReadWith(const MultipartLimits& limits, const std::string& body) {
    const Result whole = ReadInPieces("B", body, body.size(), false, limits).result;
    EXPECT_EQ(ReadInPieces("B", body, 1, false, limits).result, whole);
    return whole;
}

std::string Parts(int count) {
    std::string body;
    for (int part = 0; part < count; ++part) {
        body += "--B\r\n\r\nx\r\n";
    }
    return body + "--B--";
}

TEST(MultipartLimits, HoldForThePartsTogether) {
    MultipartLimits limits;
    limits.parts = 3;
    EXPECT_EQ(ReadWith(limits, Parts(3)), Result::kEnd);
    EXPECT_EQ(ReadWith(limits, Parts(4)), Result::kLimit);
}

TEST(MultipartLimits, HoldForTheHeaderLinesOfAPart) {
    MultipartLimits limits;
    limits.headerBytes = 20;
    const auto with = [](size_t bytes) {
        return "--B\r\nN:" + std::string(bytes - 4, 'v') + "\r\n\r\nx\r\n--B--";
    };
    EXPECT_EQ(ReadWith(limits, with(20)), Result::kEnd);
    EXPECT_EQ(ReadWith(limits, with(21)), Result::kLimit);
    EXPECT_EQ(ReadWith(limits, "--B\r\n" + std::string(100, 'v')), Result::kLimit);
}

TEST(MultipartLimits, HoldForTheTextBeforeTheFirstBoundary) {
    MultipartLimits limits;
    limits.preambleBytes = 20;
    const auto with = [](size_t bytes) { return std::string(bytes, 'p') + "\r\n--B--"; };
    EXPECT_EQ(ReadWith(limits, with(20)), Result::kEnd);
    EXPECT_EQ(ReadWith(limits, with(21)), Result::kLimit);
    EXPECT_EQ(ReadWith(limits, std::string(100, '\r')), Result::kLimit);
}

TEST(MultipartLimits, HoldForTheBlanksBehindABoundary) {
    const auto with = [](size_t blanks) {
        return "--B" + std::string(blanks, ' ') + "\r\n\r\nx\r\n--B--";
    };
    EXPECT_EQ(ReadWith(MultipartLimits(), with(host::kMaxBoundaryPadding)), Result::kEnd);
    EXPECT_EQ(ReadWith(MultipartLimits(), with(host::kMaxBoundaryPadding + 1)), Result::kLimit);
}

TEST(MultipartLimits, HoldForTheWholeBody) {
    MultipartLimits limits;
    const std::string body = Parts(2);
    limits.totalBytes = body.size();
    EXPECT_EQ(ReadWith(limits, body), Result::kEnd);
    limits.totalBytes = body.size() - 1;
    EXPECT_EQ(ReadWith(limits, body), Result::kLimit);
}

struct Hostile {
    const char* what;
    std::string unit;
    size_t count;
    const char* boundary;
};

// Not a matter of seconds: a search that is not linear takes hours for these.
TEST(MultipartParser, IsLinearWhateverTheBody) {
    const std::string near = "\r\n--" + std::string(69, 'b');
    const std::string boundary = std::string(70, 'b');
    const std::string dashes(70, '-');
    const Hostile rows[] = {
        {"CR LF pairs", "\r\n", 1000000, "B"},
        {"nothing but CR", "\r", 1000000, "B"},
        {"nothing but dashes", "-", 1000000, dashes.c_str()},
        {"CR, then dashes", "\r\n" + std::string(71, '-'), 50000, dashes.c_str()},
        {"almost the boundary", near, 50000, boundary.c_str()},
        {"the boundary and a letter", "\r\n--" + boundary + "x", 50000, boundary.c_str()},
        {"begun lines", "\r\n--", 1000000, boundary.c_str()},
    };
    for (const Hostile& row : rows) {
        std::string data;
        for (size_t unit = 0; unit < row.count; ++unit) {
            data += row.unit;
        }
        // A dash would make a boundary line of the last look-alike.
        data += "x";
        const std::string line = std::string("--") + row.boundary;
        const std::string body = line + "\r\n\r\nx" + data + "\r\n" + line + "--";
        for (const size_t piece : {size_t{1}, size_t{4096}, size_t{262144}}) {
            const Told told = ReadInPieces(row.boundary, body, piece);
            EXPECT_EQ(told.result, Result::kEnd) << row.what << " " << piece;
            EXPECT_TRUE(told.text == "{}x" + data + ";") << row.what << " " << piece;
        }
    }
}

}  // namespace
