#include <signal.h>
#include <stdio.h>
#include <sys/wait.h>
#include <unistd.h>

#include "PlaceFixture.h"

using talo::FileError;

namespace {

constexpr int kRounds = 10000;

// A process that swaps, as fast as it can, the folder "swap" of the share for a
// link that leads outside, and back.
class Race : public BothResolvers {
  public:
    void SetUp() override {
        BothResolvers::SetUp();
        Write("swap/secret", "inside");
        Link("link", Outside(""));
        swapper_ = fork();
        if (swapper_ == 0) {
            SwapForEver();
        }
    }

    void TearDown() override {
        (void)kill(swapper_, SIGKILL);
        (void)waitpid(swapper_, nullptr, 0);
        BothResolvers::TearDown();
    }

  private:
    [[noreturn]] void SwapForEver() const {
        const std::string swap = InShare("swap");
        const std::string link = InShare("link");
        for (;;) {
            (void)renameat2(-1, swap.c_str(), -1, link.c_str(), RENAME_EXCHANGE);
        }
    }

    pid_t swapper_ = -1;
};

TEST_P(Race, NeverReadsWhatIsOutside) {
    int read = 0;
    int refused = 0;
    for (int round = 0; round < kRounds; ++round) {
        const std::string content = Read("swap/secret");
        ASSERT_NE("SECRET", content);
        (content == "inside" ? read : refused) += 1;
    }
    // Both states were met, so that there was something to win.
    EXPECT_GT(read, 0);
    EXPECT_GT(refused, 0);
}

TEST_P(Race, NeverChangesWhatIsOutside) {
    int made = 0;
    for (int round = 0; round < kRounds; ++round) {
        talo::Place folder;
        talo::Place renamed;
        At("swap/new", &folder);
        At("swap/newer", &renamed);
        made += folder.MakeFolder() == FileError::kNone ? 1 : 0;
        (void)folder.Rename(renamed, false);
        (void)folder.Remove();
        (void)renamed.Remove();
    }
    EXPECT_GT(made, 0);
    ExpectOutsideUntouched();
}

TEST_P(Race, NeverShowsOrRemovesATreeOutside) {
    int shown = 0;
    for (int round = 0; round < kRounds / 10; ++round) {
        talo::Place place;
        At("", &place);
        (void)place.Walk(true, [&](const talo::TreeEntry& entry) {
            if (entry.file >= 0) {
                char first = '\0';
                EXPECT_EQ(1, ::read(entry.file, &first, 1));
                EXPECT_EQ('i', first);
                ++shown;
            }
            return true;
        });
        talo::Place tree;
        At("swap", &tree);
        (void)tree.RemoveTree([](const talo::TreeEntry&) { return true; });
        Write("fresh/secret", "inside");
        (void)rename(InShare("fresh").c_str(), InShare("swap").c_str());
    }
    EXPECT_GT(shown, 0);
    ExpectOutsideUntouched();
}

INSTANTIATE_TEST_SUITE_P(Kernel, Race, ::testing::Values(false));
INSTANTIATE_TEST_SUITE_P(Walk, Race, ::testing::Values(true));

}  // namespace
