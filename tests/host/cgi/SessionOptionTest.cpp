#include <string>

#include "tests/host/cgi/Authorization.h"

namespace {

enum { kSkipAddress = 1, kPrivilege = 6, kApplication = 7, kTimeout = 10 };

class SessionOption : public AuthorizationTest {
  protected:
    void Find(const talo::Session& session) {
        ASSERT_EQ(Ask(Open(session), 1), 1);
    }
    std::string Option(int option) {
        return TaloCgiGetOption(&ctx, option, "fallback");
    }

    static talo::Session Plain() {
        talo::Session session;
        session.user = "normal";
        return session;
    }
};

TEST_F(SessionOption, AnswersWhatTheSessionSays) {
    talo::Session session = Plain();
    session.skipAddress = true;
    session.privilege = "photo,video";
    session.application = "photo";
    session.timeout = 45;
    session.language = "fre";
    Find(session);
    EXPECT_EQ(Option(kSkipAddress), "1");
    EXPECT_EQ(Option(kPrivilege), "photo,video");
    EXPECT_EQ(Option(kApplication), "photo");
    EXPECT_EQ(Option(kTimeout), "45");
    EXPECT_STREQ(TaloCgiGetLang(&ctx), "fre");
}

TEST_F(SessionOption, AnswersTheFallbackForWhatIsUnset) {
    Find(Plain());
    for (const int option : {kSkipAddress, kPrivilege, kApplication, kTimeout}) {
        EXPECT_EQ(Option(option), "fallback") << option;
        EXPECT_EQ(TaloCgiGetOption(&ctx, option, nullptr), nullptr) << option;
    }
    EXPECT_STREQ(TaloCgiGetLang(&ctx), "enu");
}

TEST_F(SessionOption, KnowsNoOthers) {
    talo::Session session = Plain();
    session.privilege = session.application = session.language = "set";
    Find(session);
    for (const int option : {-1, 0, 2, 3, 4, 5, 8, 9, 11, 2147483647}) {
        EXPECT_EQ(Option(option), "fallback") << option;
    }
}

TEST_F(SessionOption, IsTheFallbackBeforeASessionWasFound) {
    EXPECT_EQ(Option(kApplication), "fallback");
    EXPECT_STREQ(TaloCgiGetLang(&ctx), "enu");
    EXPECT_STREQ(TaloCgiGetOption(nullptr, kApplication, "fallback"), "fallback");
    EXPECT_STREQ(TaloCgiGetLang(nullptr), "enu");
}

TEST_F(SessionOption, IsThatOfTheSessionFoundLast) {
    talo::Session session = Plain();
    session.application = "first";
    session.timeout = 1;
    Find(session);
    session.application = "";
    session.timeout = 0;
    Find(session);
    EXPECT_EQ(Option(kApplication), "fallback");
    EXPECT_EQ(Option(kTimeout), "fallback");
    session.application = "third";
    Find(session);
    EXPECT_EQ(Option(kApplication), "third");
    EXPECT_EQ(Ask(UnusedId(), 1), -2);
    EXPECT_EQ(Option(kApplication), "third");
}

}  // namespace
