#include <cstring>
#include <filesystem>
#include <string>

#include "platform/Cgi.h"
#include "platform/Paths.h"
#include "tests/host/cgi/SessionFixture.h"

namespace {

class Context : public SessionTest {
  protected:
    Context() {
        std::memset(&ctx, 0, sizeof ctx);
    }
    ~Context() override {
        TaloCgiFree(&ctx);
    }

    bool IsZero() const {
        TALOCGI zero;
        std::memset(&zero, 0, sizeof zero);
        return std::memcmp(&zero, &ctx, sizeof ctx) == 0;
    }

    TALOCGI ctx;
};

TEST_F(Context, KnowsTheHostsSettings) {
    ASSERT_EQ(TaloCgiInit("prefix", &ctx), 0);
    EXPECT_EQ(ctx.sessionDir, std::filesystem::canonical(TALO_SESSION_DIR).string());
    EXPECT_NE(ctx.sessionDir[std::strlen(ctx.sessionDir) - 1], '/');
    EXPECT_STREQ(ctx.sessionFile, "");
    EXPECT_EQ(ctx.defaultTimeout, 30);
    EXPECT_EQ(ctx.skipIPCheck, 0);
    EXPECT_EQ(ctx.paramHash, nullptr);
}

TEST_F(Context, FollowsTheConfiguration) {
    host.Configure("session_timeout=\"12\"\nskip_ip_check=\"yes\"\n");
    ASSERT_EQ(TaloCgiInit(nullptr, &ctx), 0);
    EXPECT_EQ(ctx.defaultTimeout, 12);
    EXPECT_EQ(ctx.skipIPCheck, 1);
}

TEST_F(Context, IsExemptFromTheAddressCheckByYesOnly) {
    for (const char* value : {"no", "", "1", "true", "YES", "yes please"}) {
        host.Configure("skip_ip_check=\"" + std::string(value) + "\"\n");
        ASSERT_EQ(TaloCgiInit("", &ctx), 0);
        EXPECT_EQ(ctx.skipIPCheck, 0) << value;
        TaloCgiFree(&ctx);
    }
}

TEST_F(Context, TakesItsTimeoutFromWhoeverHasNoEntry) {
    ASSERT_EQ(TaloCgiInitEx(&ctx, 77, 0, "current.users", ""), 0);
    EXPECT_EQ(ctx.defaultTimeout, 77);
    TaloCgiFree(&ctx);
    ASSERT_EQ(TaloCgiInitEx(&ctx, 0, 0, "current.users", nullptr), 0);
    EXPECT_EQ(ctx.defaultTimeout, 30);
}

TEST_F(Context, KnowsOneClassOfUsers) {
    for (const char* userClass : {static_cast<const char*>(nullptr), "", "all.users", "current"}) {
        EXPECT_EQ(TaloCgiInitEx(&ctx, 30, 0, userClass, ""), -1);
        TaloCgiFree(&ctx);
    }
    EXPECT_EQ(TaloCgiInit("", nullptr), -1);
    EXPECT_EQ(TaloCgiInitEx(nullptr, 30, 0, "current.users", ""), -1);
}

TEST_F(Context, IsZeroAgainAfterItsEnd) {
    ASSERT_EQ(TaloCgiInit("", &ctx), 0);
    host.Say("HTTP_COOKIE", "id=A");
    EXPECT_EQ(TaloCgiLoadInCookies(&ctx), 0);
    TaloCgiFree(&ctx);
    EXPECT_TRUE(IsZero());
    TaloCgiFree(&ctx);
    EXPECT_TRUE(IsZero());
    TaloCgiFree(nullptr);
}

}  // namespace
