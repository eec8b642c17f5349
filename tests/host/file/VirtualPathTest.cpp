#include <gtest/gtest.h>

#include "hosts/linux/sdk/Places.h"

namespace {

const std::string kLongest(talo::kMaxComponentBytes, 'x');

// "/" and components of the greatest length, cut to `bytes`.
std::string LongPath(size_t bytes) {
    std::string path = "/s";
    while (path.size() + 1 + kLongest.size() < bytes) {
        path += "/" + kLongest;
    }
    path += "/";
    return path + std::string(bytes - path.size(), 'y');
}

TEST(VirtualPath, IsShareAndComponents) {
    talo::VirtualPath path;
    ASSERT_TRUE(talo::ParseVirtualPath("/photos/2024/a b.jpg", &path));
    EXPECT_EQ("photos", path.share);
    EXPECT_EQ((std::vector<std::string>{"2024", "a b.jpg"}), path.parts);
}

TEST(VirtualPath, IsAShareAlone) {
    talo::VirtualPath path;
    ASSERT_TRUE(talo::ParseVirtualPath("/photos", &path));
    EXPECT_EQ("photos", path.share);
    EXPECT_TRUE(path.parts.empty());
}

TEST(VirtualPath, IsThePlaceOfTheShares) {
    talo::VirtualPath path;
    ASSERT_TRUE(talo::ParseVirtualPath("/", &path));
    EXPECT_EQ("", path.share);
    EXPECT_TRUE(path.parts.empty());
}

TEST(VirtualPath, TakesWhatLooksLikeMoreThanAName) {
    for (const char* text :
         {"/s/...", "/s/..a", "/s/.hidden", "/s/a\\..\\b", "/s/~", "/s/*", "/s/%2e%2e", "/s/a\nb",
          "/s/ ", "/s/\xC3\xA4", "/s/\xF0\x9F\x98\x80", "/s/-rf"}) {
        talo::VirtualPath path;
        EXPECT_TRUE(talo::ParseVirtualPath(text, &path)) << text;
        EXPECT_EQ(1, path.parts.size()) << text;
    }
}

TEST(VirtualPath, IsRefused) {
    const struct {
        const char* name;
        std::string text;
    } rows[] = {
        {"empty", ""},
        {"relative", "s/a"},
        {"parent", "/s/.."},
        {"parent in the middle", "/s/../../etc/passwd"},
        {"parent for a share", "/.."},
        {"itself", "/s/./a"},
        {"itself for a share", "/."},
        {"empty component", "/s//a"},
        {"two slashes first", "//s"},
        {"slash at the end", "/s/a/"},
        {"slash behind a share", "/s/"},
        {"two slashes alone", "//"},
        {"NUL", std::string("/s/a\0b", 6)},
        {"NUL before a parent", std::string("/s/\0/..", 7)},
        {"component too long", "/s/" + kLongest + "x"},
        {"share too long", "/" + kLongest + "x"},
        {"byte that is no UTF-8", "/s/\xFF"},
        {"overlong slash", "/s/\xC0\xAF"},
        {"overlong dots", "/s/\xE0\x80\xAE\xE0\x80\xAE"},
        {"surrogate", "/s/\xED\xA0\x80"},
        {"cut off character", "/s/\xC3"},
        {"beyond Unicode", "/s/\xF4\x90\x80\x80"},
        {"name of an unfinished file", "/s/.talo-new-0123456789abcdef"},
        {"path too long", LongPath(talo::kMaxPathBytes + 1)},
    };
    for (const auto& row : rows) {
        talo::VirtualPath path;
        path.share = "untouched";
        EXPECT_FALSE(talo::ParseVirtualPath(row.text, &path)) << row.name;
        EXPECT_EQ("untouched", path.share) << row.name;
    }
}

TEST(VirtualPath, MayBeAsLongAsItsLimits) {
    talo::VirtualPath path;
    EXPECT_TRUE(talo::ParseVirtualPath("/" + kLongest + "/" + kLongest, &path));
    EXPECT_TRUE(talo::ParseVirtualPath(LongPath(talo::kMaxPathBytes), &path));
}

}  // namespace
