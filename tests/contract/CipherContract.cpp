#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "platform/Cgi.h"
#include "platform/CredRequest.h"
#include "tests/contract/CipherWorld.h"

using TALO::CredRequestUtil;

namespace {

constexpr size_t kKeyBytes = 33;

class Ciphers : public ::testing::Test {
  protected:
    Ciphers() : world(MakeCipherWorld()) {}

    using Operation = int (*)(char*);
    static constexpr Operation kBoth[] = {TaloCgiDecryptParam, TaloCgiDetectAndDecryptParamLine};

    static void Opens(Operation operation, const std::string& text, const std::string& line) {
        std::vector<char> copy(text.c_str(), text.c_str() + text.size() + 1);
        EXPECT_NE(operation(copy.data()), 0) << text;
        EXPECT_STREQ(copy.data(), line.c_str());
        EXPECT_LE(line.size(), text.size());
    }
    static void Refuses(Operation operation, const std::string& text) {
        std::vector<char> copy(text.c_str(), text.c_str() + text.size() + 1);
        EXPECT_EQ(operation(copy.data()), 0) << text;
        EXPECT_STREQ(copy.data(), text.c_str()) << "untouched on failure";
    }

    static std::string KeyOf(const std::string& token) {
        char key[kKeyBytes] = {};
        EXPECT_GE(TALONdtokenGenerateToken(token.c_str(), key, sizeof key), 0) << token;
        return key;
    }
    static void HasNoKey(const char* token, size_t size) {
        std::string buffer(kKeyBytes, 'x');
        EXPECT_LT(TALONdtokenGenerateToken(token, &buffer[0], size), 0);
        EXPECT_EQ(buffer, std::string(kKeyBytes, 'x')) << "untouched on failure";
    }

    static void RefusesText(const std::string& key, const std::string& text) {
        std::string line = "untouched";
        EXPECT_FALSE(CredRequestUtil::GetDecryptAESString(key, text, line)) << text;
        EXPECT_EQ(line, "untouched");
    }

    const std::unique_ptr<CipherWorld> world;
};

TEST_F(Ciphers, OpenALineInPlace) {
    for (const Operation operation : kBoth) {
        const std::string mark = operation == TaloCgiDecryptParam ? "1" : "2";
        for (const std::string& line : {"a=" + mark, mark, mark + std::string(100000, 'x')}) {
            Opens(operation, world->Seal(line), line);
        }
    }
    Opens(TaloCgiDecryptParam, world->Seal(""), "");
}

TEST_F(Ciphers, OpenALineOnceWhicheverOperationIsAsked) {
    for (const Operation operation : kBoth) {
        const std::string line = operation == TaloCgiDecryptParam ? "a=1" : "a=2";
        const std::string text = world->Seal(line);
        Opens(operation, text, line);
        for (const Operation again : kBoth) {
            Refuses(again, text);
        }
    }
}

TEST_F(Ciphers, TakeALineAsItIsEvenIfItLooksSealed) {
    const std::string inner = world->Seal("a=1");
    Opens(TaloCgiDetectAndDecryptParamLine, world->Seal(inner), inner);
    Opens(TaloCgiDecryptParam, inner, "a=1");
}

TEST_F(Ciphers, TellAPlainLineFromASealedOne) {
    for (const char* line : {"", "a=1", "{\"a\":1}", "\xff", "%41"}) {
        Refuses(TaloCgiDecryptParam, line);
        Opens(TaloCgiDetectAndDecryptParamLine, line, line);
    }
    for (const Operation operation : kBoth) {
        EXPECT_EQ(operation(nullptr), 0);
    }
}

TEST_F(Ciphers, GiveATokenTheSameKeyEachTime) {
    const std::string key = KeyOf("token");
    EXPECT_FALSE(key.empty());
    EXPECT_EQ(KeyOf("token"), key);
    EXPECT_NE(KeyOf("other"), key);
    EXPECT_EQ(KeyOf(std::string(4096, 't')).size(), 32u);
}

TEST_F(Ciphers, HaveNoKeyWithoutATokenOrRoomForIt) {
    HasNoKey("", kKeyBytes);
    HasNoKey(nullptr, kKeyBytes);
    HasNoKey("token", 0);
    HasNoKey("token", 1);
    HasNoKey(std::string(4096, 't').c_str(), kKeyBytes - 1);
    HasNoKey(std::string(4097, 't').c_str(), kKeyBytes);
    EXPECT_LT(TALONdtokenGenerateToken("token", nullptr, kKeyBytes), 0);
}

TEST_F(Ciphers, OpenATextWithItsTokensKeyOnly) {
    const std::string text = world->Encipher("token", "a=1&b=x");
    for (int turn = 0; turn < 2; ++turn) {
        std::string line = "something else";
        EXPECT_TRUE(CredRequestUtil::GetDecryptAESString(KeyOf("token"), text, line));
        EXPECT_EQ(line, "a=1&b=x");
    }
    RefusesText(KeyOf("other"), text);
    RefusesText("", text);
    RefusesText(KeyOf("token") + "x", text);
    RefusesText(KeyOf("token"), "");
    RefusesText(KeyOf("token"), "a=1");
    RefusesText(KeyOf("token"), "x" + text);
}

}  // namespace
