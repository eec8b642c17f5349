#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <functional>
#include <vector>

#include "tests/host/slice/SliceFixture.h"

using talo::SliceResult;

namespace {

class SideBySide : public SliceTest {
  protected:
    // Runs several processes at once and answers the sum of what they return.
    static int Together(int count, const std::function<int(int)>& body) {
        std::vector<pid_t> children;
        for (int number = 0; number < count; ++number) {
            const pid_t child = fork();
            if (child == 0) {
                _exit(body(number));
            }
            children.push_back(child);
        }
        int sum = 0;
        for (const pid_t child : children) {
            int status = 0;
            EXPECT_EQ(waitpid(child, &status, 0), child);
            EXPECT_TRUE(WIFEXITED(status));
            sum += WEXITSTATUS(status);
        }
        return sum;
    }
};

TEST_F(SideBySide, ASecondSliceIsToldThatTheUploadIsBusy) {
    const std::string id = Begin(10);
    {
        talo::SliceUpload first;
        ASSERT_EQ(first.Open(id, "mia"), SliceResult::kDone);
        const Input input("hello");
        talo::SliceUpload second;
        EXPECT_EQ(second.Open(id, "mia"), SliceResult::kBusy);
        EXPECT_EQ(second.Append(0, 5, ""), SliceResult::kNotFound);
        EXPECT_EQ(input.Taken(), 0u);
        EXPECT_EQ(second.Open(id, "tom"), SliceResult::kNotFound);
        EXPECT_EQ(OffsetOf(id), 0);
        EXPECT_EQ(first.Append(0, 5, ""), SliceResult::kDone);
        EXPECT_EQ(OffsetOf(id), 5);
    }
    EXPECT_EQ(Send(id, 5, "world"), SliceResult::kDone);
}

TEST_F(SideBySide, AnUploadThatIsHeldIsNotSwept) {
    const std::string id = Begin(10);
    {
        talo::SliceUpload upload;
        ASSERT_EQ(upload.Open(id, "mia"), SliceResult::kDone);
        LeaveUnused(id, 10 * 86400);
        MakeSweepDue();
        talo::SweepSliceUploads();
        EXPECT_EQ(Names().size(), 2u);
        EXPECT_EQ(Create("mia", 1), SliceResult::kDone);
        EXPECT_EQ(Names().size(), 4u);
    }
    MakeSweepDue();
    talo::SweepSliceUploads();
    EXPECT_EQ(Names().size(), 2u);
}

TEST_F(SideBySide, ManyClientsOfOneUploadMakeOneFile) {
    const std::string content = Content(400000);
    const std::string id = Begin(content.size());
    constexpr size_t kStep = 5000;
    const int failures = Together(8, [&](int) {
        for (int tries = 0; tries < 200000; ++tries) {
            const long long found = OffsetOf(id);
            if (found < 0) {
                return 1;
            }
            const size_t offset = static_cast<size_t>(found);
            if (offset == content.size()) {
                return 0;
            }
            const SliceResult result = Send(id, offset, content.substr(offset, kStep));
            if (result != SliceResult::kDone && result != SliceResult::kBusy &&
                result != SliceResult::kWrongOffset) {
                return 1;
            }
        }
        return 1;
    });
    EXPECT_EQ(failures, 0);
    EXPECT_TRUE(Read(DataPathOf(id)) == content);
}

TEST_F(SideBySide, NobodyGetsMoreUploadsThanHeMayHave) {
    Configure("slice_per_user=10\n");
    const int begun = Together(8, [&](int) {
        int mine = 0;
        for (int round = 0; round < 5; ++round) {
            mine += Create("mia", 1) == SliceResult::kDone ? 1 : 0;
        }
        return mine;
    });
    EXPECT_EQ(begun, 10);
    EXPECT_EQ(Names().size(), 20u);
}

TEST_F(SideBySide, OneOfManyCompletesAnUpload) {
    const std::string id = Begin(3);
    ASSERT_EQ(Send(id, 0, "abc"), SliceResult::kDone);
    const int completed = Together(8, [&](int number) {
        for (int tries = 0; tries < 200000; ++tries) {
            talo::SliceUpload upload;
            const SliceResult result = upload.Open(id, "mia");
            if (result == SliceResult::kBusy) {
                continue;
            }
            if (result != SliceResult::kDone || upload.File().complete) {
                return result == SliceResult::kDone ? 0 : 100;
            }
            const std::string taken = FolderPath() + "/../taken" + std::to_string(number);
            return rename(upload.DataPath().c_str(), taken.c_str()) == 0 && upload.Complete() ? 1
                                                                                              : 100;
        }
        return 100;
    });
    EXPECT_EQ(completed, 1);
}

}  // namespace
