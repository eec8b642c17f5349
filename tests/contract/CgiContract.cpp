#include <stdlib.h>

#include <cstring>
#include <string>
#include <vector>

#include "platform/Cgi.h"
#include "tests/contract/World.h"

namespace {

bool IsZero(const TALOCGI& ctx) {
    const TALOCGI zero = {};
    return std::memcmp(&ctx, &zero, sizeof ctx) == 0;
}

class CgiContext : public Contract {
  protected:
    ~CgiContext() override {
        (void)unsetenv("HTTP_COOKIE");
    }
};

TEST_F(CgiContext, LivesFromInitToFree) {
    for (const char* prefix : {"", "entry"}) {
        TALOCGI ctx;
        std::memset(&ctx, 0, sizeof ctx);
        EXPECT_EQ(TaloCgiInit(prefix, &ctx), 0);
        EXPECT_STREQ(ctx.sessionFile, "");
        EXPECT_EQ(ctx.paramHash, nullptr);
        TaloCgiFree(&ctx);
        EXPECT_TRUE(IsZero(ctx));
        TaloCgiFree(&ctx);
        EXPECT_TRUE(IsZero(ctx));
    }
    TaloCgiFree(nullptr);
}

TEST_F(CgiContext, LoadsWhateverTheCookieHeaderIs) {
    TALOCGI ctx;
    std::memset(&ctx, 0, sizeof ctx);
    ASSERT_EQ(TaloCgiInit("", &ctx), 0);
    (void)unsetenv("HTTP_COOKIE");
    EXPECT_EQ(TaloCgiLoadInCookies(&ctx), 0);
    for (const std::string& header :
         {std::string(), std::string("id=A"), std::string("id=A; lang=en"), std::string(";;=;="),
          std::string("no equals"), std::string("id=%00%FF%"), std::string("\xFF=\xFE"),
          std::string(70000, ';'), std::string(70000, '=')}) {
        (void)setenv("HTTP_COOKIE", header.c_str(), 1);
        EXPECT_EQ(TaloCgiLoadInCookies(&ctx), 0) << header.substr(0, 40);
    }
    TaloCgiFree(&ctx);
}

TEST_F(CgiContext, LoadsNothingIntoAContextThatWasNotPrepared) {
    TALOCGI ctx;
    std::memset(&ctx, 0, sizeof ctx);
    EXPECT_LT(TaloCgiLoadInCookies(&ctx), 0);
}

TEST_F(CgiContext, LeavesAPlainParameterLineAsItIs) {
    for (const char* line : {"", "a=1&b=2", "{\"a\":1}", "%41=%zz", "\xFF\xFE", "&&&"}) {
        std::vector<char> copy(line, line + std::strlen(line) + 1);
        EXPECT_NE(TaloCgiDetectAndDecryptParamLine(copy.data()), 0) << line;
        EXPECT_STREQ(copy.data(), line);
    }
}

}  // namespace
