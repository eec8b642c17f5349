#include <string>

#include "tests/entry/EntryTest.h"

namespace {

class DownloadRequest : public EntryTest {
  protected:
    DownloadRequest() {
        fake::Now().outputMarker = "Content-Length: 4\r\n\r\nfile";
    }
};

// The entry adds neither its cache lines nor a JSON body.
TEST_F(DownloadRequest, IsAnsweredWithHeadersAndFileAlone) {
    for (const bool byDescriptor : {false, true}) {
        fake::Now().outputByDescriptor = byDescriptor;
        EXPECT_EQ(Serve(Traced(GetMethod("download"))).output,
                  "before;Content-type: text/plain\r\nX-Content-Type-Options: nosniff\r\n"
                  "Content-Length: 4\r\n\r\nfile");
    }
}

TEST_F(DownloadRequest, StillRunsItsCallbacks) {
    (void)Serve(Traced(GetMethod("download")));
    const std::string trace = WaitForTrace(3);
    EXPECT_EQ(trace.find("first "), 0u) << trace;
    EXPECT_NE(trace.find("third "), std::string::npos) << trace;
}

}  // namespace
