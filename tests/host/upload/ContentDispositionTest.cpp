#include "hosts/linux/cgi/ContentDisposition.h"

#include <gtest/gtest.h>

#include <string>

#include "hosts/linux/cgi/ClientFileName.h"
#include "hosts/linux/cgi/HeaderParameters.h"

namespace {

using host::ContentDisposition;
using host::ParseContentDisposition;

TEST(ContentDisposition, TellsAFieldFromAFile) {
    const struct {
        const char* text;
        const char* name;
        bool isFile;
        const char* fileName;
    } rows[] = {
        {R"(form-data; name="a")", "a", false, ""},
        {"form-data; name=a", "a", false, ""},
        {R"(FORM-DATA;NAME="a")", "a", false, ""},
        {R"(form-data ; name="a" ; )", "a", false, ""},
        {R"(form-data; name="a b;c=d")", "a b;c=d", false, ""},
        {R"(form-data; name="quo\"te")", "quo\"te", false, ""},
        {R"(form-data; name="back\\slash")", "back\\slash", false, ""},
        {"form-data; name=\"\xC3\xA9\"", "\xC3\xA9", false, ""},
        {R"(form-data; name="a"; size=3)", "a", false, ""},
        {R"(form-data; name="a"; filename="b.txt")", "a", true, "b.txt"},
        {R"(form-data; filename="b.txt"; name="a")", "a", true, "b.txt"},
        {R"(form-data; name="a"; filename=b.txt)", "a", true, "b.txt"},
        {R"(form-data; name="a"; filename="")", "a", true, ""},
        {R"(form-data; name="a"; filename="say \"hi\".txt")", "a", true, "say \"hi\".txt"},
        {R"(form-data; name="a"; filename="C:\dir\b.txt")", "a", true, "b.txt"},
        {R"(form-data; name="a"; filename="%22b%22.txt")", "a", true, "%22b%22.txt"},
        {"form-data; name=\"a\"; filename=\"\xE2\x82\xAC.txt\"", "a", true, "\xE2\x82\xAC.txt"},
        {"form-data; name=\"a\"; filename=\"plain\"; filename*=UTF-8''%e2%82%ac.txt", "a", true,
         "\xE2\x82\xAC.txt"},
        {"form-data; name=\"a\"; filename*=utf-8'en'b%20c.txt", "a", true, "b c.txt"},
        {"form-data; name=\"a\"; filename*=UTF-8''..%2f..%2Fetc%2fpasswd", "a", true, "passwd"},
        {"form-data; name=\"a\"; filename=\"plain\"; filename*=ISO-8859-1''%e9", "a", true,
         "plain"},
    };
    for (const auto& row : rows) {
        ContentDisposition part;
        EXPECT_TRUE(ParseContentDisposition(row.text, &part)) << row.text;
        EXPECT_EQ(part.name, row.name) << row.text;
        EXPECT_EQ(part.isFile, row.isFile) << row.text;
        EXPECT_EQ(part.fileName, row.fileName) << row.text;
    }
}

TEST(ContentDisposition, RefusesWhatIsNoPartOfAForm) {
    const std::string rows[] = {
        "",
        "form-data",
        "form-data; filename=\"b\"",
        "form-data; name=\"\"",
        "attachment; name=\"a\"",
        "form-data; name=\"a",
        "form-data; name=\"a\\\"",
        "form-data; name=a b",
        "form-data; name=",
        "form-data; =a",
        "form-data name=\"a\"",
        "form-data; name=\"a\"; name=\"b\"",
        "form-data; name=\"a\"; filename=\"b\"; filename=\"c\"",
        "form-data; name=\"a\"x",
        "form-data; name=\"a\xFF\"",
        "form-data; name=\"a\x01\"",
        "form-data; name=\"a\x7F\"",
        "form-data; name=\"a\"; filename=\"..\"",
        "form-data; name=\"a\"; filename=\".\"",
        "form-data; name=\"a\"; filename=\"dir/\"",
        "form-data; name=\"a\"; filename=\"b\xFF\"",
        "form-data; name=\"a\"; filename=\"b\tc\"",
        "form-data; name=\"a\"; filename*=UTF-8''b%00c",
        "form-data; name=\"a\"; filename*=UTF-8''b%0d%0ac",
        "form-data; name=\"a\"; filename*=UTF-8''%ff",
        "form-data; name=\"a\"; filename*=UTF-8''%4",
        "form-data; name=\"a\"; filename*=UTF-8''%zz",
        "form-data; name=\"a\"; filename*=UTF-8'b",
        "form-data; name=\"a\"; filename*=b",
        "form-data; name=\"a\"; filename*=ISO-8859-1''%e9",
        "form-data; name=\"a\"; filename*0=\"b\"; filename*1=\"c\"",
        "form-data; name=\"a\"; filename*0*=UTF-8''b",
    };
    for (const std::string& row : rows) {
        ContentDisposition part;
        part.name = "untouched";
        EXPECT_FALSE(ParseContentDisposition(row, &part)) << row;
        EXPECT_EQ(part.name, "untouched") << row;
    }
}

TEST(ClientFileName, IsTheLastComponent) {
    const struct {
        std::string raw;
        const char* name;  // null: refused
    } rows[] = {
        {"a.txt", "a.txt"},
        {"/etc/passwd", "passwd"},
        {"../../etc/passwd", "passwd"},
        {"..\\..\\boot.ini", "boot.ini"},
        {"C:\\dir/mixed\\name", "name"},
        {"...", "..."},
        {".hidden", ".hidden"},
        {" ", " "},
        {"a\xC2\xA0", "a\xC2\xA0"},
        {"\xF0\x9F\x98\x80", "\xF0\x9F\x98\x80"},
        {std::string(255, 'n'), nullptr},
        {"", nullptr},
        {"/", nullptr},
        {"a/", nullptr},
        {"a\\", nullptr},
        {".", nullptr},
        {"..", nullptr},
        {"a/..", nullptr},
        {"a\\..", nullptr},
        {std::string("a\0b", 3), nullptr},
        {std::string("a\0/b", 4), nullptr},
        {"a\nb", nullptr},
        {"a\r\nb", nullptr},
        {"a\x1B", nullptr},
        {"a\x7F", nullptr},
        {"a\xC2\x85", nullptr},
        {"bad\xFF/b", nullptr},
        {"\xC0\xAF", nullptr},
        {"\xE0\x80\xAF", nullptr},
        {"\xED\xA0\x80", nullptr},
        {"\xF4\x90\x80\x80", nullptr},
        {"\xE2\x82", nullptr},
        {"\x80", nullptr},
        {std::string(256, 'n'), nullptr},
    };
    for (const auto& row : rows) {
        std::string name = "untouched";
        if (row.raw.size() == 255) {
            EXPECT_TRUE(host::ClientFileName(row.raw, &name));
            EXPECT_EQ(name, row.raw);
            continue;
        }
        EXPECT_EQ(host::ClientFileName(row.raw, &name), row.name != nullptr) << row.raw;
        EXPECT_EQ(name, row.name != nullptr ? row.name : "untouched") << row.raw;
    }
}

TEST(HeaderParameters, AreReadFromAContentType) {
    const struct {
        const char* text;
        const char* value;  // null: refused
        const char* boundary;
    } rows[] = {
        {"multipart/form-data; boundary=B", "multipart/form-data", "B"},
        {"Multipart/Form-Data;Boundary=\"a b\"", "multipart/form-data", "a b"},
        {"multipart/form-data; charset=utf-8; boundary=----x", "multipart/form-data", "----x"},
        {"multipart/form-data", "multipart/form-data", ""},
        {"multipart/form-data; boundary=\"B", nullptr, ""},
        {"multipart/form-data; boundary=B; boundary=C", nullptr, ""},
        {"multipart/form-data, boundary=B", nullptr, ""},
        {"", nullptr, ""},
    };
    for (const auto& row : rows) {
        host::ParametrizedValue parsed;
        EXPECT_EQ(host::ParseParametrizedValue(row.text, &parsed), row.value != nullptr)
            << row.text;
        EXPECT_EQ(parsed.value, row.value != nullptr ? row.value : "") << row.text;
        EXPECT_EQ(parsed.parameters["boundary"], row.boundary) << row.text;
    }
}

}  // namespace
