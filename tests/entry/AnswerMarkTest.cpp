#include <sys/mman.h>
#include <sys/wait.h>
#include <unistd.h>

#include "tests/entry/EntryTest.h"

namespace {

using TALO::WebEntry;

// Serves one call in a process that watches, and answers what `Look` sees in the
// mark and in what has left meanwhile.
class AnswerMark : public EntryTest {
  protected:
    AnswerMark()
        : mark_(static_cast<volatile sig_atomic_t*>(mmap(nullptr, sizeof(sig_atomic_t),
                                                         PROT_READ | PROT_WRITE,
                                                         MAP_SHARED | MAP_ANONYMOUS, -1, 0))) {}
    ~AnswerMark() override {
        WebEntry::WatchAnswer(nullptr);
        (void)munmap(const_cast<sig_atomic_t*>(mark_), sizeof(sig_atomic_t));
    }

    volatile sig_atomic_t* mark_;
};

TEST_F(AnswerMark, IsSetByTheHeaderBlock) {
    Inside(GetMethod("echo"), [this](ProbeEntry& entry) {
        WebEntry::WatchAnswer(mark_);
        EXPECT_TRUE(entry.Initialize(Json::Value()));
        EXPECT_EQ(*mark_, 0);
        entry.OutputHeader();
        EXPECT_EQ(*mark_, 1);
    });
}

TEST_F(AnswerMark, IsNotSetByAMethodThatAnswersThroughTheResponse) {
    Inside(GetMethod("echo"), [this](ProbeEntry& entry) {
        WebEntry::WatchAnswer(mark_);
        EXPECT_TRUE(entry.Initialize(Json::Value()));
        EXPECT_EQ(entry.Process(entry.request, entry.response), 1);
        EXPECT_EQ(*mark_, 0);
    });
}

TEST_F(AnswerMark, IsSetBeforeAMethodThatMayAnswerByItself) {
    Inside(GetMethod("download"), [this](ProbeEntry& entry) {
        WebEntry::WatchAnswer(mark_);
        EXPECT_TRUE(entry.Initialize(Json::Value()));
        EXPECT_EQ(*mark_, 0);
        (void)entry.Process(entry.request, entry.response);
        EXPECT_EQ(*mark_, 1);
    });
}

TEST_F(AnswerMark, IsNotSetWhereSuchAMethodIsRefused) {
    Inside(GetMethod("download").With("QUERY_STRING", "api=Test.Entry&version=9&method=download"),
           [this](ProbeEntry& entry) {
               WebEntry::WatchAnswer(mark_);
               EXPECT_TRUE(entry.Initialize(Json::Value()));
               EXPECT_EQ(entry.Process(entry.request, entry.response), 0);
               EXPECT_EQ(*mark_, 0);
           });
}

TEST_F(AnswerMark, IsSetByAWholeRequest) {
    for (const char* method : {"echo", "throwing", "unknown"}) {
        *mark_ = 0;
        Inside(GetMethod(method), [this](ProbeEntry& entry) {
            WebEntry::WatchAnswer(mark_);
            (void)entry.Run(Json::Value());
        });
        EXPECT_EQ(*mark_, 1) << method;
    }
}

TEST_F(AnswerMark, IsLeftAloneOnceItWasTakenBack) {
    Inside(GetMethod("echo"), [this](ProbeEntry& entry) {
        WebEntry::WatchAnswer(mark_);
        WebEntry::WatchAnswer(nullptr);
        (void)entry.Run(Json::Value());
        EXPECT_EQ(*mark_, 0);
    });
}

TEST_F(AnswerMark, IsLeftToItsLenderToClear) {
    *mark_ = 1;
    WebEntry::WatchAnswer(mark_);
    EXPECT_EQ(*mark_, 1);
}

TEST_F(AnswerMark, IsNotSetByAForkedProcess) {
    Inside(GetMethod("echo"), [this](ProbeEntry& entry) {
        WebEntry::WatchAnswer(mark_);
        const pid_t child = fork();
        if (child == 0) {
            entry.OutputHeader();
            _exit(0);
        }
        ASSERT_EQ(waitpid(child, nullptr, 0), child);
        EXPECT_EQ(*mark_, 0);
    });
}

}  // namespace
