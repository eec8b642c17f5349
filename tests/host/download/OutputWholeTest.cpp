#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include "platform/HTTPFileOutputer.h"
#include "tests/host/download/Exchange.h"
#include "tests/support/TempFolder.h"

namespace {

using exchange::AskForFile;
using exchange::AskForPath;
using exchange::Get;
using exchange::Output;
using exchange::Pattern;
using exchange::Reply;

void SetModified(const std::string& path, time_t when, long nanoseconds = 0) {
    const struct timespec times[] = {{when, nanoseconds}, {when, nanoseconds}};
    EXPECT_EQ(utimensat(AT_FDCWD, path.c_str(), times, 0), 0);
}

const char* const kOutputs[] = {"pipe", "socket", "file", "pipe that refuses to wait"};
const Output kKinds[] = {Output::Pipe, Output::Socket, Output::File, Output::NonBlockingPipe};

TEST(OutputByPath, WritesHeadersBlankLineAndContent) {
    const support::TempFolder folder;
    const std::string path = folder.Write("a.txt", "hello");
    SetModified(path, 784111777);
    const Reply reply = AskForPath(path);
    EXPECT_EQ(reply.status, exchange::kSent);
    EXPECT_EQ(reply.Header(),
              "Content-Type: text/plain\r\n"
              "Content-Length: 5\r\n"
              "Last-Modified: Sun, 06 Nov 1994 08:49:37 GMT\r\n"
              "ETag: " +
                  reply.Line("ETag") +
                  "\r\n"
                  "Accept-Ranges: bytes\r\n");
    EXPECT_EQ(reply.Body(), "hello");
}

TEST(OutputByPath, SendsEverySizeToEveryKindOfOutput) {
    const support::TempFolder folder;
    for (const size_t size : {0u, 1u, 4096u, 65536u, 65537u, 262143u, 262144u, 262145u, 3000001u}) {
        const std::string content = Pattern(size);
        const std::string path = folder.Write("a", content);
        for (size_t index = 0; index < std::size(kKinds); ++index) {
            const Reply reply = AskForPath(path, Get(), "x/y", kKinds[index]);
            EXPECT_EQ(reply.status, exchange::kSent) << size << " " << kOutputs[index];
            EXPECT_EQ(reply.Line("Content-Length"), std::to_string(size)) << kOutputs[index];
            EXPECT_TRUE(reply.Body() == content) << size << " " << kOutputs[index];
        }
    }
}

TEST(OutputByPath, SendsBytesAboveAGibibyteOfASparseFile) {
    const support::TempFolder folder;
    const std::string path = folder.Write("a", "");
    ASSERT_EQ(truncate(path.c_str(), 5000000000), 0);
    const Reply reply = AskForPath(path, Get({{"HTTP_RANGE", "bytes=4999999990-"}}));
    EXPECT_EQ(reply.Line("Content-Range"), "bytes 4999999990-4999999999/5000000000");
    EXPECT_EQ(reply.Body(), std::string(10, '\0'));
    EXPECT_EQ(AskForPath(path, {{"REQUEST_METHOD", "HEAD"}}).Line("Content-Length"), "5000000000");
}

TEST(OutputByPath, AnswersHeadWithTheHeadersOfGet) {
    const support::TempFolder folder;
    const std::string path = folder.Write("a.txt", "hello");
    const Reply head = AskForPath(path, {{"REQUEST_METHOD", "HEAD"}});
    EXPECT_EQ(head.status, exchange::kSent);
    EXPECT_EQ(head.Header(), AskForPath(path).Header());
    EXPECT_EQ(head.Body(), "");
    EXPECT_EQ(AskForPath(path, {{"REQUEST_METHOD", "head"}}).Body(), "hello");
}

TEST(OutputByPath, PassesNoMimeTypeThatWouldEndTheLine) {
    const support::TempFolder folder;
    const std::string path = folder.Write("a.txt", "hello");
    for (const char* type : {"", "text/plain\r\nSet-Cookie: a=b", "text/plain\n\nbody"}) {
        const Reply reply = AskForPath(path, Get(), type);
        EXPECT_EQ(reply.Line("Content-Type"), "application/octet-stream");
        EXPECT_EQ(reply.Body(), "hello");
    }
    const Reply none = exchange::Ask(
        Get(), [&] { return exchange::Told(HTTPFileOutputer().Output(path.c_str(), nullptr)); });
    EXPECT_EQ(none.Line("Content-Type"), "application/octet-stream");
}

TEST(OutputByPath, SendsTheFileBehindALink) {
    const support::TempFolder folder;
    (void)folder.Write("a.txt", "hello");
    ASSERT_EQ(symlink("a.txt", folder.Path("link").c_str()), 0);
    EXPECT_EQ(AskForPath(folder.Path("link")).Body(), "hello");
}

TEST(EntityTag, StaysTheSameUntilTheFileChanges) {
    const support::TempFolder folder;
    const std::string path = folder.Write("a", "hello");
    SetModified(path, 784111777, 5);
    const std::string tag = AskForPath(path).Line("ETag");
    EXPECT_EQ(tag.front(), '"');
    EXPECT_EQ(tag.back(), '"');
    EXPECT_EQ(AskForPath(path).Line("ETag"), tag);
    EXPECT_EQ(AskForFile(path, 0).Line("ETag"), tag);

    const std::string other = folder.Write("b", "hello");
    SetModified(other, 784111777, 5);
    EXPECT_NE(AskForPath(other).Line("ETag"), tag) << "another file";
    SetModified(path, 784111777, 6);
    const std::string later = AskForPath(path).Line("ETag");
    EXPECT_NE(later, tag) << "a nanosecond later";
    (void)folder.Write("a", "hello!");
    SetModified(path, 784111777, 6);
    const std::string longer = AskForPath(path).Line("ETag");
    EXPECT_NE(longer, later) << "a byte longer";
}

TEST(EntityTag, TellsAFileWhoseTimeWasSetBack) {
    const support::TempFolder folder;
    const std::string path = folder.Write("a", "hello");
    SetModified(path, 784111777);
    const std::string tag = AskForPath(path).Line("ETag");
    usleep(20000);  // the clock of a file system ticks every few milliseconds
    (void)folder.Write("a", "HELLO");
    SetModified(path, 784111777);
    EXPECT_NE(AskForPath(path).Line("ETag"), tag);
}

TEST(LastModified, IsNeverLaterThanTheAnswer) {
    const support::TempFolder folder;
    const std::string path = folder.Write("a", "hello");
    SetModified(path, time(nullptr) + 864000);
    struct tm parts = {};
    const std::string told = AskForPath(path).Line("Last-Modified");
    ASSERT_NE(strptime(told.c_str(), "%a, %d %b %Y %H:%M:%S GMT", &parts), nullptr) << told;
    EXPECT_LE(timegm(&parts), time(nullptr));
}

TEST(OutputByFile, SendsFromThePresentPosition) {
    const support::TempFolder folder;
    const std::string content = Pattern(300000);
    const std::string path = folder.Write("a", content);
    for (const size_t position : {0u, 1u, 5000u, 299999u, 300000u, 400000u}) {
        const std::string rest = position < content.size() ? content.substr(position) : "";
        for (const Output kind : kKinds) {
            const Reply reply = AskForFile(path, static_cast<long>(position), Get(), "", kind);
            EXPECT_EQ(reply.status, exchange::kSent) << position;
            EXPECT_EQ(reply.Line("Content-Length"), std::to_string(rest.size()));
            EXPECT_TRUE(reply.Body() == rest) << position;
        }
    }
}

TEST(OutputByFile, SendsFromBehindWhatWasReadThroughStdio) {
    const support::TempFolder folder;
    const std::string path = folder.Write("a", "one\ntwo\nthree\n");
    const Reply reply = exchange::Ask(Get(), [&] {
        FILE* const file = fopen(path.c_str(), "re");
        char line[16];
        EXPECT_NE(fgets(line, sizeof line, file), nullptr);
        const int result = HTTPFileOutputer().Output(file, "", "x/y");
        EXPECT_EQ(fclose(file), 0);
        return exchange::Told(result);
    });
    EXPECT_EQ(reply.Line("Content-Length"), "10");
    EXPECT_EQ(reply.Body(), "two\nthree\n");
}

TEST(OutputByFile, SendsTheRestOfAFileThatIsBeingWritten) {
    const Reply reply = exchange::Ask(Get(), [] {
        FILE* const file = tmpfile();
        EXPECT_GE(fputs("hello", file), 0);
        EXPECT_EQ(fseek(file, 1, SEEK_SET), 0);
        EXPECT_GE(fputs("E", file), 0);
        EXPECT_EQ(fseek(file, 0, SEEK_SET), 0);
        EXPECT_GE(fputs("H", file), 0);
        const int result = HTTPFileOutputer().Output(file, "", "x/y");
        EXPECT_EQ(fclose(file), 0);
        return exchange::Told(result);
    });
    EXPECT_EQ(reply.Body(), "Ello");
}

TEST(OutputByFile, HasATagOfItsOwnForEveryStart) {
    const support::TempFolder folder;
    const std::string path = folder.Write("a", "hello");
    const std::string tag = AskForFile(path, 1).Line("ETag");
    EXPECT_NE(tag, AskForFile(path, 0).Line("ETag"));
    EXPECT_NE(tag, AskForFile(path, 2).Line("ETag"));
    EXPECT_EQ(tag, AskForFile(path, 1).Line("ETag"));
}

TEST(OutputByFile, OffersTheContentUnderADownloadName) {
    const support::TempFolder folder;
    const std::string path = folder.Write("a", "hello");
    EXPECT_EQ(AskForFile(path, 0).Line("Content-Disposition"), "(none)");
    EXPECT_EQ(AskForFile(path, 0, Get(), "my file.txt").Line("Content-Disposition"),
              "attachment; filename=\"my file.txt\"");
    const Reply hostile = AskForFile(path, 0, Get(), "a\r\n\r\n<script>");
    EXPECT_EQ(hostile.Line("Content-Disposition"), "attachment; filename=\"a____<script>\"");
    EXPECT_EQ(hostile.Body(), "hello");
    EXPECT_EQ(AskForPath(path).Line("Content-Disposition"), "(none)");
}

}  // namespace
