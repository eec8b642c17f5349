#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include "platform/HTTPFileOutputer.h"
#include "tests/host/download/Exchange.h"
#include "tests/support/TempFolder.h"

namespace {

using exchange::AskForFile;
using exchange::AskForPath;
using exchange::Environment;
using exchange::Get;
using exchange::Reply;

class OutputRedirect : public ::testing::Test {
  protected:
    static Environment With(const std::string& enabled, const std::string& prefix = "",
                            const Environment& more = {}) {
        Environment environment = Get(more);
        environment.emplace_back("MOD_X_SENDFILE_ENABLED", enabled);
        if (!prefix.empty()) {
            environment.emplace_back("MOD_X_ACCEL_PREFIX", prefix);
        }
        return environment;
    }
    void ExpectRedirect(const Reply& reply, const std::string& line) const {
        EXPECT_EQ(reply.status, exchange::kSent);
        EXPECT_EQ(reply.Header(), "Content-Type: text/plain\r\n" + line + "\r\n");
        EXPECT_EQ(reply.Body(), "");
    }
    static void ExpectOwn(const Reply& reply, const std::string& what) {
        EXPECT_EQ(reply.status, exchange::kSent) << what;
        EXPECT_EQ(reply.Line("X-Sendfile"), "(none)") << what;
        EXPECT_EQ(reply.Line("X-Accel-Redirect"), "(none)") << what;
        EXPECT_EQ(reply.Line("Content-Length"), "5") << what;
        EXPECT_EQ(reply.Body(), "hello") << what;
    }

    support::TempFolder folder_;
    std::string path_ = folder_.Write("a.txt", "hello");
};

TEST_F(OutputRedirect, LeavesTheFileToTheServerWhenItSaysYes) {
    for (const char* yes : {"yes", "YES", "Yes"}) {
        ExpectRedirect(AskForPath(path_, With(yes)), "X-Sendfile: " + path_);
    }
    for (const char* no : {"", "no", "1", "true", "yes ", "yess"}) {
        ExpectOwn(AskForPath(path_, With(no)), no);
    }
    ExpectOwn(AskForPath(path_), "not set");
}

TEST_F(OutputRedirect, PutsThePrefixOfAnInternalLocationInFront) {
    for (const char* prefix : {"/x-files", "/x-files/"}) {
        ExpectRedirect(AskForPath(path_, With("yes", prefix)),
                       "X-Accel-Redirect: /x-files" + path_);
    }
    ExpectRedirect(AskForPath(path_, With("yes", "/")), "X-Accel-Redirect: " + path_);
    ExpectOwn(AskForPath(path_, With("no", "/x-files")), "not enabled");
    ExpectOwn(AskForPath(path_, With("yes", "x-files")), "no path");
    ExpectOwn(AskForPath(path_, With("yes", "/x\r\nX: y")), "line end");
}

TEST_F(OutputRedirect, LeavesRangesAndConditionsToTheServer) {
    ExpectRedirect(AskForPath(path_, With("yes", "",
                                          {{"HTTP_RANGE", "bytes=9-"},
                                           {"HTTP_IF_NONE_MATCH", "*"},
                                           {"HTTP_IF_MATCH", "\"x\""}})),
                   "X-Sendfile: " + path_);
}

TEST_F(OutputRedirect, EscapesThePath) {
    struct Row {
        const char* name;
        const char* escaped;
    };
    for (const Row& row : {
             Row{"a b.txt", "a%20b.txt"},
             Row{"100%41", "100%2541"},
             Row{"a?b#c", "a%3Fb%23c"},
             Row{"a+b", "a%2Bb"},
             Row{"\xC3\xBC", "%C3%BC"},
             Row{"a\x7F", "a%7F"},
         }) {
        ExpectRedirect(AskForPath(folder_.Write(row.name, "hello"), With("yes")),
                       "X-Sendfile: " + folder_.Path(row.escaped));
    }
}

TEST_F(OutputRedirect, SaysThePathPlainlyToAServerThatUndoesNoEscapes) {
    const Environment plain = With("yes", "", {{"MOD_X_SENDFILE_PLAIN", "Yes"}});
    for (const char* name : {"a b", "100%41", "\xc3\xa4?#;+", "a\\b"}) {
        const std::string path = folder_.Write(name, "hello");
        ExpectRedirect(AskForPath(path, plain), "X-Sendfile: " + path);
    }
    for (const char* name : {"blank ", "a\x7F"}) {
        ExpectOwn(AskForPath(folder_.Write(name, "hello"), plain), name);
    }
}

TEST_F(OutputRedirect, IsNotForAPathThatNoHeaderCarries) {
    for (const char* name : {"a\r\nX: y", "a\nb", "\xFF\xFE", "a\x01"}) {
        ExpectOwn(AskForPath(folder_.Write(name, "hello"), With("yes")), name);
    }
}

TEST_F(OutputRedirect, NamesTheFileAndNotTheWayToIt) {
    ASSERT_EQ(mkdir(folder_.Path("d").c_str(), 0700), 0);
    ASSERT_EQ(symlink("../a.txt", folder_.Path("d/link").c_str()), 0);
    for (const char* way : {"d/link", "d/../a.txt", "./a.txt"}) {
        ExpectRedirect(AskForPath(folder_.Path(way), With("yes")), "X-Sendfile: " + path_);
    }
    const Reply relative = exchange::Ask(With("yes"), [&] {
        EXPECT_EQ(chdir(folder_.Path("d").c_str()), 0);
        return exchange::Told(HTTPFileOutputer().Output("link", "text/plain"));
    });
    ExpectRedirect(relative, "X-Sendfile: " + path_);
    const Reply open = exchange::Ask(With("yes"), [&] {
        FILE* const file = fopen(path_.c_str(), "re");
        const std::string name = "/proc/self/fd/" + std::to_string(fileno(file));
        const int result = HTTPFileOutputer().Output(name.c_str(), "text/plain");
        EXPECT_EQ(fclose(file), 0);
        return exchange::Told(result);
    });
    ExpectRedirect(open, "X-Sendfile: " + path_);
}

TEST_F(OutputRedirect, IsNotForAFileWithoutAName) {
    const Reply reply = exchange::Ask(With("yes"), [&] {
        FILE* const file = fopen(path_.c_str(), "re");
        EXPECT_EQ(unlink(path_.c_str()), 0);
        // What takes the name is not what was opened.
        (void)folder_.Write("a.txt", "other");
        const std::string name = "/proc/self/fd/" + std::to_string(fileno(file));
        const int result = HTTPFileOutputer().Output(name.c_str(), "text/plain");
        EXPECT_EQ(fclose(file), 0);
        return exchange::Told(result);
    });
    ExpectOwn(reply, "");
    EXPECT_EQ(AskForPath("/proc/self/status", With("yes")).Line("X-Sendfile"), "(none)");
}

TEST_F(OutputRedirect, IsNotForAnOpenFile) {
    ExpectOwn(AskForFile(path_, 0, With("yes")), "");
}

TEST_F(OutputRedirect, IsNotForAPathThatIsNoFile) {
    const Reply reply = AskForPath(folder_.Path("absent"), With("yes"));
    EXPECT_EQ(reply.status, exchange::kNotSent);
    EXPECT_EQ(reply.Line("Status"), "404 Not Found");
    EXPECT_EQ(AskForPath(folder_.Path(""), With("yes")).Line("Status"), "404 Not Found");
}

}  // namespace
