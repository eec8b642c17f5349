#include <unistd.h>

#include <cstdio>
#include <iostream>
#include <string>

#include "tests/fake/FakePlatform.h"
#include "tests/response/Fixture.h"
#include "tests/support/Child.h"
#include "webapi/APIDownload.h"

// Three ways lead to standard output: the streams' buffer, the C library's, and
// the descriptor. Bytes come out in the order in which they were written, whatever
// is buffered where.

namespace {

const char kHeader[] = "Content-type: text/html; charset=\"UTF-8\"\r\n";
const char kFile[] = "\r\n<the file>";

struct Buffering {
    const char* name;
    int mode;           // of stdout
    bool synchronized;  // std::cout with stdout
    bool byDescriptor;  // the platform writes past both
};

const Buffering kBufferings[] = {
    {"NoneAndStdio", _IONBF, true, false},
    {"NoneAndDescriptor", _IONBF, true, true},
    {"LinesAndStdio", _IOLBF, true, false},
    {"LinesAndDescriptor", _IOLBF, true, true},
    {"FullAndStdio", _IOFBF, true, false},
    {"FullAndDescriptor", _IOFBF, true, true},
    {"NoneUnsynchronizedAndStdio", _IONBF, false, false},
    {"NoneUnsynchronizedAndDescriptor", _IONBF, false, true},
    {"FullUnsynchronizedAndStdio", _IOFBF, false, false},
    {"FullUnsynchronizedAndDescriptor", _IOFBF, false, true},
};

class DownloadOrder : public Response, public ::testing::WithParamInterface<Buffering> {
  protected:
    DownloadOrder() {
        fake::Reset();
        fake::Now().outputMarker = kFile;
        fake::Now().outputByDescriptor = GetParam().byDescriptor;
    }
    ~DownloadOrder() override {
        fake::Reset();
    }

    // What a process writes that buffers this way.
    std::string Written(const std::function<void(TALO::APIDownload&)>& steps) {
        const support::ChildResult result = support::InChild([this, &steps] {
            static char stdioBuffer[1 << 16];
            EXPECT_EQ(setvbuf(stdout, stdioBuffer, GetParam().mode, sizeof stdioBuffer), 0);
            (void)std::ios::sync_with_stdio(GetParam().synchronized);
            TALO::APIDownload download(&response);
            steps(download);
            return 0;
        });
        EXPECT_EQ(result.status, 0) << result.output;
        return result.output;
    }
};

TEST_P(DownloadOrder, PutsTheHeaderBeforeTheFile) {
    EXPECT_EQ(Written([](TALO::APIDownload& download) { (void)download.Output("/file"); }),
              std::string(kHeader) + kFile);
    EXPECT_EQ(Written([](TALO::APIDownload& download) { (void)download.Output(stdin); }),
              std::string(kHeader) + kFile);
}

TEST_P(DownloadOrder, PutsTheHeaderBehindWhatWasPrintedBefore) {
    EXPECT_EQ(Written([](TALO::APIDownload& download) {
                  (void)fputs("printed;", stdout);
                  (void)download.Output("/file");
              }),
              std::string("printed;") + kHeader + kFile);
}

TEST_P(DownloadOrder, PutsTheHeaderBehindWhatAStreamStillHolds) {
    EXPECT_EQ(Written([](TALO::APIDownload& download) {
                  std::cout << "streamed;";
                  (void)download.Output("/file");
              }),
              std::string("streamed;") + kHeader + kFile);
}

TEST_P(DownloadOrder, PutsTheHeaderBehindBoth) {
    const std::string output = Written([](TALO::APIDownload& download) {
        (void)fputs("printed;", stdout);
        std::cout << "streamed;";
        (void)download.Output("/file");
    });
    const std::string rest = std::string(kHeader) + kFile;
    ASSERT_GT(output.size(), rest.size());
    EXPECT_EQ(output.substr(output.size() - rest.size()), rest);
    // Between the two buffers there is no order to keep.
    const std::string before = output.substr(0, output.size() - rest.size());
    EXPECT_TRUE(before == "printed;streamed;" || before == "streamed;printed;") << before;
}

// The process may end without emptying a buffer, as one does whose client has gone.
TEST_P(DownloadOrder, HoldsNoHeaderBack) {
    const support::ChildResult result = support::InChild([this]() -> int {
        static char buffer[1 << 16];
        (void)setvbuf(stdout, buffer, GetParam().mode, sizeof buffer);
        (void)std::ios::sync_with_stdio(GetParam().synchronized);
        fake::Now().outputMarker = "";
        (void)TALO::APIDownload(&response).Output("/file");
        _exit(0);
    });
    EXPECT_EQ(result.output, kHeader);
}

INSTANTIATE_TEST_SUITE_P(Bufferings, DownloadOrder, ::testing::ValuesIn(kBufferings),
                         [](const auto& info) { return std::string(info.param.name); });

}  // namespace
