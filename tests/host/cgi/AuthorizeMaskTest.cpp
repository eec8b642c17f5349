#include <string>

#include "tests/host/cgi/Authorization.h"

namespace {

// Every mask in every situation, and what the first failed check answers: the
// address comes before the site, and the site before the age.
class AuthorizeMask : public AuthorizationTest {
  protected:
    struct Situation {
        bool moved;
        bool elsewhere;
        bool old;
    };

    static int Expected(int mask, const Situation& situation, bool allowTimeout) {
        if ((mask & 2) != 0 && situation.moved) {
            return -3;
        }
        if ((mask & 8) != 0 && situation.elsewhere) {
            return -4;
        }
        return (mask & 4) != 0 && situation.old && !allowTimeout ? -1 : 1;
    }

    void ComeAbout(const Situation& situation, const std::string& id) {
        host.Say("REMOTE_ADDR", situation.moved ? "203.0.113.5" : "192.0.2.1");
        host.Say("HTTP_ORIGIN", situation.elsewhere ? "http://evil.example" : "http://nas.local");
        LeaveUnused(id, situation.old ? 31 * 60 : 0);
    }

    void ExpectAllMasks(const std::string& id, const Situation& situation, int allowTimeout) {
        for (int mask = 0; mask <= kAll; ++mask) {
            Prepare();
            const int expected = Expected(mask, situation, allowTimeout != 0);
            EXPECT_EQ(Ask(id, mask, allowTimeout), expected)
                << "mask " << mask << (situation.moved ? ", moved" : "")
                << (situation.elsewhere ? ", elsewhere" : "") << (situation.old ? ", old" : "");
            if (expected < 0) {
                EXPECT_TRUE(IsUntouched()) << mask;
            } else {
                EXPECT_STREQ(name, "normal");
                EXPECT_EQ(ctx.sessionFile, PathOf(id));
            }
        }
    }
};

TEST_F(AuthorizeMask, ChecksWhatItAsksForAndInOneOrder) {
    const std::string id = Open();
    for (const bool moved : {false, true}) {
        for (const bool elsewhere : {false, true}) {
            for (const bool old : {false, true}) {
                const Situation situation = {moved, elsewhere, old};
                ComeAbout(situation, id);
                ExpectAllMasks(id, situation, 0);
                ExpectAllMasks(id, situation, 1);
            }
        }
    }
}

TEST_F(AuthorizeMask, LooksForTheSessionWhateverItIs) {
    for (int mask = 0; mask <= kAll; ++mask) {
        EXPECT_EQ(Ask(UnusedId(), mask, 1), -2) << mask;
        EXPECT_TRUE(IsUntouched()) << mask;
    }
}

TEST_F(AuthorizeMask, LooksForTheAccountWhateverItIs) {
    const std::string id = Open("nobody");
    for (int mask = 0; mask <= kAll; ++mask) {
        EXPECT_EQ(Ask(id, mask, 1), -6) << mask;
        EXPECT_TRUE(IsUntouched()) << mask;
    }
}

}  // namespace
