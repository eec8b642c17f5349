#include "hosts/linux/util/JsonFile.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <string>

#include "platform/WebAPIUtil.h"
#include "tests/support/Json.h"
#include "tests/support/TempFolder.h"

using support::Parse;

namespace {

class JsonFile : public ::testing::Test {
  protected:
    void ExpectRead(const std::string& path, const char* expected) {
        Json::Value value;
        std::string reason;
        EXPECT_TRUE(host::ReadJsonFile(value, path.c_str(), &reason)) << path << ": " << reason;
        EXPECT_EQ(value, Parse(expected));
    }

    void ExpectRefused(const std::string& path, const std::string& why) {
        Json::Value value("untouched");
        std::string reason;
        EXPECT_FALSE(host::ReadJsonFile(value, path.c_str(), &reason)) << path;
        EXPECT_EQ(reason, why) << path;
        EXPECT_EQ(value, "untouched");
        EXPECT_FALSE(TALO::WebAPIUtil::ReadJsonFile(value, path.c_str()));
        EXPECT_EQ(value, "untouched");
    }

    std::string Write(const std::string& content) {
        return folder_.Write("file", content);
    }

    support::TempFolder folder_;
};

TEST_F(JsonFile, HoldsOneObjectOrArray) {
    ExpectRead(Write("{\"a\": 1}\n"), R"({"a": 1})");
    ExpectRead(Write(" [1, 2]"), "[1, 2]");
}

TEST_F(JsonFile, IsRefusedForItsContent) {
    const struct {
        std::string content;
        const char* why;
    } rows[] = {
        {"", "expected a value at byte 0"},
        {"\n", "expected a value at byte 1"},
        {"{\"a\": 1", "expected \",\" or \"}\" at byte 7"},
        {"{} x", "text behind the value at byte 3"},
        {std::string("{}\0", 3), "text behind the value at byte 2"},
        {std::string("{\"a\0\":1}", 8), "control character in a string at byte 3"},
        {"// comment\n{}", "expected a value at byte 0"},
        {"\xEF\xBB\xBF{}", "expected a value at byte 0"},
        {"1", "neither an object nor an array"},
        {"null", "neither an object nor an array"},
        {"\"text\"", "neither an object nor an array"},
        {std::string(65, '[') + std::string(65, ']'), "nested too deep at byte 64"},
    };
    for (const auto& row : rows) {
        ExpectRefused(Write(row.content), row.why);
    }
}

TEST_F(JsonFile, IsReadUpToFourMebibytes) {
    constexpr size_t kLimit = 4u << 20;
    ExpectRead(Write("[" + std::string(kLimit - 2, ' ') + "]"), "[]");
    ExpectRefused(Write("[" + std::string(kLimit - 1, ' ') + "]"), "larger than 4 MiB");
}

TEST_F(JsonFile, IsRefusedWhenItIsNoRegularFile) {
    ExpectRefused(folder_.Path("."), "no regular file");
    ExpectRefused("/dev/null", "no regular file");
    const std::string pipe = folder_.Path("pipe");
    ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
    ExpectRefused(pipe, "no regular file");
}

TEST_F(JsonFile, IsRefusedWhenItsSizeIsNotWhatItSays) {
    ExpectRefused("/proc/self/status", "changed while it was read");
}

TEST_F(JsonFile, IsFollowedThroughALink) {
    const std::string link = folder_.Path("link");
    ASSERT_EQ(symlink(Write("[]").c_str(), link.c_str()), 0);
    ExpectRead(link, "[]");
    ASSERT_EQ(unlink(folder_.Path("file").c_str()), 0);
    ExpectRefused(link, "No such file or directory");
}

TEST_F(JsonFile, IsRefusedWhenItIsNotThere) {
    ExpectRefused(folder_.Path("missing"), "No such file or directory");
    ExpectRefused("", "No such file or directory");
    ExpectRefused(Write("[]") + "/below", "Not a directory");
    Json::Value value;
    std::string reason;
    EXPECT_FALSE(host::ReadJsonFile(value, nullptr, &reason));
    EXPECT_FALSE(TALO::WebAPIUtil::ReadJsonFile(value, nullptr));
}

TEST_F(JsonFile, LeavesNoDescriptorOpen) {
    const std::string good = Write("[]");
    const std::string bad = folder_.Write("bad", "x");
    const int before = open("/dev/null", O_RDONLY);
    (void)close(before);
    Json::Value value;
    std::string reason;
    for (const std::string& path : {good, bad, folder_.Path("."), folder_.Path("missing")}) {
        (void)host::ReadJsonFile(value, path.c_str(), &reason);
    }
    const int after = open("/dev/null", O_RDONLY);
    (void)close(after);
    EXPECT_EQ(before, after);
}

}  // namespace
