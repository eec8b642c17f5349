#include "hosts/linux/download/Disposition.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <vector>

namespace {

struct Row {
    const char* what;
    std::string name;
    std::string parameters;
};

TEST(Disposition, NamesTheAttachment) {
    const std::vector<Row> rows = {
        {"plain", "report.pdf", R"(filename="report.pdf")"},
        {"blanks", "my report .pdf", R"(filename="my report .pdf")"},
        {"marks", "a;b=c,d'e(f).txt", R"(filename="a;b=c,d'e(f).txt")"},
        {"quotes", R"(a"b".txt)", R"(filename="a_b_.txt"; filename*=UTF-8''a%22b%22.txt)"},
        {"backslash", R"(a\b.txt)", R"(filename="a_b.txt"; filename*=UTF-8''a%5Cb.txt)"},
        {"percent", "100%41.txt", R"(filename="100_41.txt"; filename*=UTF-8''100%2541.txt)"},
        {"umlaut", "\xC3\xBC.txt", R"(filename="_.txt"; filename*=UTF-8''%C3%BC.txt)"},
        {"three bytes", "\xE2\x82\xAC.txt", R"(filename="_.txt"; filename*=UTF-8''%E2%82%AC.txt)"},
        {"four bytes", "\xF0\x9F\x98\x80", R"(filename="_"; filename*=UTF-8''%F0%9F%98%80)"},
        {"marks beside what is not plain", "\xC3\xBC '()*;=.txt",
         R"(filename="_ '()*;=.txt"; filename*=UTF-8''%C3%BC%20%27%28%29%2A%3B%3D.txt)"},
        {"line end", "a\r\nSet-Cookie: x=y", R"(filename="a__Set-Cookie: x=y")"},
        {"tab and delete", "a\tb\x7F", R"(filename="a_b_")"},
        {"control character of two bytes", "a\xC2\x85z", R"(filename="a_z")"},
        {"NUL", std::string("a\0b", 3), R"(filename="a_b")"},
        {"latin", "\xFC.txt", R"(filename="_.txt")"},
        {"overlong slash", "a\xC0\xAF.txt", R"(filename="a__.txt")"},
        {"surrogate", "\xED\xA0\x80", R"(filename="___")"},
        {"cut off", "a\xE2\x82", R"(filename="a__")"},
        {"above the last character", "\xF4\x90\x80\x80", R"(filename="____")"},
        {"path", "/volume1/secret/a.txt", R"(filename="a.txt")"},
        {"path upwards", "../../a.txt", R"(filename="a.txt")"},
        {"folder", "a/b/", R"(filename="download")"},
        {"this folder", "a/.", R"(filename="download")"},
        {"folder above", "..", R"(filename="download")"},
        {"nothing", "", R"(filename="download")"},
        {"hidden", ".profile", R"(filename=".profile")"},
    };
    for (const Row& row : rows) {
        EXPECT_EQ(host::AttachmentNamed(row.name), "attachment; " + row.parameters) << row.what;
    }
}

TEST(Disposition, IsOneLineWhateverByteTheNameHas) {
    for (int byte = 0; byte < 256; ++byte) {
        const std::string value =
            host::AttachmentNamed(std::string("a") + static_cast<char>(byte) + "b");
        for (const char part : value) {
            EXPECT_TRUE(part >= ' ' && part <= '~') << byte;
        }
        EXPECT_EQ(std::count(value.begin(), value.end(), '"'), 2) << byte;
    }
}

TEST(Disposition, CutsALongNameBetweenCharacters) {
    std::string name;
    std::string full;
    for (int index = 0; index < 1000; ++index) {
        name += "\xE2\x82\xAC";
        full += index < 341 ? "%E2%82%AC" : "";
    }
    EXPECT_EQ(host::AttachmentNamed(name),
              "attachment; filename=\"" + std::string(341, '_') + "\"; filename*=UTF-8''" + full);
}

}  // namespace
