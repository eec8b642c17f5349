#include "hosts/linux/slice/Record.h"

#include <gtest/gtest.h>

#include <string>

namespace {

const char kGood[] = R"({"owner":"mia","length":12,"digest":"","target":"t","created":99})";

// The good record with a part of it replaced.
std::string With(const std::string& part, const std::string& other) {
    std::string text = kGood;
    const size_t place = text.find(part);
    EXPECT_NE(place, std::string::npos) << part;
    return text.replace(place, part.size(), other);
}

TEST(SliceRecord, ReadsWhatItWrote) {
    talo::SliceFile file;
    file.owner = "D\\mia";
    file.length = 9223372036854775807ull;
    file.digest = std::string(64, 'a');
    file.target = "\"\\\n\x01\xc3\xa4";
    file.created = 1700000000;
    talo::SliceFile read;
    ASSERT_TRUE(host::ParseSliceRecord(host::FormatSliceRecord(file), &read));
    EXPECT_EQ(read.owner, file.owner);
    EXPECT_EQ(read.length, file.length);
    EXPECT_EQ(read.digest, file.digest);
    EXPECT_EQ(read.target, file.target);
    EXPECT_EQ(read.created, file.created);
    EXPECT_FALSE(read.complete);
}

struct Row {
    const char* name;
    std::string text;
};

TEST(SliceRecord, IsNothingElse) {
    const Row rows[] = {
        {"nothing", ""},
        {"blanks", "   "},
        {"garbage", "\x7f\x45LF\x02\x01"},
        {"a NUL behind it", std::string(kGood) + '\0'},
        {"text behind it", std::string(kGood) + "x"},
        {"a comment", std::string(kGood) + "// x"},
        {"an array", "[1]"},
        {"null", "null"},
        {"an empty object", "{}"},
        {"depth", std::string(10000, '[')},
        {"no owner", With("\"owner\":\"mia\",", "")},
        {"an owner that is a number", With("\"mia\"", "1")},
        {"an owner that is null", With("\"mia\"", "null")},
        {"no length", With("\"length\":12,", "")},
        {"a length that is text", With(":12", ":\"12\"")},
        {"a negative length", With(":12", ":-1")},
        {"a length with a fraction", With(":12", ":1.5")},
        {"a length beyond a file's", With(":12", ":9223372036854775808")},
        {"a length beyond 64 bits", With(":12", ":18446744073709551616")},
        {"a huge length", With(":12", ":1e300")},
        {"a length of a thousand digits", With(":12", ":" + std::string(1000, '9'))},
        {"a length that is true", With(":12", ":true")},
        {"no digest", With("\"digest\":\"\",", "")},
        {"a digest that is none", With("\"digest\":\"\"", "\"digest\":\"abc\"")},
        {"no target", With("\"target\":\"t\",", "")},
        {"a target that is an object", With("\"t\"", "{}")},
        {"no time", With(",\"created\":99", "")},
        {"a negative time", With(":99", ":-99")},
    };
    for (const Row& row : rows) {
        talo::SliceFile file;
        file.owner = "untouched";
        EXPECT_FALSE(host::ParseSliceRecord(row.text, &file)) << row.name;
        EXPECT_EQ(file.owner, "untouched") << row.name;
    }
}

TEST(SliceRecord, IsNoneWhenItIsCutOff) {
    const std::string text = kGood;
    talo::SliceFile file;
    ASSERT_TRUE(host::ParseSliceRecord(text, &file));
    for (size_t size = 0; size < text.size(); ++size) {
        EXPECT_FALSE(host::ParseSliceRecord(text.substr(0, size), &file)) << size;
    }
}

}  // namespace
