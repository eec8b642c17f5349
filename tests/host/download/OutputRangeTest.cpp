#include <gtest/gtest.h>

#include "tests/host/download/Exchange.h"
#include "tests/support/TempFolder.h"

namespace {

using exchange::AskForFile;
using exchange::AskForPath;
using exchange::Environment;
using exchange::Get;
using exchange::Pattern;
using exchange::Reply;

Environment Range(const std::string& value) {
    return Get({{"HTTP_RANGE", value}});
}

class OutputRange : public ::testing::Test {
  protected:
    // The boundary out of the header, checked to be one.
    static std::string Boundary(const Reply& reply) {
        const std::string start = "multipart/byteranges; boundary=";
        const std::string type = reply.Line("Content-Type");
        EXPECT_EQ(type.substr(0, start.size()), start);
        const std::string boundary = type.substr(std::min(start.size(), type.size()));
        EXPECT_GE(boundary.size(), 20u);
        EXPECT_LE(boundary.size(), 70u);
        return boundary;
    }

    support::TempFolder folder_;
    std::string content_ = Pattern(1000000);
    std::string path_ = folder_.Write("a", content_);
};

TEST_F(OutputRange, OfOnePieceIs206WithThatPiece) {
    struct Row {
        const char* range;
        size_t first;
        size_t length;
        const char* told;
    };
    for (const Row& row : {
             Row{"bytes=0-0", 0, 1, "bytes 0-0/1000000"},
             Row{"bytes=999999-", 999999, 1, "bytes 999999-999999/1000000"},
             Row{"bytes=-10", 999990, 10, "bytes 999990-999999/1000000"},
             Row{"bytes=100-699999", 100, 699900, "bytes 100-699999/1000000"},
             Row{"bytes=0-", 0, 1000000, "bytes 0-999999/1000000"},
             Row{"bytes=0-99,50-149", 0, 150, "bytes 0-149/1000000"},
         }) {
        for (const exchange::Output kind : {exchange::Output::Pipe, exchange::Output::Socket}) {
            const Reply reply = AskForPath(path_, Range(row.range), "text/plain", kind);
            EXPECT_EQ(reply.status, exchange::kSent) << row.range;
            EXPECT_EQ(reply.Line("Status"), "206 Partial Content") << row.range;
            EXPECT_EQ(reply.Line("Content-Type"), "text/plain") << row.range;
            EXPECT_EQ(reply.Line("Content-Range"), row.told) << row.range;
            EXPECT_EQ(reply.Line("Content-Length"), std::to_string(row.length)) << row.range;
            EXPECT_NE(reply.Line("ETag"), "(none)") << row.range;
            EXPECT_TRUE(reply.Body() == content_.substr(row.first, row.length)) << row.range;
        }
    }
}

TEST_F(OutputRange, OfSeveralPiecesIsMultipart) {
    const Reply reply = AskForPath(path_, Range("bytes=5-6,600000-899999,-1"));
    EXPECT_EQ(reply.status, exchange::kSent);
    EXPECT_EQ(reply.Line("Status"), "206 Partial Content");
    EXPECT_EQ(reply.Line("Content-Range"), "(none)");
    const std::string line = "\r\n--" + Boundary(reply);
    const std::string type = "\r\nContent-Type: text/plain\r\n";
    const std::string expected =
        line.substr(2) + type + "Content-Range: bytes 5-6/1000000\r\n\r\n" + content_.substr(5, 2) +
        line + type + "Content-Range: bytes 600000-899999/1000000\r\n\r\n" +
        content_.substr(600000, 300000) + line + type +
        "Content-Range: bytes 999999-999999/1000000\r\n\r\n" + content_.substr(999999) + line +
        "--\r\n";
    EXPECT_TRUE(reply.Body() == expected);
    EXPECT_EQ(reply.Line("Content-Length"), std::to_string(expected.size()));
}

TEST_F(OutputRange, HasANewBoundaryEveryTime) {
    const Environment range = Range("bytes=0-1,4-5");
    EXPECT_NE(Boundary(AskForPath(path_, range)), Boundary(AskForPath(path_, range)));
}

TEST_F(OutputRange, BehindTheEndIs416WithTheSize) {
    const Reply reply = AskForPath(path_, Range("bytes=1000000-"));
    EXPECT_EQ(reply.status, exchange::kSent);
    EXPECT_EQ(reply.Line("Status"), "416 Range Not Satisfiable");
    EXPECT_EQ(reply.Line("Content-Range"), "bytes */1000000");
    EXPECT_EQ(reply.Line("Content-Length"), "0");
    EXPECT_EQ(reply.Body(), "");
    const std::string empty = folder_.Write("empty", "");
    EXPECT_EQ(AskForPath(empty, Range("bytes=0-")).Line("Content-Range"), "bytes */0");
    EXPECT_EQ(AskForPath(empty, Range("bytes=-5")).Line("Status"), "(none)");
}

TEST_F(OutputRange, ThatIsWrongOrTooMuchIsTheWhole) {
    std::string many = "bytes=0-0";
    for (int index = 1; index <= 64; ++index) {
        many += "," + std::to_string(index * 2) + "-" + std::to_string(index * 2);
    }
    for (const std::string& range : {std::string("bytes=x"), std::string("lines=0-1"), many}) {
        const Reply reply = AskForPath(path_, Range(range));
        EXPECT_EQ(reply.Line("Status"), "(none)") << range;
        EXPECT_TRUE(reply.Body() == content_) << range;
    }
}

TEST_F(OutputRange, NeverSendsAByteTwice) {
    std::string all = "bytes=0-";
    for (int index = 1; index < 64; ++index) {
        all += ",0-";
    }
    const Reply reply = AskForPath(path_, Range(all));
    EXPECT_EQ(reply.Line("Content-Range"), "bytes 0-999999/1000000");
    EXPECT_EQ(reply.Body().size(), content_.size());
}

TEST_F(OutputRange, CountsFromWhereTheFileStands) {
    const Reply reply = AskForFile(path_, 400000, Range("bytes=0-1,-2"));
    EXPECT_NE(reply.Body().find("Content-Range: bytes 0-1/600000\r\n\r\n" +
                                content_.substr(400000, 2) + "\r\n"),
              std::string::npos);
    EXPECT_NE(reply.Body().find("Content-Range: bytes 599998-599999/600000\r\n\r\n" +
                                content_.substr(999998) + "\r\n"),
              std::string::npos);
    EXPECT_EQ(AskForFile(path_, 400000, Range("bytes=600000-")).Line("Content-Range"),
              "bytes */600000");
}

TEST_F(OutputRange, KeepsTheDownloadName) {
    const std::string name = "attachment; filename=\"n.txt\"";
    for (const char* range : {"bytes=0-1", "bytes=0-1,4-5"}) {
        EXPECT_EQ(AskForFile(path_, 0, Range(range), "n.txt").Line("Content-Disposition"), name);
    }
}

TEST_F(OutputRange, MeansNothingToHead) {
    const Reply reply =
        AskForPath(path_, {{"REQUEST_METHOD", "HEAD"}, {"HTTP_RANGE", "bytes=0-1"}});
    EXPECT_EQ(reply.Line("Status"), "(none)");
    EXPECT_EQ(reply.Line("Content-Length"), "1000000");
    EXPECT_EQ(reply.Body(), "");
}

}  // namespace
