#include <fcntl.h>
#include <unistd.h>

#include <cstdlib>
#include <string>

#include "hosts/linux/cgi/Caller.h"
#include "hosts/linux/sdk/Process.h"
#include "tests/host/upload/UploadFixture.h"

namespace {

// Two requests, one after the other, in one process.
class ForgetRequest : public UploadTest {
  protected:
    // Ends the request and begins one with another body.
    static void Next(const std::string& body,
                     const char* type = "multipart/form-data; boundary=B") {
        talo::ForgetRequest();
        int ends[2];
        ASSERT_EQ(pipe2(ends, O_CLOEXEC), 0);
        ASSERT_EQ(write(ends[1], body.data(), body.size()), static_cast<ssize_t>(body.size()));
        ASSERT_EQ(dup2(ends[0], STDIN_FILENO), STDIN_FILENO);
        (void)close(ends[0]);
        (void)close(ends[1]);
        (void)setenv("CONTENT_TYPE", type, 1);
        (void)setenv("CONTENT_LENGTH", std::to_string(body.size()).c_str(), 1);
    }

    static void ExpectStored(const All& all, const std::string& name, const std::string& content) {
        ASSERT_EQ(all.result, TALO_UPLOAD_OK);
        ASSERT_EQ(all.files.count(name), 1u);
        EXPECT_EQ(Content(all.files.at(name)), content);
        for (const auto& file : all.files) {
            (void)TLIBCSysUnlink(file.second.c_str());
        }
    }
};

TEST_F(ForgetRequest, LetsAnUploadFollowAnUpload) {
    Serve(Body().Field("a", "1").File("f", "one", "first").Whole(), [this] {
        ExpectStored(LoadAll(Dir()), "f", "first");
        Next(Body().Field("b", "2").File("f", "two", "second").Whole());
        const All all = LoadAll(Dir());
        EXPECT_EQ(all.params, (Texts{{"b", "2"}, {"f_filename", "two"}, {"f_size", "6"}}));
        ExpectStored(all, "f", "second");
    });
    EXPECT_TRUE(Left().empty());
}

TEST_F(ForgetRequest, LetsAnUploadFollowARefusedOne) {
    Serve(Body().Field("a", "1").File("f", "one", "first").Open(), [this] {
        EXPECT_NE(LoadAll(Dir()).result, TALO_UPLOAD_OK);
        Next("nothing", "text/plain");
        EXPECT_EQ(LoadAll(Dir()).result, TALO_UPLOAD_MALFORMED);
        Next(Body().File("f", "two", "second").Whole());
        ExpectStored(LoadAll(Dir()), "f", "second");
    });
    EXPECT_TRUE(Left().empty());
}

TEST_F(ForgetRequest, FreesTheNamesOfTheFiles) {
    Serve(Body().File("f", "one", "first").Whole(), [this] {
        ExpectStored(LoadAll(Dir()), "f", "first");
        Next(Body().Field("f", "text").Field("f_size", "text").Whole());
        const All all = LoadAll(Dir());
        EXPECT_EQ(all.params, (Texts{{"f", "text"}, {"f_size", "text"}}));
        EXPECT_TRUE(all.files.empty());
    });
}

TEST_F(ForgetRequest, LeavesTheRestOfABodyBehind) {
    Serve(Body().Field("a", "1").Field("b", "2").File("f", "one", "first").Whole(), [] {
        EXPECT_EQ(LoadFirst(1).fields, (Texts{{"a", "1"}}));
        Next(Body().Field("c", "3").Field("d", "4").Whole());
        EXPECT_EQ(LoadFirst(1).fields, (Texts{{"c", "3"}}));
    });
}

TEST_F(ForgetRequest, ReadsTheLimitsAgain) {
    Serve(Body().Field("a", "1").Whole(), [this] {
        EXPECT_EQ(LoadAll(Dir()).result, TALO_UPLOAD_OK);
        Configure("upload_parts=\"1\"\n");
        Next(Body().Field("b", "1").Field("c", "2").Whole());
        EXPECT_EQ(LoadAll(Dir()).result, TALO_UPLOAD_LIMIT);
        Configure("");
        Next(Body().Field("b", "1").Field("c", "2").Whole());
        EXPECT_EQ(LoadAll(Dir()).result, TALO_UPLOAD_OK);
    });
}

TEST_F(ForgetRequest, ForgetsForWhomItWorked) {
    const TALOCGI context = {};
    talo::Session session;
    session.user = "ann";
    host::SetCaller(&context, session);
    host::Caller caller;
    ASSERT_TRUE(host::FindCaller(&caller));
    talo::ForgetRequest();
    EXPECT_FALSE(host::FindCaller(&caller));
}

TEST_F(ForgetRequest, ForgetsTheErrorRecordedLast) {
    TLIBCErrSet(10496);
    talo::ForgetRequest();
    EXPECT_EQ(TLIBCErrGet(), 0);
}

TEST_F(ForgetRequest, MindsNothingWhenThereWasNone) {
    talo::ForgetRequest();
    talo::ForgetRequest();
}

}  // namespace
