#include "hosts/linux/cipher/SeenLines.h"

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cstring>
#include <filesystem>
#include <set>

#include "tests/host/cipher/Vectors.h"
#include "tests/support/Child.h"
#include "tests/support/TempFolder.h"

namespace {

namespace fs = std::filesystem;
using host::Seen;

constexpr long long kNow = 1800000300;  // the middle of a file's ten minutes

// Nonces of one bucket, all different.
host::LineContent Line(unsigned number, long long time = kNow) {
    host::LineContent content;
    std::memcpy(content.nonce.bytes, &number, sizeof number);
    content.nonce.bytes[8] = 1;
    content.time = time;
    return content;
}

class SeenLines : public ::testing::Test {
  protected:
    Seen Note(const host::LineContent& content, long long now = kNow, long long started = 0) const {
        return host::NoteLine(Dir(), content, now, started);
    }
    std::string Dir() const {
        return folder_.Path("run/cipher");
    }
    std::set<std::string> Names() const {
        std::set<std::string> names;
        for (const auto& entry : fs::directory_iterator(Dir())) {
            names.insert(entry.path().filename());
        }
        return names;
    }
    static std::string NameOf(long long time) {
        return "seen." + std::to_string(time / 600);
    }

    support::TempFolder folder_;
};

TEST_F(SeenLines, TakeALineOnce) {
    EXPECT_EQ(Note(Line(1)), Seen::kFirst);
    EXPECT_EQ(Note(Line(1)), Seen::kBefore);
    EXPECT_EQ(Note(Line(2)), Seen::kFirst);
    EXPECT_EQ(Note(Line(1)), Seen::kBefore);
    EXPECT_EQ(Note(Line(2), kNow + 599), Seen::kBefore);
}

TEST_F(SeenLines, TellNoncesApartByEveryBit) {
    host::LineContent line = Line(1);
    ASSERT_EQ(Note(line), Seen::kFirst);
    for (size_t bit = 0; bit < 128; ++bit) {
        host::LineContent other = line;
        other.nonce.bytes[bit / 8] ^= static_cast<unsigned char>(1 << bit % 8);
        EXPECT_EQ(Note(other), Seen::kFirst) << bit;
        EXPECT_EQ(Note(other), Seen::kBefore) << bit;
    }
    EXPECT_EQ(Note(line), Seen::kBefore);
}

TEST_F(SeenLines, TakeClocksThatDifferByTenMinutes) {
    EXPECT_EQ(Note(Line(1, kNow - 600)), Seen::kFirst);
    EXPECT_EQ(Note(Line(2, kNow + 600)), Seen::kFirst);
    EXPECT_EQ(Note(Line(3, kNow - 601)), Seen::kOutOfTime);
    EXPECT_EQ(Note(Line(4, kNow + 601)), Seen::kOutOfTime);
    EXPECT_EQ(Note(Line(5, 0)), Seen::kOutOfTime);
    EXPECT_EQ(Note(Line(6, 0), 100), Seen::kOutOfTime);
    EXPECT_EQ(Note(Line(1, kNow - 600)), Seen::kBefore);
    EXPECT_EQ(Note(Line(2, kNow + 600)), Seen::kBefore);
}

// A line from ahead stays known until it is too old.
TEST_F(SeenLines, AreKnownAsLongAsTheyCouldCount) {
    const host::LineContent line = Line(1, kNow + 600);
    ASSERT_EQ(Note(line), Seen::kFirst);
    for (long long now = kNow; now <= kNow + 1200; now += 100) {
        EXPECT_EQ(Note(line, now), Seen::kBefore) << now;
        EXPECT_EQ(Note(Line(static_cast<unsigned>(now), now), now), Seen::kFirst);
    }
    EXPECT_EQ(Note(line, kNow + 1201), Seen::kOutOfTime);
}

TEST_F(SeenLines, FromBeforeTheMachineWasStartedDoNotCount) {
    EXPECT_EQ(Note(Line(1, kNow - 10), kNow, kNow - 9), Seen::kOutOfTime);
    EXPECT_EQ(Note(Line(1, kNow - 10), kNow, kNow - 10), Seen::kFirst);
}

TEST_F(SeenLines, MachineStartIsInThePastAndStaysThere) {
    const long long start = host::MachineStart(kNow);
    EXPECT_LT(start, kNow);
    EXPECT_NEAR(static_cast<double>(host::MachineStart(kNow + 1000) - start), 1000.0, 60.0);
}

TEST_F(SeenLines, ANonceOfZerosNeverCounts) {
    host::LineContent line;
    line.time = kNow;
    EXPECT_NE(Note(line), Seen::kFirst);
}

TEST_F(SeenLines, AreKeptForNobodyElse) {
    ASSERT_EQ(Note(Line(1)), Seen::kFirst);
    struct stat facts = {};
    ASSERT_EQ(stat(Dir().c_str(), &facts), 0);
    EXPECT_EQ(facts.st_mode & 07777, 0700u);
    ASSERT_EQ(stat((Dir() + "/" + NameOf(kNow)).c_str(), &facts), 0);
    EXPECT_EQ(facts.st_mode & 07777, 0600u);
    EXPECT_EQ(facts.st_size, 4 << 20);
    EXPECT_LE(facts.st_blocks * 512, 64 << 10);  // a file without content takes no space
}

TEST_F(SeenLines, OldFilesGoWhenANewOneBegins) {
    ASSERT_EQ(Note(Line(1)), Seen::kFirst);
    for (long long now = kNow; now < kNow + 36000; now += 600) {
        ASSERT_EQ(Note(Line(2, now), now), Seen::kFirst);
        EXPECT_LE(Names().size(), 5u);
    }
    EXPECT_EQ(Names().count(NameOf(kNow)), 0u);
}

TEST_F(SeenLines, OtherFilesAreLeftAlone) {
    ASSERT_EQ(Note(Line(1)), Seen::kFirst);
    const std::set<std::string> others = {"seen.", "seen.1x", "seen.-1",
                                          "other", "xseen.1", "seen.1234567890123"};
    for (const std::string& name : others) {
        (void)folder_.Write("run/cipher/" + name, "x");
    }
    (void)folder_.Write("run/cipher/seen.1", "x");
    ASSERT_EQ(Note(Line(2, kNow + 600), kNow + 600), Seen::kFirst);
    const std::set<std::string> names = Names();
    EXPECT_TRUE(std::includes(names.begin(), names.end(), others.begin(), others.end()));
    EXPECT_EQ(names.count("seen.1"), 0u);
}

TEST_F(SeenLines, AFullBucketRefusesAndForgetsNothing) {
    for (unsigned number = 0; number < host::kSeenPlaces; ++number) {
        ASSERT_EQ(Note(Line(number)), Seen::kFirst) << number;
    }
    EXPECT_EQ(Note(Line(host::kSeenPlaces)), Seen::kTrouble);
    EXPECT_EQ(Note(Line(0)), Seen::kBefore);
    EXPECT_EQ(Note(Line(host::kSeenPlaces - 1)), Seen::kBefore);
    // The other buckets go on, and so does the next file.
    host::LineContent other = Line(0);
    other.nonce.bytes[15] = 1;
    EXPECT_EQ(Note(other), Seen::kFirst);
    EXPECT_EQ(Note(Line(host::kSeenPlaces, kNow + 600)), Seen::kFirst);
}

// All try the same lines at the same time: together they take each line once.
TEST_F(SeenLines, OneOfManyProcessesIsTheFirst) {
    constexpr unsigned kLines = 1000;
    ASSERT_EQ(Note(Line(kLines)), Seen::kFirst);
    const support::ChildResult child = support::InChild([&] {
        int gate[2];
        if (pipe(gate) != 0) {
            return 1;
        }
        for (int number = 0; number < 8; ++number) {
            if (fork() == 0) {
                char wait = 0;
                (void)close(gate[1]);
                (void)!read(gate[0], &wait, 1);  // until the parent has gone
                std::string firsts;
                for (unsigned line = 0; line < kLines; ++line) {
                    firsts += Note(Line(line)) == Seen::kFirst ? "F" : "";
                }
                (void)!write(STDOUT_FILENO, firsts.data(), firsts.size());
                _exit(0);
            }
        }
        return 0;
    });
    ASSERT_EQ(child.status, 0);
    EXPECT_EQ(child.output, std::string(kLines, 'F'));
}

TEST_F(SeenLines, ThatCannotBeKeptDoNotCount) {
    ASSERT_EQ(Note(Line(1)), Seen::kFirst);
    ASSERT_EQ(chmod(Dir().c_str(), 0777), 0);
    EXPECT_EQ(Note(Line(2)), Seen::kTrouble);
    ASSERT_EQ(chmod(Dir().c_str(), 0700), 0);
    const std::string file = Dir() + "/" + NameOf(kNow);
    ASSERT_EQ(chmod(file.c_str(), 0666), 0);
    EXPECT_EQ(Note(Line(2)), Seen::kTrouble);
    fs::remove(file);
    fs::create_directory(file);
    EXPECT_EQ(Note(Line(2)), Seen::kTrouble);
    fs::remove(file);
    fs::create_symlink(folder_.Write("elsewhere", ""), file);
    EXPECT_EQ(Note(Line(2)), Seen::kTrouble);
    fs::remove_all(Dir());
    (void)folder_.Write("run/cipher", "a file");
    EXPECT_EQ(Note(Line(2)), Seen::kTrouble);
}

}  // namespace
