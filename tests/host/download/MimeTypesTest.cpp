#include "hosts/linux/download/MimeTypes.h"

#include <gtest/gtest.h>

#include "platform/HTTPFileOutputer.h"
#include "tests/support/TempFolder.h"

namespace {

class MimeTypes : public ::testing::Test {
  protected:
    void Table(const std::string& content) {
        table_ = folder_.Write("mime.types", content);
    }
    std::string Of(const std::string& name) const {
        return host::MimeTypeOf(name, table_.c_str());
    }

    support::TempFolder folder_;
    std::string table_ = folder_.Path("absent");
};

TEST_F(MimeTypes, ComeFromTheTable) {
    Table(
        "# a comment about txt\n"
        "\n"
        "text/plain\t\t\ttxt asc\n"
        "application/alone\n"
        "  image/x-one  one   ONE-MORE \r\n"
        "audio/last last");
    struct Row {
        const char* name;
        const char* type;
    };
    for (const Row& row : {
             Row{"a.txt", "text/plain"},
             Row{"a.asc", "text/plain"},
             Row{"A.TXT", "text/plain"},
             Row{"a.b.txt", "text/plain"},
             Row{"/folder.one/a.txt", "text/plain"},
             Row{"a.one", "image/x-one"},
             Row{"a.one-more", "image/x-one"},
             Row{"a.last", "audio/last"},
             Row{"..txt", "text/plain"},
             Row{"a.tx", "application/octet-stream"},
             Row{"a.txtt", "application/octet-stream"},
             Row{"a.comment", "application/octet-stream"},
             Row{"a.application/alone", "application/octet-stream"},
             Row{"a.t*t", "application/octet-stream"},
             Row{"a.txt ", "application/octet-stream"},
             Row{"a.tx\xD4", "application/octet-stream"},
         }) {
        EXPECT_EQ(Of(row.name), row.type) << row.name;
    }
}

TEST_F(MimeTypes, AreUnknownWithoutAnExtension) {
    Table("text/plain txt profile\n");
    for (const char* name : {"", "txt", ".txt", "/folder.txt/file", "/folder/.profile", "a.", ".",
                             "..", "/", "a.txt/"}) {
        EXPECT_EQ(Of(name), "application/octet-stream") << name;
    }
}

TEST_F(MimeTypes, OfALineThatIsWrongDoNotCount) {
    Table(
        "text zip\n"
        "#text/plain zip\n"
        "text/ zip\n"
        "/plain zip\n"
        "te\xFFxt/plain zip\n"
        "text/pl:ain zip\n"
        "text/plain/more zip\n");
    EXPECT_EQ(Of("a.zip"), "application/zip");  // the built-in one
}

TEST_F(MimeTypes, AreTheFirstLinesWhereTwoHaveAnExtension) {
    Table("text/first two\ntext/second two\n");
    EXPECT_EQ(Of("a.two"), "text/first");
}

TEST_F(MimeTypes, AreBuiltInForCommonExtensionsWithoutATable) {
    struct Row {
        const char* name;
        const char* type;
    };
    for (const Row& row : {
             Row{"a.txt", "text/plain"},
             Row{"a.HTML", "text/html"},
             Row{"a.jpg", "image/jpeg"},
             Row{"a.png", "image/png"},
             Row{"a.mp4", "video/mp4"},
             Row{"a.mp3", "audio/mpeg"},
             Row{"a.pdf", "application/pdf"},
             Row{"a.zip", "application/zip"},
             Row{"a.json", "application/json"},
             Row{"a.nothing", "application/octet-stream"},
         }) {
        EXPECT_EQ(Of(row.name), row.type) << row.name;
    }
    Table("text/x-mine txt\n");
    EXPECT_EQ(Of("a.txt"), "text/x-mine");
    EXPECT_EQ(Of("a.png"), "image/png");
}

TEST_F(MimeTypes, SurviveATableThatIsNone) {
    Table(std::string("text/x-nul\0 txt\n", 16));
    EXPECT_EQ(Of("a.txt"), "text/plain");
    Table(std::string(2u << 20, 'x'));
    EXPECT_EQ(Of("a.txt"), "text/plain");
    Table(std::string(1u << 19, '\n') + "text/x-late txt");
    EXPECT_EQ(Of("a.txt"), "text/x-late");
    table_ = "/";
    EXPECT_EQ(Of("a.txt"), "text/plain");
    EXPECT_EQ(Of("a." + std::string(100000, 'x')), "application/octet-stream");
}

TEST_F(MimeTypes, OfThePlatformComeFromTheSystem) {
    EXPECT_EQ(HTTPFileOutputer::GetMimeType("a.txt"), "text/plain");
    EXPECT_EQ(HTTPFileOutputer::GetMimeType("/x/A.JPG"), "image/jpeg");
    EXPECT_EQ(HTTPFileOutputer::GetMimeType("a.a2l"), "application/A2L");  // no common one
    EXPECT_EQ(HTTPFileOutputer::GetMimeType("a"), "application/octet-stream");
    EXPECT_EQ(HTTPFileOutputer::GetMimeType(nullptr), "application/octet-stream");
}

TEST(CheckedMimeType, IsTheTextOrTheAnyType) {
    for (const char* good :
         {"text/plain", "text/html; charset=\"UTF-8\"", "application/vnd.x+json;a=b", "x/y"}) {
        EXPECT_EQ(host::CheckedMimeType(good), good);
    }
    for (const char* bad :
         {"", "text", "/", "text/", "/plain", "text/plain\r\nX: y", "text/plain\n", "te xt/plain",
          "text/pl\xC3\xBC", "text/plain; a=\t", "text/a/b", "\"text\"/plain"}) {
        EXPECT_EQ(host::CheckedMimeType(bad), "application/octet-stream") << bad;
    }
    EXPECT_EQ(host::CheckedMimeType(nullptr), "application/octet-stream");
    const std::string longType = "text/" + std::string(1019, 'x');
    EXPECT_EQ(host::CheckedMimeType(longType.c_str()), longType);
    EXPECT_EQ(host::CheckedMimeType((longType + "x").c_str()), "application/octet-stream");
}

}  // namespace
