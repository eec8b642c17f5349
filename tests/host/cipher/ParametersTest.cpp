#include <gtest/gtest.h>
#include <unistd.h>

#include <cstring>
#include <ctime>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iterator>
#include <vector>

#include "hosts/linux/cipher/Base64Url.h"
#include "hosts/linux/cipher/KeyRing.h"
#include "hosts/linux/cipher/SealedLine.h"
#include "hosts/linux/cipher/TokenText.h"
#include "hosts/linux/sdk/Cipher.h"
#include "hosts/linux/util/Module.h"
#include "platform/Cgi.h"
#include "platform/CredRequest.h"
#include "platform/Paths.h"
#include "tests/support/Child.h"

namespace {

namespace fs = std::filesystem;

constexpr char kModule[] = TALO_MODULE_DIR "talo-cipher.so";

// The platform's operations over the private root. Every case has a process of
// its own: a module that is loaded stays.
class Parameters : public ::testing::Test {
  protected:
    void SetUp() override {
        Clear();
        fs::create_directories(TALO_MODULE_DIR);
        fs::copy_file(CIPHER_MODULE, kModule);
    }
    void TearDown() override {
        SetUp();
        fs::remove_all(TALO_CIPHER_DIR);
    }
    static void Clear() {
        fs::remove(kModule);
        fs::remove_all(TALO_CIPHER_DIR);
        fs::remove_all(TALO_CIPHER_SEEN_DIR);
    }

    static void Apart(const std::function<void()>& body) {
        const support::ChildResult child = support::InChild([&] {
            body();
            return 0;
        });
        EXPECT_EQ(child.status, 0) << child.output;
    }

    static const TaloCipherModule& Module() {
        static const void* module =
            host::OpenModule(kCipherModuleFile, kCipherModuleSymbol, "no test");
        return *static_cast<const TaloCipherModule*>(module);
    }

    // What a client makes of a line, with what the appliance has told it.
    static std::string Seal(const std::string& line, long long skew = 0) {
        talo::CipherKey told;
        std::string bytes;
        host::Key half;
        host::Key own;
        host::LineContent content;
        content.time = time(nullptr) + skew;
        content.line = line;
        std::string text;
        EXPECT_TRUE(talo::PublicCipherKey(&told));
        EXPECT_TRUE(host::FromBase64Url(told.key.data(), told.key.size(), &bytes));
        EXPECT_TRUE(half.Set(bytes) && own.Randomize() && content.nonce.Randomize());
        EXPECT_TRUE(host::SealLine(Module(), half, own, content, &text));
        return text;
    }

    // The line that comes out; "refused", and untouched, otherwise.
    static std::string Through(int (*operation)(char*), const std::string& text) {
        std::vector<char> copy(text.c_str(), text.c_str() + text.size() + 1);
        if (operation(copy.data()) != 0) {
            return copy.data();
        }
        EXPECT_TRUE(std::memcmp(copy.data(), text.c_str(), text.size() + 1) == 0);
        return "refused";
    }
    static std::string Decrypted(const std::string& text) {
        return Through(TaloCgiDecryptParam, text);
    }
    static std::string Detected(const std::string& text) {
        return Through(TaloCgiDetectAndDecryptParamLine, text);
    }

    static bool CryptoIsLoaded() {
        std::ifstream maps("/proc/self/maps");
        const std::string content{std::istreambuf_iterator<char>(maps), {}};
        EXPECT_FALSE(content.empty());
        return content.find("libcrypto") != std::string::npos ||
               content.find("talo-cipher") != std::string::npos;
    }
};

TEST_F(Parameters, PlainLinesStayAndLoadAndMakeNothing) {
    Apart([] {
        for (const char* line : {"", "a=1&b=2", "{\"a\":1}", "~", "~talo-line.1", "%7Etalo-line.1~",
                                 "\xff\xfe", "a=~talo-line.1~AAAA"}) {
            EXPECT_EQ(Detected(line), line);
            EXPECT_EQ(Decrypted(line), "refused");
        }
        EXPECT_FALSE(CryptoIsLoaded());
        EXPECT_FALSE(fs::exists(TALO_CIPHER_DIR));
        EXPECT_FALSE(fs::exists(TALO_CIPHER_SEEN_DIR));
    });
}

TEST_F(Parameters, NothingIsNoText) {
    EXPECT_EQ(TaloCgiDecryptParam(nullptr), 0);
    EXPECT_EQ(TaloCgiDetectAndDecryptParamLine(nullptr), 0);
}

TEST_F(Parameters, SealedLinesAreDecipheredInPlace) {
    Apart([] {
        for (const std::string& line :
             {std::string("api=A&version=1"), std::string(), std::string("{\"a\":\"\xc3\xa4\"}"),
              std::string(2u << 20, 'x')}) {
            EXPECT_TRUE(Detected(Seal(line)) == line);
            EXPECT_TRUE(Decrypted(Seal(line)) == line);
        }
        EXPECT_TRUE(CryptoIsLoaded());
    });
}

TEST_F(Parameters, ALineThatHoldsAnotherCarrierIsJustALine) {
    Apart([] {
        const std::string inner = Seal("a=1");
        EXPECT_EQ(Detected(Seal(inner)), inner);
        EXPECT_EQ(Decrypted(Seal(inner)), inner);
        EXPECT_EQ(Detected(Seal("__cIpHeRtExT=" + inner)), "__cIpHeRtExT=" + inner);
        EXPECT_EQ(Detected(inner), "a=1");  // it did not count so far
    });
}

TEST_F(Parameters, ALineCountsOnceWhicheverOperationAndProcessTakesIt) {
    Apart([] {
        const std::string first = Seal("a=1");
        const std::string second = Seal("a=1");
        EXPECT_EQ(Detected(first), "a=1");
        EXPECT_EQ(Detected(first), "refused");
        EXPECT_EQ(Decrypted(first), "refused");
        EXPECT_EQ(Decrypted(second), "a=1");
        EXPECT_EQ(Detected(second), "refused");
        std::ofstream(TALO_CIPHER_DIR "/text") << first;
    });
    Apart([] {
        std::ifstream file(TALO_CIPHER_DIR "/text");
        const std::string first{std::istreambuf_iterator<char>(file), {}};
        EXPECT_EQ(Detected(first), "refused");
        EXPECT_EQ(Detected(Seal("a=1")), "a=1");
    });
}

TEST_F(Parameters, ALineThatIsRefusedDoesNotUseUpTheRealOne) {
    Apart([] {
        const std::string text = Seal("a=1");
        std::string altered = text;
        altered[text.size() - 10] = altered[text.size() - 10] == 'A' ? 'B' : 'A';
        EXPECT_EQ(Detected(altered), "refused");
        EXPECT_EQ(Detected(text.substr(0, text.size() - 4)), "refused");
        EXPECT_EQ(Detected(text), "a=1");
    });
}

TEST_F(Parameters, AClockThatIsFarOffIsRefused) {
    Apart([] {
        EXPECT_EQ(Detected(Seal("a=1", -660)), "refused");
        EXPECT_EQ(Detected(Seal("a=1", 660)), "refused");
        EXPECT_EQ(Detected(Seal("a=1", 540)), "a=1");
    });
}

TEST_F(Parameters, APrefixWithNonsenseIsRefused) {
    Apart([] {
        for (const std::string& rest :
             {std::string(), std::string("A"), std::string("a=1"), std::string(110, 'A'),
              std::string("===="), std::string(5u << 20, 'A'), std::string("\xff\xfe")}) {
            EXPECT_EQ(Detected(host::kLinePrefix + rest), "refused");
        }
    });
}

TEST_F(Parameters, ARotationKeepsLinesToThePreviousKeyForADay) {
    Apart([] {
        const std::string before = Seal("a=1");
        const std::string late = Seal("a=1");
        std::string problem;
        ASSERT_TRUE(talo::RotateCipherKey(&problem)) << problem;
        EXPECT_EQ(Detected(Seal("a=2")), "a=2");
        EXPECT_EQ(Detected(before), "a=1");
        // As if the rotation had been a day ago.
        host::KeyRing ring;
        ASSERT_TRUE(host::OpenKeyRing(Module(), TALO_CIPHER_DIR, 0, &ring));
        ring.since -= 86400;
        std::ofstream(TALO_CIPHER_DIR "/keys") << host::FormatKeyRing(ring);
        EXPECT_EQ(Detected(late), "refused");
        EXPECT_EQ(Detected(Seal("a=3")), "a=3");
    });
}

TEST_F(Parameters, TwoRotationsDropAKeyAtOnce) {
    Apart([] {
        const std::string before = Seal("a=1");
        std::string problem;
        EXPECT_TRUE(talo::RotateCipherKey(&problem));
        EXPECT_TRUE(talo::RotateCipherKey(&problem));
        EXPECT_EQ(Detected(before), "refused");
    });
}

TEST_F(Parameters, APublicKeyIsTheSameUntilItIsRotated) {
    Apart([] {
        talo::CipherKey one;
        talo::CipherKey two;
        std::string problem;
        ASSERT_TRUE(talo::PublicCipherKey(&one));
        ASSERT_TRUE(talo::PublicCipherKey(&two));
        EXPECT_EQ(one.key, two.key);
        EXPECT_EQ(one.key.size(), 43u);
        EXPECT_EQ(one.id, one.key.substr(0, 12));
        ASSERT_TRUE(talo::RotateCipherKey(&problem));
        ASSERT_TRUE(talo::PublicCipherKey(&two));
        EXPECT_NE(one.key, two.key);
    });
}

TEST_F(Parameters, APublicKeyThatIsNotTheSecretsIsNotHandedOut) {
    Apart([] {
        host::KeyRing ring;
        ASSERT_TRUE(host::OpenKeyRing(Module(), TALO_CIPHER_DIR, time(nullptr), &ring));
        ring.current.half.bytes[5] ^= 1;
        std::ofstream(TALO_CIPHER_DIR "/keys") << host::FormatKeyRing(ring);
        talo::CipherKey key;
        key.key = "untouched";
        EXPECT_FALSE(talo::PublicCipherKey(&key));
        EXPECT_EQ(key.key, "untouched");
    });
}

TEST_F(Parameters, ATokensKeyTextFitsTheFrameworksBuffer) {
    Apart([] {
        const std::string token = talo::NewCipherToken();
        char key[34];
        std::memset(key, 'x', sizeof key);
        ASSERT_GE(TALONdtokenGenerateToken(token.c_str(), key, 33), 0);
        EXPECT_EQ(std::strlen(key), 32u);
        EXPECT_EQ(key[33], 'x');
        char again[33];
        ASSERT_GE(TALONdtokenGenerateToken(token.c_str(), again, sizeof again), 0);
        EXPECT_STREQ(key, again);
        EXPECT_FALSE(fs::exists(TALO_CIPHER_DIR));  // no key is stored
    });
}

TEST_F(Parameters, ATokenWithoutAKeyLeavesTheBufferAlone) {
    Apart([] {
        char key[33] = "untouched";
        const std::string longest(4096, 'x');
        EXPECT_LT(TALONdtokenGenerateToken("", key, sizeof key), 0);
        EXPECT_LT(TALONdtokenGenerateToken(nullptr, key, sizeof key), 0);
        EXPECT_LT(TALONdtokenGenerateToken("token", nullptr, sizeof key), 0);
        EXPECT_LT(TALONdtokenGenerateToken("token", key, 32), 0);
        EXPECT_LT(TALONdtokenGenerateToken("token", key, 0), 0);
        EXPECT_LT(TALONdtokenGenerateToken((longest + "x").c_str(), key, sizeof key), 0);
        EXPECT_STREQ(key, "untouched");
        EXPECT_GE(TALONdtokenGenerateToken(longest.c_str(), key, sizeof key), 0);
    });
}

TEST_F(Parameters, ATextUnderATokenIsDeciphered) {
    Apart([] {
        char key[33] = {};
        ASSERT_GE(TALONdtokenGenerateToken("token", key, sizeof key), 0);
        host::GcmNonce nonce;
        std::string text;
        std::string plain = "untouched";
        ASSERT_TRUE(nonce.Randomize());
        ASSERT_TRUE(host::EncipherText(Module(), key, nonce, "a=1", &text));
        const std::string wrong(32, 'A');
        EXPECT_FALSE(TALO::CredRequestUtil::GetDecryptAESString(wrong, text, plain));
        EXPECT_FALSE(TALO::CredRequestUtil::GetDecryptAESString("", text, plain));
        EXPECT_FALSE(TALO::CredRequestUtil::GetDecryptAESString(key, "", plain));
        EXPECT_FALSE(TALO::CredRequestUtil::GetDecryptAESString(key, text + "A", plain));
        EXPECT_EQ(plain, "untouched");
        EXPECT_TRUE(TALO::CredRequestUtil::GetDecryptAESString(key, text, plain));
        EXPECT_EQ(plain, "a=1");
    });
}

TEST_F(Parameters, NoTokenIsLikeAnother) {
    const std::string token = talo::NewCipherToken();
    EXPECT_EQ(token.size(), 33u);
    EXPECT_EQ(token[0], 't');
    EXPECT_NE(token, talo::NewCipherToken());
}

TEST_F(Parameters, WithoutTheModuleAreRefused) {
    Apart([] {
        const std::string sealed = Seal("a=1");
        std::ofstream(TALO_CIPHER_DIR "/text") << sealed;
    });
    fs::remove(kModule);
    Apart([] {
        std::ifstream file(TALO_CIPHER_DIR "/text");
        const std::string sealed{std::istreambuf_iterator<char>(file), {}};
        char key[33] = "untouched";
        std::string plain = "untouched";
        std::string problem;
        talo::CipherKey told;
        EXPECT_EQ(Detected(sealed), "refused");
        EXPECT_EQ(Decrypted(sealed), "refused");
        EXPECT_EQ(Detected("a=1"), "a=1");
        EXPECT_LT(TALONdtokenGenerateToken("token", key, sizeof key), 0);
        EXPECT_FALSE(TALO::CredRequestUtil::GetDecryptAESString(std::string(32, 'A'), "AQ", plain));
        EXPECT_FALSE(talo::PublicCipherKey(&told));
        EXPECT_FALSE(talo::RotateCipherKey(&problem));
        EXPECT_NE(problem, "");
        EXPECT_STREQ(key, "untouched");
        EXPECT_EQ(plain, "untouched");
        // One that comes meanwhile serves the next call.
        fs::copy_file(CIPHER_MODULE, kModule);
        EXPECT_EQ(Detected(sealed), "a=1");
    });
}

TEST_F(Parameters, KeysThatCannotBeTrustedRefuseEveryLine) {
    Apart([] {
        const std::string sealed = Seal("a=1");
        fs::permissions(TALO_CIPHER_DIR "/keys", fs::perms(0644));
        std::string problem;
        talo::CipherKey told;
        EXPECT_EQ(Detected(sealed), "refused");
        EXPECT_FALSE(talo::PublicCipherKey(&told));
        EXPECT_FALSE(talo::RotateCipherKey(&problem));
        EXPECT_NE(problem, "");
        fs::permissions(TALO_CIPHER_DIR "/keys", fs::perms(0600));
        EXPECT_EQ(Detected(sealed), "a=1");
    });
}

TEST_F(Parameters, NoDescriptorIsLeftOpen) {
    Apart([] {
        const auto count = [] {
            return std::distance(fs::directory_iterator("/proc/self/fd"), fs::directory_iterator());
        };
        EXPECT_EQ(Detected(Seal("a=1")), "a=1");
        const auto before = count();
        std::string problem;
        for (int turn = 0; turn < 5; ++turn) {
            const std::string text = Seal("a=1");
            EXPECT_EQ(Detected(text), "a=1");
            EXPECT_EQ(Detected(text), "refused");
            EXPECT_EQ(Detected(text + "A"), "refused");
            EXPECT_TRUE(talo::RotateCipherKey(&problem));
        }
        EXPECT_EQ(count(), before);
    });
}

}  // namespace
