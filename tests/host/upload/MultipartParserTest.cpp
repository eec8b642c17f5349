#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "tests/host/upload/Transcript.h"

namespace {

using host::MultipartParser;
using Result = MultipartParser::Result;

struct Case {
    const char* what;
    std::string body;
    Result result;
    std::string told;
    const char* boundary = "B";
};

std::string Bytes(const char* text, size_t size) {
    return std::string(text, size);
}

// A part with that data between two boundary lines.
std::string Part(const std::string& data) {
    return "--B\r\nN: 1\r\n\r\n" + data + "\r\n--B--\r\n";
}

std::string Header(const std::string& lines) {
    return "--B\r\n" + lines + "\r\nx\r\n--B--";
}

std::vector<Case> Cases() {
    const Result kEnd = Result::kEnd;
    const Result kMalformed = Result::kMalformed;
    return {
        {"one part", Part("data"), kEnd, "{n=1,}data;"},
        {"two parts", "--B\r\nN: 1\r\n\r\na\r\n--B\r\nN: 2\r\n\r\nb\r\n--B--", kEnd,
         "{n=1,}a;{n=2,}b;"},
        {"no part", "--B--\r\n", kEnd, ""},
        {"no line end behind the last boundary", "--B\r\nN: 1\r\n\r\nx\r\n--B--", kEnd, "{n=1,}x;"},
        {"a part without header lines", "--B\r\n\r\nx\r\n--B--", kEnd, "{}x;"},
        {"an empty part", Part(""), kEnd, "{n=1,};"},
        {"an empty part, its blank line the boundary's", "--B\r\nN: 1\r\n\r\n--B--", kEnd,
         "{n=1,};"},
        {"empty parts in a row", "--B\r\n\r\n\r\n--B\r\n\r\n--B\r\n\r\n\r\n--B--", kEnd,
         "{};{};{};"},
        {"data of every kind", Part(Bytes("\0\x01\x80\xff\x7f", 5)), kEnd,
         Bytes("{n=1,}\0\x01\x80\xff\x7f;", 12)},

        {"text before the first boundary", "hello\r\nthere\r\n--B\r\n\r\nx\r\n--B--", kEnd, "{}x;"},
        {"an empty line before it", "\r\n--B\r\n\r\nx\r\n--B--", kEnd, "{}x;"},
        {"look-alikes before it", "--Bx\r\n--B-\r\n\r\n--B\r\n\r\nx\r\n--B--", kEnd, "{}x;"},
        {"text after the last boundary", Part("x") + "more\r\n--B\r\n\r\ny\r\n--B--", kEnd,
         "{n=1,}x;"},
        {"text right behind the last boundary", "--B\r\n\r\nx\r\n--B--more", kEnd, "{}x;"},
        {"a boundary within a line", "x--B\r\n\r\nx\r\n", kMalformed, ""},
        {"a boundary within a line, then the last one", "x--B\r\n\r\nx\r\n--B--", kEnd, ""},

        {"blanks behind the boundary", "--B \t \r\n\r\nx\r\n--B\t\r\n\r\ny\r\n--B-- \t\r\n", kEnd,
         "{}x;{}y;"},
        {"text behind such blanks", Part("a\r\n--B x"), kMalformed, "{n=1,}a"},
        {"dashes behind such blanks", "--B\r\n\r\nx\r\n--B --", kMalformed, "{}x"},
        {"CR without LF behind such blanks", Part("a\r\n--B \rx"), kMalformed, "{n=1,}a"},
        {"a bare LF behind such blanks", Part("a\r\n--B \nx"), kMalformed, "{n=1,}a"},

        {"a longer boundary is data", Part("a\r\n--Bx\r\nb"), kEnd, "{n=1,}a\r\n--Bx\r\nb;"},
        {"one dash behind it is data", Part("a\r\n--B-\r\nb"), kEnd, "{n=1,}a\r\n--B-\r\nb;"},
        {"CR without LF behind it is data", Part("a\r\n--B\rb"), kEnd, "{n=1,}a\r\n--B\rb;"},
        {"a bare LF behind it is data", Part("a\r\n--B\nb"), kEnd, "{n=1,}a\r\n--B\nb;"},
        {"two CR behind it, then a boundary", "--B\r\n\r\na\r\n--B\r\r\n--B--", kEnd,
         "{}a\r\n--B\r;"},
        {"a shorter one is data", Part("\r\n--\r\n-B\r\n--b"), kEnd, "{n=1,}\r\n--\r\n-B\r\n--b;"},
        {"a bare LF before it is data", Part("a\n--B\r\nb"), kEnd, "{n=1,}a\n--B\r\nb;"},
        {"a bare CR before it is data", Part("a\r--B\r\nb"), kEnd, "{n=1,}a\r--B\r\nb;"},
        {"CR before the line end is data", Part("a\r"), kEnd, "{n=1,}a\r;"},
        {"CR and line ends are data", Part("\r\r\n\r\n\n\r\r\n\r\n"), kEnd,
         "{n=1,}\r\r\n\r\n\n\r\r\n\r\n;"},
        {"begun boundaries in a row are data", Part("\r\n\r\n-\r\n--\r\n--A\r\n--B+"), kEnd,
         "{n=1,}\r\n\r\n-\r\n--\r\n--A\r\n--B+;"},
        {"a look-alike at once behind the header is data", Part("--Bx"), kEnd, "{n=1,}--Bx;"},
        {"a dash at once behind the header is data", Part("-"), kEnd, "{n=1,}-;"},
        {"a boundary of dashes", "-------\r\n\r\n------x\r\n------\r\n-\r\n---------", kEnd,
         "{}------x\r\n------\r\n-;", "-----"},
        {"two dashes more than a boundary of dashes", "-------\r\n\r\nx\r\n---------y", kEnd,
         "{}x;", "-----"},
        {"a boundary that another begins with", "--B\r\n\r\n--BB\r\n\r\nx\r\n--BB--\r\n\r\n--B--",
         kEnd, "{}--BB\r\n\r\nx\r\n--BB--\r\n;"},

        {"a folded header", Header("N: a\r\n  b\r\n\tc\r\n"), kEnd, "{n=a b c,}x;"},
        {"headers of one name", Header("N: a\r\nn:b\r\n"), kEnd, "{n=a,n=b,}x;"},
        {"blanks around a value", Header("N:\t a b \t\r\n"), kEnd, "{n=a b,}x;"},
        {"an empty value", Header("N:\r\n"), kEnd, "{n=,}x;"},
        {"a colon in a value", Header("N: a:b\r\n"), kEnd, "{n=a:b,}x;"},
        {"a header without a colon", Header("N\r\n"), kMalformed, ""},
        {"a header without a name", Header(": a\r\n"), kMalformed, ""},
        {"a blank before the colon", Header("N : a\r\n"), kMalformed, ""},
        {"a first header that is folded", Header(" N: a\r\n"), kMalformed, ""},
        {"a bare LF in the headers", Header("N: a\nM: b\r\n"), kMalformed, ""},
        {"a bare LF behind the headers", "--B\r\nN: a\n\nx\r\n--B--", kMalformed, ""},
        {"CR without LF in the headers", Header("N: a\rM: b\r\n"), kMalformed, ""},
        {"two CR in the headers", Header("N: a\r\r\n"), kMalformed, ""},
        {"NUL in the headers", Header(Bytes("N: a\0b\r\n", 8)), kMalformed, ""},
        {"a boundary among the headers", "--B\r\nN: 1\r\n--B--", kMalformed, ""},

        {"nothing", "", kMalformed, ""},
        {"no boundary", "some text\r\n", kMalformed, ""},
        {"bare LF throughout", "--B\nN: 1\n\nx\n--B--\n", kMalformed, ""},
        {"no last boundary", "--B\r\n\r\nx", kMalformed, "{}x"},
        {"half a last boundary", "--B\r\n\r\nx\r\n--", kMalformed, "{}x"},
        {"no dashes behind the last boundary", "--B\r\n\r\nx\r\n--B", kMalformed, "{}x"},
        {"one dash behind the last boundary", "--B\r\n\r\nx\r\n--B-", kMalformed, "{}x"},
        {"a boundary and no more", "--B\r\n\r\nx\r\n--B\r\n", kMalformed, "{}x;"},
        {"half a header", "--B\r\nN: 1\r\n", kMalformed, ""},
        {"another boundary", "--C\r\n\r\nx\r\n--C--", kMalformed, ""},
    };
}

void ExpectTold(const Case& row, const Told& told) {
    EXPECT_EQ(told.result, row.result);
    EXPECT_EQ(told.text, row.told);
}

TEST(MultipartParser, TellsTheSameOfABodyWholeAndInPieces) {
    for (const Case& row : Cases()) {
        for (const size_t piece : {row.body.size() + 1, size_t{1}, size_t{2}, size_t{3}, size_t{7},
                                   size_t{4096}, size_t{65536}}) {
            SCOPED_TRACE(std::string(row.what) + ", pieces of " + std::to_string(piece));
            ExpectTold(row, ReadInPieces(row.boundary, row.body, piece));
        }
    }
}

TEST(MultipartParser, GoesOnWhereTheSinkPaused) {
    for (const Case& row : Cases()) {
        for (const size_t piece : {row.body.size() + 1, size_t{1}, size_t{2}, size_t{7}}) {
            SCOPED_TRACE(std::string(row.what) + ", pieces of " + std::to_string(piece));
            ExpectTold(row, ReadInPieces(row.boundary, row.body, piece, true));
        }
    }
}

// The cases again, with the end of a block at every place of them.
TEST(MultipartParser, DoesNotMindWhereABlockEnds) {
    for (const Case& row : Cases()) {
        const size_t head = std::string("--B\r\nN: 1\r\n\r\n").size();
        // What stands at once behind a header may be a boundary, elsewhere not.
        if (row.told.compare(0, 6, "{n=1,}") != 0 || row.result != Result::kEnd ||
            row.body.compare(head, 2, "--") == 0) {
            continue;
        }
        for (size_t into = 0; into < row.body.size(); ++into) {
            const std::string filler(4096 - head - std::min(into, size_t{80}), 'f');
            std::string body = row.body;
            body.insert(head, filler);
            const Told told = ReadInPieces("B", body, 4096);
            ASSERT_EQ(told.result, Result::kEnd) << row.what;
            std::string expected = row.told;
            expected.insert(6, filler);
            ASSERT_EQ(told.text, expected) << row.what << " " << into;
        }
    }
}

TEST(MultipartParser, CountsWhatItRead) {
    const std::string body = Part("data") + "more";
    EXPECT_EQ(ReadInPieces("B", body, 3).offset, body.size());
    Transcript transcript;
    MultipartParser parser("B", host::MultipartLimits(), &transcript);
    size_t used = 0;
    EXPECT_EQ(parser.BoundaryEnd(), 0u);
    EXPECT_EQ(parser.Feed("--B\r\n", 5, &used), Result::kMore);
    EXPECT_EQ(parser.BoundaryEnd(), 5u);
    EXPECT_EQ(parser.Feed("\r\nx\r\n--B", 8, &used), Result::kMore);
    EXPECT_EQ(parser.BoundaryEnd(), 5u);
    EXPECT_EQ(parser.Feed("--\r\n", 4, &used), Result::kEnd);
    EXPECT_EQ(parser.BoundaryEnd(), 15u);
    EXPECT_EQ(parser.Offset(), 17u);
}

TEST(MultipartParser, AnswersAFailureAgain) {
    Transcript transcript;
    MultipartParser parser("B", host::MultipartLimits(), &transcript);
    size_t used = 0;
    EXPECT_EQ(parser.Feed("--B\r\nbad\r\n\r\n", 12, &used), Result::kMalformed);
    EXPECT_EQ(parser.Feed("\r\n--B--", 7, &used), Result::kMalformed);
    EXPECT_EQ(parser.Finish(), Result::kMalformed);
    EXPECT_EQ(transcript.text, "");
}

TEST(MultipartParser, StopsWhereTheSinkRefuses) {
    struct Refusing : Transcript {
        Answer OnData(const char* data, size_t size) override {
            (void)Transcript::OnData(data, size);
            return Answer::kRefuse;
        }
    } sink;
    MultipartParser parser("B", host::MultipartLimits(), &sink);
    const std::string body = Part("data");
    size_t used = 0;
    EXPECT_EQ(parser.Feed(body.data(), body.size(), &used), Result::kRefused);
    EXPECT_EQ(parser.Finish(), Result::kRefused);
    EXPECT_EQ(sink.text, "{n=1,}data");
}

TEST(MultipartParser, KnowsWhatABoundaryIs) {
    const struct {
        std::string text;
        bool is;
    } rows[] = {
        {"B", true},
        {std::string(70, 'b'), true},
        {std::string(71, 'b'), false},
        {"", false},
        {"azAZ09'()+_,-./:=?", true},
        {"a b", true},
        {"a ", false},
        {"a\r", false},
        {"a\n", false},
        {"a\"", false},
        {"a;", false},
        {"a\t", false},
        {"a*", false},
        {Bytes("a\0", 2), false},
        {"\xC3\xA9", false},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(MultipartParser::IsBoundary(row.text), row.is) << row.text;
        if (!row.is) {
            EXPECT_EQ(ReadInPieces(row.text, "--" + row.text + "--", 100).result,
                      Result::kMalformed);
        }
    }
}

}  // namespace
