#include "hosts/linux/conf/KeyValueFile.h"

#include <sys/stat.h>

#include <string>

#include "tests/host/cgi/SessionFixture.h"

namespace {

class KeyValueFile : public SessionTest {
  protected:
    std::string Value(const std::string& content, const std::string& key = "key") {
        Write("conf", content);
        return host::ReadKey(PathOf("conf").c_str(), key);
    }
};

TEST_F(KeyValueFile, ReadsALinePerKey) {
    const struct {
        const char* what;
        std::string content;
        const char* value;
    } rows[] = {
        {"plain", "key=\"value\"\n", "value"},
        {"without a line end", "key=\"value\"", "value"},
        {"without quotes", "key=value\n", "value"},
        {"line ends of two characters", "key=\"value\"\r\n", "value"},
        {"blanks around", " \t key \t = \t \"value\" \t \n", "value"},
        {"blanks within quotes", "key=\" value \"\n", " value "},
        {"blanks without quotes", "key= a b \n", "a b"},
        {"an equals sign in the value", "key=\"a=b\"\n", "a=b"},
        {"a number sign in the value", "key=\"a#b\"\n", "a#b"},
        {"quotes in the value", "key=\"a\"b\"\n", "a\"b"},
        {"one quote only", "key=\"value\n", "\"value"},
        {"one quote alone", "key=\"\n", "\""},
        {"an empty value", "key=\"\"\n", ""},
        {"nothing", "key=\n", ""},
        {"the last one counts", "key=\"a\"\nkey=\"b\"\n", "b"},
        {"the last one counts though empty", "key=\"a\"\nkey=\"\"\n", ""},
        {"a comment", "#key=\"a\"\n", ""},
        {"a comment behind blanks", "  # key=\"a\"\n", ""},
        {"another key", "key2=\"a\"\nmykey=\"b\"\nKEY=\"c\"\n", ""},
        {"no equals sign", "key\n", ""},
        {"no key", "=\"value\"\n", ""},
        {"empty lines between", "\n\n\nkey=\"value\"\n\n", "value"},
        {"bytes of any kind", "\xFF\xFE\nkey=\"\xC3\xA9\"\n", "\xC3\xA9"},
        {"an empty file", "", ""},
        {"a line end only", "\n", ""},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(Value(row.content), row.value) << row.what;
    }
    EXPECT_EQ(Value(std::string("a=\"\0\"\nkey=\"value\"\n", 18)), "value");
}

TEST_F(KeyValueFile, HasNoKeyThatIsAComment) {
    EXPECT_EQ(Value("#key=\"a\"\n", "#key"), "");
}

TEST_F(KeyValueFile, ReadsOneMebibyteAndNoMore) {
    const std::string line = "key=\"value\"\n";
    const std::string padding((1u << 20) - line.size(), '\n');
    EXPECT_EQ(Value(padding + line), "value");
    EXPECT_EQ(Value(padding + "\n" + line), "");
}

TEST_F(KeyValueFile, IsEmptyWhenItIsNoFile) {
    EXPECT_EQ(host::ReadKey(PathOf("missing").c_str(), "key"), "");
    EXPECT_EQ(host::ReadKey(PathOf("").c_str(), "key"), "");
    ASSERT_EQ(mkfifo(PathOf("pipe").c_str(), 0600), 0);
    EXPECT_EQ(host::ReadKey(PathOf("pipe").c_str(), "key"), "");
}

TEST_F(KeyValueFile, OfTheHostHasDefaults) {
    EXPECT_EQ(host::HostSetting("key", "default"), "default");
    host.Configure("key=\"value\"\nempty=\"\"\n");
    EXPECT_EQ(host::HostSetting("key", "default"), "value");
    EXPECT_EQ(host::HostSetting("empty", "default"), "default");
    EXPECT_EQ(host::HostSetting("other", ""), "");
}

}  // namespace
