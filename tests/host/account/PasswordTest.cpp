#include "hosts/linux/account/Password.h"

#include <gmock/gmock.h>

#include <filesystem>

#include "AccountRoot.h"
#include "platform/Paths.h"

namespace {

using host::Verdict;

class Password : public AccountRoot {
  public:
    static std::string Hash(const std::string& password) {
        std::string hash;
        EXPECT_TRUE(host::HashPassword(password, &hash));
        return hash;
    }

    // Method and cost: what comes before the salt.
    static std::string CostOf(const std::string& hash) {
        return hash.substr(0, hash.find('$', 3));
    }
};

TEST_F(Password, IsHashedWithYescryptAndASaltOfItsOwn) {
    const std::string first = Hash("secret");
    const std::string second = Hash("secret");
    EXPECT_TRUE(host::IsYescrypt(first)) << first;
    EXPECT_NE(first, second);
    EXPECT_EQ(Verdict::kMatches, host::VerifyPassword("secret", first));
    EXPECT_EQ(Verdict::kMatches, host::VerifyPassword("secret", second));
}

TEST_F(Password, MatchesNothingButItself) {
    const std::string hash = Hash("secret");
    for (const char* other : {"", "secre", "secret ", "Secret", "secret\n"}) {
        EXPECT_EQ(Verdict::kDiffers, host::VerifyPassword(other, hash)) << other;
    }
}

TEST_F(Password, MatchesNoDamagedHash) {
    const std::string hash = Hash("secret");
    const std::string hashes[] = {"",
                                  "*",
                                  "!",
                                  "x",
                                  "secret",
                                  "$",
                                  "$y$",
                                  "$9$x$y$z",
                                  "*0",
                                  "*1",
                                  hash.substr(0, hash.size() - 1),
                                  hash + "x",
                                  hash.substr(0, hash.rfind('$') + 1)};
    for (const std::string& damaged : hashes) {
        EXPECT_EQ(Verdict::kDiffers, host::VerifyPassword("secret", damaged)) << damaged;
    }
}

TEST_F(Password, CountsToItsLastByte) {
    const std::string longest(host::kMaxPasswordBytes, 'x');
    const std::string hash = Hash(longest);
    EXPECT_TRUE(host::IsPassword(longest, nullptr));
    EXPECT_FALSE(host::IsPassword(longest + "x", nullptr));
    EXPECT_EQ(Verdict::kMatches, host::VerifyPassword(longest, hash));
    EXPECT_EQ(Verdict::kDiffers,
              host::VerifyPassword(longest.substr(0, longest.size() - 1) + "y", hash));
}

TEST_F(Password, DummyHashCostsWhatANewOneCosts) {
    EXPECT_TRUE(host::IsYescrypt(host::kDummyHash));
    const std::string fresh = Hash("secret");
    EXPECT_EQ(CostOf(fresh), CostOf(host::kDummyHash));
    EXPECT_EQ(fresh.size(), std::string(host::kDummyHash).size());
    // libcrypt computes it rather than refusing it at once.
    const TaloPasswordModule* module =
        host::OpenPasswordModule(std::string(TALO_MODULE_DIR) + kPasswordModuleFile);
    ASSERT_NE(nullptr, module);
    char computed[384];
    ASSERT_EQ(1, module->hash("guess", host::kDummyHash, computed, sizeof computed));
    EXPECT_EQ(fresh.size(), std::string(computed).size());
    EXPECT_STRNE(host::kDummyHash, computed);
}

TEST_F(Password, ModuleThatIsMissingIsLogged) {
    EXPECT_EQ(nullptr, host::OpenPasswordModule(ACCOUNT_ROOT "/lib/talo/missing.so"));
    EXPECT_TRUE(WasLogged("no password can be checked: " ACCOUNT_ROOT "/lib/talo/missing.so"));
}

TEST_F(Password, ModuleThatIsNoneIsLogged) {
    WriteFile(ACCOUNT_ROOT "/lib/talo/text.so", "no library");
    EXPECT_EQ(nullptr, host::OpenPasswordModule(ACCOUNT_ROOT "/lib/talo/text.so"));
    EXPECT_EQ(nullptr, host::OpenPasswordModule("libm.so.6"));
    EXPECT_EQ(2u, Logged().size());
    EXPECT_TRUE(WasLogged(kPasswordModuleSymbol));
}

TEST_F(Password, ModuleRefusesABufferThatIsTooSmall) {
    const TaloPasswordModule* module =
        host::OpenPasswordModule(std::string(TALO_MODULE_DIR) + kPasswordModuleFile);
    ASSERT_NE(nullptr, module);
    char small[8] = "kept";
    EXPECT_EQ(0, module->newSetting(small, sizeof small));
    EXPECT_EQ(0, module->hash("secret", host::kDummyHash, small, sizeof small));
    EXPECT_STREQ("kept", small);
}

TEST_F(Password, ComparesWholeTexts) {
    EXPECT_TRUE(host::EqualInConstantTime("", ""));
    EXPECT_TRUE(host::EqualInConstantTime("abc", "abc"));
    EXPECT_FALSE(host::EqualInConstantTime("abc", "abd"));
    EXPECT_FALSE(host::EqualInConstantTime("abc", "xbc"));
    EXPECT_FALSE(host::EqualInConstantTime("abc", "ab"));
    EXPECT_FALSE(host::EqualInConstantTime("abc", "abcd"));
    EXPECT_FALSE(host::EqualInConstantTime(std::string("a\0b", 3), std::string("a\0c", 3)));
}

}  // namespace
