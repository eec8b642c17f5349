#include <string>

#include "platform/WebAPIUtil.h"
#include "tests/contract/World.h"
#include "tests/support/Json.h"

using support::Parse;
using TALO::WebAPIUtil;

namespace {

class ReadJsonFile : public Contract {
  protected:
    void ExpectRefused(const std::string& content) {
        const std::string path = world->PathOf("file");
        world->WriteFile(path, content);
        Json::Value value("untouched");
        EXPECT_FALSE(WebAPIUtil::ReadJsonFile(value, path.c_str())) << content.substr(0, 80);
        EXPECT_EQ(value, "untouched");
    }

    void ExpectRead(const std::string& content, const Json::Value& expected) {
        const std::string path = world->PathOf("file");
        world->WriteFile(path, content);
        Json::Value value("before");
        EXPECT_TRUE(WebAPIUtil::ReadJsonFile(value, path.c_str())) << content.substr(0, 80);
        EXPECT_EQ(value, expected);
    }
};

TEST_F(ReadJsonFile, TakesAnObjectOrAnArrayWithWhiteSpaceAround) {
    ExpectRead("{\"a\": [1, null]}", Parse(R"({"a": [1, null]})"));
    ExpectRead(" \t\r\n[]\n", Json::Value(Json::arrayValue));
}

TEST_F(ReadJsonFile, RefusesEverythingElse) {
    for (const char* content :
         {"", " ", "1", "null", "\"a\"", "{", "{\"a\":1", "{}x", "{}{}", "[1,]", "{'a':1}",
          "// c\n{}", "{} // c", "\xEF\xBB\xBF{}", "[01]", "[NaN]", "[\"\n\"]"}) {
        ExpectRefused(content);
    }
    ExpectRefused(std::string("{}\0", 3));
    ExpectRefused(std::string("[\"a\0b\"]", 7));
}

TEST_F(ReadJsonFile, TakesTheLimitsAndNothingBeyond) {
    const size_t depth = WebAPIUtil::kMaxJsonDepth;
    const std::string deepest = std::string(depth, '[') + std::string(depth, ']');
    ExpectRead(deepest, Parse(deepest));
    ExpectRefused("[" + deepest + "]");
    const size_t bytes = WebAPIUtil::kMaxJsonFileBytes;
    ExpectRead("[" + std::string(bytes - 2, ' ') + "]", Json::Value(Json::arrayValue));
    ExpectRefused("[" + std::string(bytes - 1, ' ') + "]");
}

TEST_F(ReadJsonFile, RefusesAFileThatIsNotThere) {
    Json::Value value("untouched");
    EXPECT_FALSE(WebAPIUtil::ReadJsonFile(value, world->PathOf("missing").c_str()));
    EXPECT_FALSE(WebAPIUtil::ReadJsonFile(value, nullptr));
    EXPECT_EQ(value, "untouched");
}

}  // namespace
