#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include "platform/HTTPFileOutputer.h"
#include "tests/host/download/Exchange.h"
#include "tests/support/TempFolder.h"

namespace {

using exchange::Ask;
using exchange::AskForPath;
using exchange::Get;
using exchange::Reply;

void ExpectWholeAnswer(const Reply& reply, const std::string& status, const std::string& what) {
    EXPECT_EQ(reply.status, exchange::kNotSent) << what;
    EXPECT_EQ(reply.Header(), "Status: " + status + "\r\nContent-Type: text/plain\r\n" +
                                  "Content-Length: " + std::to_string(status.size() + 1) + "\r\n")
        << what;
    EXPECT_EQ(reply.Body(), status + "\n") << what;
}

TEST(OutputError, ForAPathThatIsNoFileIs404) {
    const support::TempFolder folder;
    const std::string file = folder.Write("a", "hello");
    ASSERT_EQ(mkfifo(folder.Path("fifo").c_str(), 0600), 0);
    ASSERT_EQ(symlink("circle", folder.Path("circle").c_str()), 0);
    const std::pair<const char*, std::string> rows[] = {
        {"absent", folder.Path("absent")},
        {"empty", ""},
        {"folder", folder.Path("")},
        {"pipe that nobody writes", folder.Path("fifo")},
        {"below a file", file + "/b"},
        {"device", "/dev/null"},
        {"circle", folder.Path("circle")},
        {"long", folder.Path(std::string(5000, 'x'))},
        {"line end", folder.Path("a\r\nX: y")},
    };
    for (const auto& row : rows) {
        ExpectWholeAnswer(AskForPath(row.second), "404 Not Found", row.first);
    }
    ExpectWholeAnswer(Ask(Get(),
                          [] {
                              const char* const none = nullptr;
                              return exchange::Told(HTTPFileOutputer().Output(none, "x/y"));
                          }),
                      "404 Not Found", "none");
}

TEST(OutputError, ForAFileThatMayNotBeReadIs403) {
    const support::TempFolder folder;
    const std::string path = folder.Write("a", "hello");
    ASSERT_EQ(chmod(path.c_str(), 0), 0);
    ASSERT_EQ(chmod(folder.Path("").c_str(), 0755), 0);
    const Reply reply = Ask(Get(), [&] {
        // root may read anything
        if (getuid() == 0) {
            EXPECT_EQ(setuid(65534), 0);
        }
        return exchange::Told(HTTPFileOutputer().Output(path.c_str(), "x/y"));
    });
    ExpectWholeAnswer(reply, "403 Forbidden", "");
}

TEST(OutputError, ForAnOpenFileThatCannotBeReadIs500) {
    const support::TempFolder folder;
    const std::string path = folder.Write("a", "hello");
    ExpectWholeAnswer(Ask(Get(),
                          [&] {
                              FILE* const file = fopen(path.c_str(), "ae");
                              const int result = HTTPFileOutputer().Output(file, "", "x/y");
                              EXPECT_EQ(fclose(file), 0);
                              return exchange::Told(result);
                          }),
                      "500 Internal Server Error", "open for writing");
    ExpectWholeAnswer(Ask(Get(),
                          [] {
                              FILE* const none = nullptr;
                              return exchange::Told(HTTPFileOutputer().Output(none, "", "x/y"));
                          }),
                      "500 Internal Server Error", "none");
    ExpectWholeAnswer(Ask(Get(),
                          [&] {
                              FILE* const file = fopen(folder.Path("").c_str(), "re");
                              const int result = HTTPFileOutputer().Output(file, "", "x/y");
                              EXPECT_EQ(fclose(file), 0);
                              return exchange::Told(result);
                          }),
                      "404 Not Found", "folder");
}

TEST(OutputError, HasNoBodyForHead) {
    const Reply reply = AskForPath("/absent", {{"REQUEST_METHOD", "HEAD"}});
    EXPECT_EQ(reply.status, exchange::kNotSent);
    EXPECT_EQ(reply.Line("Status"), "404 Not Found");
    EXPECT_EQ(reply.Body(), "");
}

TEST(OutputError, LeavesNoDescriptorOpen) {
    const support::TempFolder folder;
    const std::string path = folder.Write("a", "hello");
    const Reply reply = Ask(Get(), [&] {
        const int before = dup(0);
        (void)close(before);
        (void)HTTPFileOutputer().Output(path.c_str(), "x/y");
        (void)HTTPFileOutputer().Output(folder.Path("").c_str(), "x/y");
        (void)HTTPFileOutputer().Output("/absent", "x/y");
        const int after = dup(0);
        return before == after ? 0 : 1;
    });
    EXPECT_EQ(reply.status, 0);
}

}  // namespace
