#include <fcntl.h>
#include <sys/mman.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <limits>

#include "tests/host/slice/SliceFixture.h"
#include "tests/support/Child.h"

using talo::SliceResult;

namespace {

class Append : public SliceTest {};

TEST_F(Append, MakesTheFileOutOfSlicesOfAnySize) {
    for (const size_t step : {1u, 7u, 4096u, 65536u, 262144u, 262145u, 700001u}) {
        const std::string content = Content(step < 4096 ? 100 : 1000003);
        const std::string id = Begin(content.size());
        for (size_t offset = 0; offset < content.size(); offset += step) {
            const std::string slice = content.substr(offset, step);
            ASSERT_EQ(Send(id, offset, slice), SliceResult::kDone) << step;
            ASSERT_EQ(OffsetOf(id), offset + slice.size());
        }
        EXPECT_TRUE(Read(DataPathOf(id)) == content) << step;
    }
}

TEST_F(Append, ReadsNothingBehindTheSlice) {
    const std::string id = Begin(100);
    const Input input(Content(100));
    talo::SliceUpload upload;
    ASSERT_EQ(upload.Open(id, "mia"), SliceResult::kDone);
    EXPECT_EQ(upload.Append(0, 10, ""), SliceResult::kDone);
    EXPECT_EQ(input.Taken(), 10u);
    EXPECT_EQ(upload.Append(10, 20, ""), SliceResult::kDone);
    EXPECT_EQ(input.Taken(), 30u);
    EXPECT_EQ(upload.Offset(), 30u);
    EXPECT_EQ(Read(DataPathOf(id)), Content(30));
}

TEST_F(Append, TakesAnEmptySliceAtItsPlace) {
    const std::string id = Begin(10);
    EXPECT_EQ(Send(id, 0, ""), SliceResult::kDone);
    EXPECT_EQ(Send(id, 0, "0123456789"), SliceResult::kDone);
    EXPECT_EQ(Send(id, 10, ""), SliceResult::kDone);
    EXPECT_EQ(Send(id, 9, ""), SliceResult::kWrongOffset);
    EXPECT_EQ(OffsetOf(id), 10);
}

struct RefusedRow {
    const char* name;
    unsigned long long offset;
    unsigned long long bytes;
    SliceResult result;
};

constexpr unsigned long long kMost = std::numeric_limits<unsigned long long>::max();
const RefusedRow kRefused[] = {
    {"the beginning again", 0, 5, SliceResult::kWrongOffset},
    {"one too early", 4, 5, SliceResult::kWrongOffset},
    {"one too late", 6, 4, SliceResult::kWrongOffset},
    {"the end", 10, 0, SliceResult::kWrongOffset},
    {"behind the end", 11, 1, SliceResult::kWrongOffset},
    {"the largest offset", kMost, 1, SliceResult::kWrongOffset},
    {"an offset that overflows with its bytes", kMost - 4, 5, SliceResult::kWrongOffset},
    {"a wrong offset and too many bytes", 4, 100, SliceResult::kWrongOffset},
    {"one byte too many", 5, 6, SliceResult::kTooLong},
    {"the whole file once more", 5, 10, SliceResult::kTooLong},
    {"bytes that overflow", 5, kMost - 4, SliceResult::kTooLong},
    {"the most bytes", 5, kMost, SliceResult::kTooLong},
};

TEST_F(Append, RefusesWhatDoesNotFitAndReadsNothingOfIt) {
    const std::string id = Begin(10);
    ASSERT_EQ(Send(id, 0, "01234"), SliceResult::kDone);
    for (const RefusedRow& row : kRefused) {
        const Input input("abcdefghij");
        talo::SliceUpload upload;
        ASSERT_EQ(upload.Open(id, "mia"), SliceResult::kDone) << row.name;
        EXPECT_EQ(upload.Append(row.offset, row.bytes, ""), row.result) << row.name;
        EXPECT_EQ(upload.Offset(), 5u) << row.name;
        EXPECT_EQ(input.Taken(), 0u) << row.name;
        EXPECT_EQ(Read(DataPathOf(id)), "01234") << row.name;
    }
    EXPECT_EQ(Send(id, 5, "56789"), SliceResult::kDone);
}

TEST_F(Append, KeepsWhatArrivedOfASliceThatIsCutOff) {
    const std::string content = Content(600000);
    const std::string id = Begin(content.size());
    size_t offset = 0;
    for (const size_t arrives : {size_t{0}, size_t{1}, size_t{262144}, size_t{300000}}) {
        ASSERT_EQ(SendPart(id, offset, content.substr(offset, arrives), content.size() - offset),
                  SliceResult::kCut);
        offset += arrives;
        ASSERT_EQ(OffsetOf(id), offset);
    }
    EXPECT_EQ(Send(id, offset, content.substr(offset)), SliceResult::kDone);
    EXPECT_TRUE(Read(DataPathOf(id)) == content);
}

TEST_F(Append, TakesAnInputThatFailsForOneThatIsCutOff) {
    const std::string id = Begin(10);
    const Input input("");
    const int folder = open("/", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    ASSERT_GE(dup2(folder, STDIN_FILENO), 0);
    (void)close(folder);
    talo::SliceUpload upload;
    ASSERT_EQ(upload.Open(id, "mia"), SliceResult::kDone);
    EXPECT_EQ(upload.Append(0, 10, ""), SliceResult::kCut);
    EXPECT_EQ(OffsetOf(id), 0);
}

TEST_F(Append, WaitsForASlowClient) {
    const std::string id = Begin(6);
    int ends[2];
    ASSERT_EQ(pipe2(ends, O_CLOEXEC), 0);
    const pid_t child = fork();
    if (child == 0) {
        (void)dup2(ends[0], STDIN_FILENO);
        (void)close(ends[0]);
        (void)close(ends[1]);
        talo::SliceUpload upload;
        const bool done = upload.Open(id, "mia") == SliceResult::kDone &&
                          upload.Append(0, 6, "") == SliceResult::kDone;
        _exit(done ? 0 : 1);
    }
    (void)close(ends[0]);
    for (const char byte : std::string("abcdef")) {
        ASSERT_EQ(write(ends[1], &byte, 1), 1);
        usleep(2000);
    }
    // The pipe stays open: the child does not wait for its end.
    int status = -1;
    ASSERT_EQ(waitpid(child, &status, 0), child);
    EXPECT_EQ(status, 0);
    (void)close(ends[1]);
    EXPECT_EQ(Read(DataPathOf(id)), "abcdef");
}

// In a process of its own, whose peak nobody else has raised.
TEST_F(Append, NeedsLittleMemoryWhateverTheSize) {
    constexpr size_t kBytes = size_t{64} << 20;
    const std::string id = Begin(kBytes);
    const support::ChildResult result = support::InChild([&] {
        const int file = memfd_create("large", MFD_CLOEXEC);
        EXPECT_EQ(ftruncate(file, kBytes), 0);
        EXPECT_GE(dup2(file, STDIN_FILENO), 0);
        talo::SliceUpload upload;
        EXPECT_EQ(upload.Open(id, "mia"), SliceResult::kDone);
        struct rusage before = {};
        struct rusage after = {};
        (void)getrusage(RUSAGE_SELF, &before);
        EXPECT_EQ(upload.Append(0, kBytes, ""), SliceResult::kDone);
        (void)getrusage(RUSAGE_SELF, &after);
        EXPECT_LT(after.ru_maxrss - before.ru_maxrss, 1024);
        return 0;
    });
    EXPECT_EQ(result.status, 0);
    EXPECT_EQ(OffsetOf(id), kBytes);
}

TEST_F(Append, LeavesNoDescriptorOpen) {
    const std::string id = Begin(100);
    const size_t before = OpenDescriptors();
    EXPECT_EQ(Send(id, 0, "abc"), SliceResult::kDone);
    EXPECT_EQ(Send(id, 0, "abc"), SliceResult::kWrongOffset);
    EXPECT_EQ(Send(id, 3, std::string(98, 'x')), SliceResult::kTooLong);
    EXPECT_EQ(SendPart(id, 3, "de", 10), SliceResult::kCut);
    EXPECT_EQ(Send(UnusedSliceId(), 0, "abc"), SliceResult::kNotFound);
    EXPECT_EQ(OffsetOf(id), 5);
    EXPECT_EQ(Create("mia", 1), SliceResult::kDone);
    EXPECT_EQ(OpenDescriptors(), before);
}

TEST_F(Append, NeedsAnUploadThatIsOpen) {
    const Input input("abc");
    talo::SliceUpload upload;
    EXPECT_EQ(upload.Append(0, 3, ""), SliceResult::kNotFound);
    EXPECT_EQ(upload.Check(), SliceResult::kFailed);
    EXPECT_FALSE(upload.Complete());
    EXPECT_FALSE(upload.Abandon());
    EXPECT_EQ(input.Taken(), 0u);
}

}  // namespace
