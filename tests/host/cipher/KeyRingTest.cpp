#include "hosts/linux/cipher/KeyRing.h"

#include "hosts/linux/cipher/Base64Url.h"
#include "tests/host/cipher/Vectors.h"

namespace {

const std::string kA(43, 'A');

TEST(KeyRing, ComesBackAsItWasWritten) {
    host::KeyRing ring;
    ring.current = KeyOf(1);
    ring.since = 1800000000;
    for (int turn = 0; turn < 2; ++turn) {
        host::KeyRing again;
        ASSERT_TRUE(host::ParseKeyRing(host::FormatKeyRing(ring), &again));
        EXPECT_EQ(again.current.secret.Text(), ring.current.secret.Text());
        EXPECT_EQ(again.current.half.Text(), ring.current.half.Text());
        EXPECT_EQ(again.since, ring.since);
        ASSERT_EQ(again.previous.has_value(), ring.previous.has_value());
        if (ring.previous) {
            EXPECT_EQ(again.previous->secret.Text(), ring.previous->secret.Text());
        }
        ring.previous = KeyOf(2);
    }
}

TEST(KeyRing, RefusesWhatItDidNotWrite) {
    const std::string head = "talo-cipher-keys 1\n";
    const std::string current = "current " + kA + " " + kA + " 5\n";
    const std::string previous = "previous " + kA + " " + kA + "\n";
    host::KeyRing ring;
    ASSERT_TRUE(host::ParseKeyRing(head + current + previous, &ring));
    const struct {
        const char* name;
        std::string content;
    } rows[] = {
        {"nothing", ""},
        {"the head alone", head},
        {"no head", current},
        {"another version", "talo-cipher-keys 2\n" + current},
        {"no end of line", head + current.substr(0, current.size() - 1)},
        {"no time", head + "current " + kA + " " + kA + "\n"},
        {"an empty time", head + "current " + kA + " " + kA + " \n"},
        {"a negative time", head + "current " + kA + " " + kA + " -5\n"},
        {"a huge time", head + "current " + kA + " " + kA + " 9999999999999\n"},
        {"a short key", head + "current " + kA.substr(1) + " " + kA + " 5\n"},
        {"a long key", head + "current " + kA + "AA " + kA + " 5\n"},
        {"a key that is no base64", head + "current " + kA + " " + std::string(43, '=') + " 5\n"},
        {"two blanks", head + "current  " + kA + " " + kA + " 5\n"},
        {"carriage returns", head + "current " + kA + " " + kA + " 5\r\n"},
        {"two current keys", head + current + current},
        {"the previous key only", head + previous},
        {"three keys", head + current + previous + previous},
        {"a previous key with a time", head + current + "previous " + kA + " " + kA + " 5\n"},
        {"an empty line behind", head + current + "\n"},
        {"a NUL behind", head + current + std::string(1, '\0')},
        {"zeros", std::string(200, '\0')},
    };
    for (const auto& row : rows) {
        host::KeyRing untouched;
        untouched.since = 77;
        EXPECT_FALSE(host::ParseKeyRing(row.content, &untouched)) << row.name;
        EXPECT_EQ(untouched.since, 77) << row.name;
    }
}

TEST(KeyRing, FindsAKeyByItsWholeId) {
    host::KeyRing ring;
    ring.current = KeyOf(1);
    const std::string id = host::KeyIdOf(ring.current.half);
    EXPECT_EQ(id.size(), 9u);
    EXPECT_EQ(host::FindKey(ring, id, 5), &ring.current);
    EXPECT_EQ(host::FindKey(ring, id.substr(1), 5), nullptr);
    EXPECT_EQ(host::FindKey(ring, "", 5), nullptr);
    EXPECT_EQ(host::FindKey(ring, host::KeyIdOf(KeyOf(2).half), 5), nullptr);
}

}  // namespace
