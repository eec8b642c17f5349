#include <fcntl.h>
#include <signal.h>
#include <sys/ioctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>

#include "tests/host/slice/SliceFixture.h"

using talo::SliceResult;

namespace {

// A process that appends what its pipe brings, up to the end of the upload.
class Appender {
  public:
    Appender(const std::string& id, unsigned long long offset, unsigned long long bytes) {
        int ends[2];
        if (pipe2(ends, O_CLOEXEC) != 0) {
            abort();
        }
        child_ = fork();
        if (child_ == 0) {
            (void)dup2(ends[0], STDIN_FILENO);
            (void)close(ends[0]);
            (void)close(ends[1]);
            talo::SliceUpload upload;
            const bool done = upload.Open(id, "mia") == SliceResult::kDone &&
                              upload.Append(offset, bytes, "") == SliceResult::kDone;
            _exit(done ? 0 : 1);
        }
        input_ = ends[1];
        (void)close(ends[0]);
    }
    ~Appender() {
        (void)close(input_);
        if (child_ > 0) {
            (void)waitpid(child_, nullptr, 0);
        }
    }

    void Feed(const std::string& content) const {
        for (size_t fed = 0; fed < content.size();) {
            const ssize_t put = write(input_, content.data() + fed, content.size() - fed);
            ASSERT_GT(put, 0);
            fed += static_cast<size_t>(put);
        }
    }

    // Until the child has taken all that it was fed; it may still be writing.
    void WaitUntilTaken() const {
        int left = 1;
        for (int tries = 0; left > 0 && tries < 20000; ++tries) {
            ASSERT_EQ(ioctl(input_, FIONREAD, &left), 0);
            if (left > 0) {
                usleep(500);
            }
        }
        ASSERT_EQ(left, 0);
    }

    void Kill() {
        (void)kill(child_, SIGKILL);
        int status = 0;
        EXPECT_EQ(waitpid(child_, &status, 0), child_);
        EXPECT_TRUE(WIFSIGNALED(status));
        child_ = 0;
    }

  private:
    pid_t child_;
    int input_;
};

class Kill : public SliceTest {};

TEST_F(Kill, InTheMiddleOfASliceKeepsWhatArrivedAndTheRestFollows) {
    const std::string content = Content(3000000);
    const std::string id = Begin(content.size());
    size_t offset = 0;
    for (const size_t arrives :
         {0u, 1u, 100u, 65535u, 65536u, 65537u, 262144u, 700000u, 1000000u}) {
        Appender appender(id, offset, content.size() - offset);
        appender.Feed(content.substr(offset, arrives));
        appender.WaitUntilTaken();
        appender.Kill();
        const long long found = OffsetOf(id);
        ASSERT_GE(found, offset) << arrives;
        ASSERT_LE(found, offset + arrives);
        offset = static_cast<size_t>(found);
        ASSERT_TRUE(Read(DataPathOf(id)) == content.substr(0, offset)) << arrives;
    }
    EXPECT_GT(offset, 0u);
    EXPECT_EQ(Send(id, offset, content.substr(offset)), SliceResult::kDone);
    EXPECT_TRUE(Read(DataPathOf(id)) == content);
}

TEST_F(Kill, WhileTheClientIsStillSendingLosesNothingThatWasAcknowledged) {
    const std::string content = Content(1000000);
    const std::string id = Begin(content.size());
    ASSERT_EQ(Send(id, 0, content.substr(0, 500000)), SliceResult::kDone);
    for (int round = 0; round < 5; ++round) {
        const long long before = OffsetOf(id);
        ASSERT_GE(before, 500000);
        const size_t offset = static_cast<size_t>(before);
        Appender appender(id, offset, content.size() - offset);
        appender.Feed(content.substr(offset, 50000));
        appender.Kill();
        ASSERT_GE(OffsetOf(id), before);
    }
    const size_t offset = static_cast<size_t>(OffsetOf(id));
    EXPECT_TRUE(Read(DataPathOf(id)) == content.substr(0, offset));
    EXPECT_EQ(Send(id, offset, content.substr(offset)), SliceResult::kDone);
    EXPECT_TRUE(Read(DataPathOf(id)) == content);
}

TEST_F(Kill, LeavesTheUploadToTheNextSliceAtOnce) {
    const std::string id = Begin(10);
    Appender appender(id, 0, 10);
    appender.Feed("abc");
    appender.WaitUntilTaken();
    appender.Kill();
    talo::SliceUpload upload;
    EXPECT_EQ(upload.Open(id, "mia"), SliceResult::kDone);
}

}  // namespace
