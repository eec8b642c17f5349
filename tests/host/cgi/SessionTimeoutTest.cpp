#include <string>

#include "hosts/linux/cgi/SessionStore.h"
#include "tests/host/cgi/SessionFixture.h"

namespace {

TEST(HasTimedOut, CountsFromTheLastUse) {
    constexpr long long kNow = 1700000000;
    const struct {
        const char* what;
        int own;
        int given;
        long long unused;
        bool timedOut;
    } rows[] = {
        {"just used", 0, 30, 0, false},
        {"at the limit", 0, 30, 30 * 60, false},
        {"a second beyond", 0, 30, 30 * 60 + 1, true},
        {"long ago", 0, 30, kNow, true},
        {"its own minutes are more", 60, 30, 60 * 60, false},
        {"beyond its own minutes", 60, 30, 60 * 60 + 1, true},
        {"its own minutes are fewer", 1, 30, 61, true},
        {"at its own fewer minutes", 1, 30, 60, false},
        {"a year", 527040, 30, 527040LL * 60, false},
        {"beyond a year", 527040, 30, 527040LL * 60 + 1, true},
        {"a second in the future", 0, 30, -1, false},
        {"far in the future", 0, 30, -1000000000, false},
    };
    for (const auto& row : rows) {
        talo::Session session;
        session.timeout = row.own;
        session.lastUse = kNow - row.unused;
        EXPECT_EQ(host::HasTimedOut(session, row.given, kNow), row.timedOut) << row.what;
    }
}

class SessionTimeout : public SessionTest {
  protected:
    bool IsListedUnused(const std::string& id, long long seconds) {
        LeaveUnused(id, seconds);
        return talo::ListSessions().size() == 1;
    }
};

// Away from the limit by more than a slow machine takes.
TEST_F(SessionTimeout, FollowsTheFilesTimeOnBothSidesOfTheLimit) {
    const std::string id = Open();
    EXPECT_TRUE(IsListedUnused(id, 30 * 60 - 60));
    EXPECT_TRUE(talo::RenewSession(id));
    EXPECT_TRUE(IsListedUnused(id, -100000));
    EXPECT_FALSE(IsListedUnused(id, 30 * 60 + 60));
}

TEST_F(SessionTimeout, FollowsTheConfiguration) {
    host.Configure("session_timeout=\"5\"\n");
    EXPECT_EQ(talo::DefaultTimeout(), 5);
    const std::string id = Open();
    EXPECT_TRUE(IsListedUnused(id, 4 * 60));
    EXPECT_FALSE(IsListedUnused(id, 6 * 60));
}

TEST_F(SessionTimeout, IsTheSessionsOwnWhereItHasOne) {
    talo::Session session;
    session.user = "normal";
    session.timeout = 7 * 24 * 60;
    const std::string id = Open(session);
    EXPECT_TRUE(IsListedUnused(id, 6 * 24 * 3600));
    EXPECT_FALSE(IsListedUnused(id, 8 * 24 * 3600));
}

TEST_F(SessionTimeout, LeavesATimedOutSessionToBeFound) {
    const std::string id = Open();
    LeaveUnused(id, 100000);
    EXPECT_TRUE(Exists(id));
    EXPECT_TRUE(talo::EndSession(id));
}

}  // namespace
