#include "hosts/linux/cipher/TokenText.h"

#include "hosts/linux/cipher/Base64Url.h"
#include "tests/host/cipher/Vectors.h"

namespace {

class TokenText : public ::testing::Test {
  protected:
    static std::string KeyText(const std::string& token) {
        std::string key;
        EXPECT_TRUE(host::DeriveKeyText(taloCipherModule, token, &key));
        return key;
    }
    static std::string Encipher(const std::string& key, const std::string& plain) {
        std::string text;
        host::GcmNonce nonce;
        EXPECT_TRUE(nonce.Randomize());
        EXPECT_TRUE(host::EncipherText(taloCipherModule, key, nonce, plain, &text));
        return text;
    }
    static bool Deciphers(const std::string& key, const std::string& text, std::string* plain) {
        return host::DecipherText(taloCipherModule, key, text, plain);
    }
    static void ExpectRefused(const std::string& key, const std::string& text) {
        std::string plain = "untouched";
        EXPECT_FALSE(Deciphers(key, text, &plain)) << text.substr(0, 100);
        EXPECT_EQ(plain, "untouched");
    }
};

TEST_F(TokenText, KeyTextHas32CharactersAndIsTheTokensOwn) {
    const std::string one = KeyText("one");
    std::string bytes;
    EXPECT_EQ(one.size(), 32u);
    EXPECT_TRUE(host::FromBase64Url(one.data(), one.size(), &bytes));
    EXPECT_EQ(KeyText("one"), one);
    for (const std::string& other : {std::string("two"), std::string("One"), std::string("one "),
                                     std::string("on"), std::string("one\0", 4)}) {
        EXPECT_NE(KeyText(other), one) << other;
    }
}

TEST_F(TokenText, EmptyAndOverlongTokensHaveNoKey) {
    std::string key = "untouched";
    EXPECT_FALSE(host::DeriveKeyText(taloCipherModule, "", &key));
    EXPECT_FALSE(host::DeriveKeyText(taloCipherModule, std::string(4097, 'x'), &key));
    EXPECT_EQ(key, "untouched");
    EXPECT_TRUE(host::DeriveKeyText(taloCipherModule, std::string(4096, 'x'), &key));
}

TEST_F(TokenText, ComesBackAsItWas) {
    const std::string key = KeyText("token");
    for (const std::string& plain :
         {std::string(), std::string("a"), std::string("a=1&b=2"), std::string("\0\xff\n", 3),
          std::string(65537, 'x'), std::string(3u << 20, '\xe4')}) {
        std::string again = "other";
        EXPECT_TRUE(Deciphers(key, Encipher(key, plain), &again));
        EXPECT_TRUE(again == plain) << plain.size();
    }
}

TEST_F(TokenText, HasAFreshLookEachTime) {
    const std::string key = KeyText("token");
    EXPECT_NE(Encipher(key, "a=1"), Encipher(key, "a=1"));
}

TEST_F(TokenText, UnderAnotherKeyIsRefused) {
    const std::string text = Encipher(KeyText("one"), "a=1");
    ExpectRefused(KeyText("two"), text);
    std::string plain;
    EXPECT_TRUE(Deciphers(KeyText("one"), text, &plain));
}

TEST_F(TokenText, UnderWhatIsNoKeyTextIsRefused) {
    const std::string key = KeyText("token");
    const std::string text = Encipher(key, "a=1");
    for (const std::string& other :
         {std::string(), key.substr(1), key + "A", std::string(32, '='), std::string(32, '\0'),
          key.substr(0, 31) + "+", key + std::string(1, '\0')}) {
        ExpectRefused(other, text);
    }
}

TEST_F(TokenText, WithOneBitFlippedAnywhereIsRefused) {
    const std::string key = KeyText("token");
    const std::string text = Encipher(key, "a=1&b=2");
    for (size_t bit = 0; bit < text.size() * 8; ++bit) {
        std::string altered = text;
        altered[bit / 8] = static_cast<char>(altered[bit / 8] ^ 1 << bit % 8);
        ExpectRefused(key, altered);
    }
}

// The text's bits and the bytes' bits are not the same.
TEST_F(TokenText, WithOneBitOfItsBytesFlippedIsRefused) {
    const std::string key = KeyText("token");
    const std::string text = Encipher(key, "a=1&b=2");
    std::string bytes;
    ASSERT_TRUE(host::FromBase64Url(text.data(), text.size(), &bytes));
    for (size_t bit = 0; bit < bytes.size() * 8; ++bit) {
        std::string altered = bytes;
        altered[bit / 8] = static_cast<char>(altered[bit / 8] ^ 1 << bit % 8);
        ExpectRefused(key, host::ToBase64Url(altered));
    }
}

TEST_F(TokenText, CutAtAnyLengthIsRefused) {
    const std::string key = KeyText("token");
    const std::string text = Encipher(key, "a=1&b=2");
    std::string bytes;
    ASSERT_TRUE(host::FromBase64Url(text.data(), text.size(), &bytes));
    for (size_t size = 0; size < text.size(); ++size) {
        ExpectRefused(key, text.substr(0, size));
        ExpectRefused(key, text.substr(size + 1));
    }
    for (size_t size = 0; size < bytes.size(); ++size) {
        ExpectRefused(key, host::ToBase64Url(bytes.substr(0, size)));
    }
}

TEST_F(TokenText, WithSomethingBehindItIsRefused) {
    const std::string key = KeyText("token");
    const std::string text = Encipher(key, "a=1");
    for (const char* more : {"A", "AA", "AAA", "AAAA", "=", "==", "\n", " ", "&a=2"}) {
        ExpectRefused(key, text + more);
    }
    ExpectRefused(key, text + std::string(1, '\0'));
    ExpectRefused(key, text + text);
    ExpectRefused(key, " " + text);
}

TEST_F(TokenText, HugeNonsenseIsRefused) {
    const std::string key = KeyText("token");
    ExpectRefused(key, std::string(16u << 20, 'A'));
    ExpectRefused(key, "AQ" + std::string((16u << 20) - 2, 'A'));
    ExpectRefused(key, std::string(host::kMaxCipherTextBytes + 4, 'A'));
}

}  // namespace
