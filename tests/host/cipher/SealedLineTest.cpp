#include "hosts/linux/cipher/SealedLine.h"

#include "hosts/linux/cipher/Base64Url.h"
#include "hosts/linux/cipher/TokenText.h"
#include "tests/host/cipher/Vectors.h"

namespace {

constexpr long long kNow = 1800000000;
constexpr size_t kPrefixBytes = sizeof host::kLinePrefix - 1;

class SealedLine : public ::testing::Test {
  protected:
    SealedLine() {
        ring_.current = KeyOf(1);
        ring_.since = kNow - 1000;
    }

    static std::string Seal(const host::LineKey& key, const std::string& line,
                            long long time = kNow) {
        host::LineContent content;
        content.time = time;
        content.nonce = SecretOf<16>(64);
        content.line = line;
        return Seal(key, content);
    }
    static std::string Seal(const host::LineKey& key, const host::LineContent& content) {
        host::Key own;
        std::string text;
        EXPECT_TRUE(own.Randomize());
        EXPECT_TRUE(host::SealLine(taloCipherModule, key.half, own, content, &text));
        return text;
    }

    bool Opens(const std::string& text, host::LineContent* content, long long now = kNow) const {
        return host::OpenLine(taloCipherModule, ring_, text, now, content);
    }
    void ExpectRefused(const std::string& text) const {
        host::LineContent content;
        content.line = "untouched";
        EXPECT_FALSE(Opens(text, &content)) << text.substr(0, 100);
        EXPECT_EQ(content.line, "untouched");
        EXPECT_EQ(content.time, 0);
    }

    static std::string BytesOf(const std::string& text) {
        std::string bytes;
        EXPECT_TRUE(
            host::FromBase64Url(text.data() + kPrefixBytes, text.size() - kPrefixBytes, &bytes));
        return bytes;
    }
    static std::string TextOf(const std::string& bytes) {
        return host::kLinePrefix + host::ToBase64Url(bytes);
    }

    host::KeyRing ring_;
};

TEST_F(SealedLine, ComesBackWithItsTimeAndNonce) {
    for (const std::string& line :
         {std::string(), std::string("a=1"), std::string("{\"api\":\"A\"}"),
          std::string("\xc3\xa4=\xff\n"), std::string(host::kLinePrefix) + "AAAA",
          std::string(3u << 20, 'x')}) {
        host::LineContent content;
        ASSERT_TRUE(Opens(Seal(ring_.current, line, kNow + 5), &content)) << line.substr(0, 50);
        EXPECT_TRUE(content.line == line);
        EXPECT_EQ(content.time, kNow + 5);
        EXPECT_EQ(content.nonce.Text(), CountUp(64, 16));
    }
}

TEST_F(SealedLine, IsLongerThanItsContent) {
    EXPECT_GT(Seal(ring_.current, "").size(), 0u);
    for (size_t size = 0; size < 100; ++size) {
        EXPECT_GT(Seal(ring_.current, std::string(size, 'x')).size(), size);
    }
}

TEST_F(SealedLine, IsToldByItsPrefixOnly) {
    EXPECT_TRUE(host::IsSealedLine("~talo-line.1~"));
    EXPECT_TRUE(host::IsSealedLine("~talo-line.1~a=1"));
    for (const char* plain :
         {"", "~", "~talo-line.1", "~talo-line.1=", " ~talo-line.1~", "a=1", "{\"a\":1}",
          "~TALO-LINE.1~", "~talo-line.2~AAAA", "%7Etalo-line.1~", "a=~talo-line.1~"}) {
        EXPECT_FALSE(host::IsSealedLine(plain)) << plain;
        ExpectRefused(plain);
    }
}

TEST_F(SealedLine, ToAnotherKeyIsRefused) {
    ExpectRefused(Seal(KeyOf(77), "a=1"));
    // Under the right key's name, too.
    host::LineKey mixed = KeyOf(77);
    const std::string bytes = BytesOf(Seal(mixed, "a=1"));
    ExpectRefused(TextOf(bytes.substr(0, 1) + host::KeyIdOf(ring_.current.half) +
                         bytes.substr(1 + host::kKeyIdBytes)));
}

TEST_F(SealedLine, WithOneBitFlippedAnywhereIsRefused) {
    const std::string text = Seal(ring_.current, "a=1");
    for (size_t bit = 0; bit < text.size() * 8; ++bit) {
        std::string altered = text;
        altered[bit / 8] = static_cast<char>(altered[bit / 8] ^ 1 << bit % 8);
        ExpectRefused(altered);
    }
}

TEST_F(SealedLine, WithOneBitOfItsBytesFlippedIsRefused) {
    const std::string bytes = BytesOf(Seal(ring_.current, "a=1"));
    for (size_t bit = 0; bit < bytes.size() * 8; ++bit) {
        std::string altered = bytes;
        altered[bit / 8] = static_cast<char>(altered[bit / 8] ^ 1 << bit % 8);
        ExpectRefused(TextOf(altered));
    }
}

TEST_F(SealedLine, CutAtAnyLengthIsRefused) {
    const std::string text = Seal(ring_.current, "a=1");
    const std::string bytes = BytesOf(text);
    for (size_t size = 0; size < text.size(); ++size) {
        ExpectRefused(text.substr(0, size));
    }
    for (size_t size = 0; size < bytes.size(); ++size) {
        ExpectRefused(TextOf(bytes.substr(0, size)));
    }
}

TEST_F(SealedLine, WithSomethingBehindItIsRefused) {
    const std::string text = Seal(ring_.current, "a=1");
    for (const char* more : {"A", "AA", "AAAA", "=", "\n", " ", "&a=2"}) {
        ExpectRefused(text + more);
    }
    ExpectRefused(text + std::string(1, '\0'));
}

// Such a half makes every secret agree on zeros, so that anybody knows the key.
TEST_F(SealedLine, FromAHalfThatAgreesOnZerosIsRefused) {
    const std::string bytes = BytesOf(Seal(ring_.current, "a=1"));
    for (const std::string& half :
         {std::string(32, '\0'), std::string(1, '\1') + std::string(31, '\0')}) {
        ExpectRefused(TextOf(bytes.substr(0, 10) + half + bytes.substr(42)));
    }
}

TEST_F(SealedLine, WithANulInItsLineIsRefused) {
    ExpectRefused(Seal(ring_.current, std::string("a=1\0&b=2", 8)));
    ExpectRefused(Seal(ring_.current, std::string(1, '\0')));
}

TEST_F(SealedLine, OfATimeThatIsNoneIsRefused) {
    ExpectRefused(Seal(ring_.current, "a=1", -1));
    ExpectRefused(Seal(ring_.current, "a=1", 253402300800));
    host::LineContent content;
    EXPECT_TRUE(Opens(Seal(ring_.current, "a=1", 253402300799), &content));
    EXPECT_TRUE(Opens(Seal(ring_.current, "a=1", 0), &content));
}

TEST_F(SealedLine, HugeNonsenseIsRefused) {
    ExpectRefused(host::kLinePrefix + std::string(16u << 20, 'A'));
    ExpectRefused(host::kLinePrefix + std::string(host::kMaxCipherTextBytes, 'A'));
    const std::string head = BytesOf(Seal(ring_.current, "a=1")).substr(0, 42);
    ExpectRefused(TextOf(head + std::string(8u << 20, 'x')));
}

TEST_F(SealedLine, ToThePreviousKeyOpensForADay) {
    const std::string text = Seal(ring_.current, "a=1");
    ring_.previous = ring_.current;
    ring_.current = KeyOf(99);
    ring_.since = kNow;
    host::LineContent content;
    EXPECT_TRUE(Opens(text, &content, kNow));
    EXPECT_TRUE(Opens(text, &content, kNow + 24 * 3600 - 1));
    EXPECT_FALSE(Opens(text, &content, kNow + 24 * 3600));
    EXPECT_TRUE(Opens(Seal(ring_.current, "a=1"), &content, kNow + 24 * 3600));
}

}  // namespace
