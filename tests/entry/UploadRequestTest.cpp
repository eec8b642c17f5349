#include "tests/entry/UploadRequestFixture.h"

#include <optional>
#include <vector>

#include "src/base/ErrorCode.h"
#include "tests/support/Json.h"
#include "tests/support/LogCapture.h"

using support::Parse;

namespace {

constexpr unsigned long long kReserve = 5ULL << 20;
const char kPath[] = "/volume1/@tmp/x";

class UploadRequest : public UploadRequestTest {
  protected:
    // Serves a call in a process that then tells what was deleted, one path a line
    // behind the reply, and "left" for each file that is still there.
    static std::string ServeAndListDeleted(const Call& call, Reply* reply) {
        std::string deleted;
        const std::string output = Inside(call, [](ProbeEntry&) {
            std::optional<ProbeEntry> entry;
            entry.emplace();
            (void)entry->Run(Json::Value());
            EXPECT_TRUE(fake::Now().unlinked.empty());
            entry.reset();
            (void)fputs("\nDELETED\n", stdout);
            for (const std::string& path : fake::Now().unlinked) {
                (void)fprintf(stdout, "%s\n", path.c_str());
            }
            for (const auto& file : Script().files) {
                if (fake::Now().files.count(file.second) != 0) {
                    (void)fprintf(stdout, "left %s\n", file.second.c_str());
                }
            }
        });
        const size_t end = output.find("\nDELETED\n");
        EXPECT_NE(end, std::string::npos) << output;
        reply->wellFormed = true;
        const size_t body = output.find("\r\n\r\n");
        reply->bodyText = output.substr(body + 4, end - body - 4);
        reply->body = Parse(reply->bodyText);
        return output.substr(end + 9);
    }
};

TEST_F(UploadRequest, BringsFieldsAndPathsAsParameters) {
    Script().params = {{"text", "hello"}, {"number", "12"}, {"file_filename", "a.txt"}};
    Script().files = {{"file", kPath}};
    const Reply reply = Serve(UploadTo("upload"));
    ASSERT_EQ(reply.Code(), TALO::kErrorNone) << reply.output;
    EXPECT_EQ(reply.body["data"]["params"],
              Parse(R"({"api": "Test.Entry", "version": 1, "method": "upload", "text": "hello",
                        "number": "12", "file_filename": "a.txt", "file": "/volume1/@tmp/x"})"));
}

TEST_F(UploadRequest, LetsTheBodyWinOverTheQuery) {
    Script().params = {{"text", "body"}};
    const Reply reply = Serve(UploadTo("upload&text=query&other=kept"));
    ASSERT_EQ(reply.Code(), TALO::kErrorNone) << reply.output;
    EXPECT_EQ(reply.Param("text"), "body");
    EXPECT_EQ(reply.Param("other"), "kept");
}

TEST_F(UploadRequest, IsReadOnceIntoTheFolderForItsLength) {
    Inside(UploadTo("upload").With("CONTENT_LENGTH", "1000"), [](ProbeEntry& entry) {
        (void)entry.Run(Json::Value());
        ASSERT_EQ(fake::Now().uploadCalls.size(), 1u);
        EXPECT_EQ(fake::Now().uploadCalls[0].operation, "TaloCgiLoadUploadAll");
        EXPECT_EQ(fake::Now().uploadCalls[0].dir, "/volume1/@tmp");
        ASSERT_EQ(fake::Now().volumeCalls.size(), 1u);
        EXPECT_EQ(fake::Now().volumeCalls[0].size, 1000 + kReserve);
    });
}

TEST_F(UploadRequest, HasItsFilesUntilTheEntryEnds) {
    Script().files = {{"one", "/volume1/@tmp/1"}, {"two", "/volume1/@tmp/2"}};
    Reply reply;
    EXPECT_EQ(ServeAndListDeleted(UploadTo("upload"), &reply),
              "/volume1/@tmp/1\n/volume1/@tmp/2\n");
    EXPECT_EQ(reply.Code(), TALO::kErrorNone) << reply.bodyText;
}

TEST_F(UploadRequest, LosesItsFilesAlsoWhenTheReadingFails) {
    Script().files = {{"file", kPath}};
    Script().allResult = -5;
    Reply reply;
    EXPECT_EQ(ServeAndListDeleted(UploadTo("upload"), &reply), std::string(kPath) + "\n");
    EXPECT_EQ(reply.Code(), TALO::kErrorUpload);
}

TEST_F(UploadRequest, LosesItsFilesAlsoWhenItsFieldsCannotBeParameters) {
    Script().params = {{"version", "no number"}};
    Script().files = {{"file", kPath}};
    Reply reply;
    EXPECT_EQ(ServeAndListDeleted(UploadTo("upload"), &reply), std::string(kPath) + "\n");
    EXPECT_EQ(reply.Code(), TALO::kErrorBadRequest) << reply.bodyText;
}

TEST_F(UploadRequest, IsAnsweredWith108AndTheResultWhenTheReadingFails) {
    for (const int result : {-1, -3, -4, -5, -7, -10, 0, 2}) {
        Script().allResult = result;
        EXPECT_EQ(Serve(UploadTo("upload")).bodyText,
                  R"({"error":{"code":108,"errors":{"upload_err":)" + std::to_string(result) +
                      R"(}},"success":false})");
    }
}

TEST_F(UploadRequest, OfNoLengthIsAnsweredWith108AndMinus6) {
    const char kAnswer[] = R"({"error":{"code":108,"errors":{"upload_err":-6}},"success":false})";
    for (const char* length : {"0", "", "-1", "abc"}) {
        EXPECT_EQ(Serve(UploadTo("upload").With("CONTENT_LENGTH", length)).bodyText, kAnswer)
            << length;
    }
    EXPECT_EQ(Serve(UploadTo("upload").Without("CONTENT_LENGTH")).bodyText, kAnswer);
}

TEST_F(UploadRequest, WithoutAFolderIsAnsweredWith108AndMinus2) {
    fake::Now().volume = "";
    fake::Now().fileSystems = {{"/tmp", {}}, {"/", {}}};
    EXPECT_EQ(Serve(UploadTo("upload")).bodyText,
              R"({"error":{"code":108,"errors":{"upload_err":-2}},"success":false})");
}

TEST_F(UploadRequest, WithoutMemoryIsAnsweredWith108AndMinus9) {
    fake::Now().FailCall("TLIBCSzHashAlloc", 1);
    EXPECT_EQ(Serve(UploadTo("upload")).bodyText,
              R"({"error":{"code":108,"errors":{"upload_err":-9}},"success":false})");
}

// The method reads the body by itself.
TEST_F(UploadRequest, IsLeftToAMethodThatDefersIt) {
    Script().params = {{"text", "hello"}};
    Script().files = {{"file", kPath}};
    const Reply reply = Serve(UploadTo("deferred"));
    ASSERT_EQ(reply.Code(), TALO::kErrorNone) << reply.output;
    EXPECT_EQ(reply.body["data"]["params"],
              Parse(R"({"api": "Test.Entry", "version": 1, "method": "deferred"})"));
    Inside(UploadTo("deferred").With("CONTENT_LENGTH", "0"), [](ProbeEntry& entry) {
        (void)entry.Run(Json::Value());
        EXPECT_TRUE(fake::Now().uploadCalls.empty());
        EXPECT_TRUE(fake::Now().volumeCalls.empty());
    });
}

TEST_F(UploadRequest, CanBeReadByTheMethodPartByPart) {
    Script().params = {{"text", "hello"}};
    Script().fileName = "a.txt";
    Script().fieldName = "file";
    Script().fieldValue = "A.txt";
    Script().partSize = 5;
    Script().stored = {{"file", kPath}, {"file_filename", "A.txt"}, {"file_size", "5"}};
    Script().counters = {70, 30};
    const Reply reply = Serve(UploadTo("reading"));
    ASSERT_EQ(reply.Code(), TALO::kErrorNone) << reply.output;
    EXPECT_EQ(reply.body["data"], Parse(R"({
        "before": {"api": "Test.Entry", "version": 1, "method": "reading"},
        "paramStatus": 1, "fields": {"text": "hello", "file": "A.txt"}, "fileStatus": 1,
        "all": {"text": "hello", "file": "/volume1/@tmp/x", "file_filename": "A.txt",
                "file_size": "5"},
        "trusted": {"text": false, "file": true, "file_filename": false, "file_size": false},
        "done": 30, "total": 70})"));
}

// What the method stored is the method's.
TEST_F(UploadRequest, KeepsTheFileThatTheMethodStored) {
    Script().fileName = Script().fieldValue = "a";
    Script().fieldName = "file";
    Script().partSize = 5;
    Script().stored = {{"file", kPath}};
    Reply reply;
    EXPECT_EQ(ServeAndListDeleted(UploadTo("reading"), &reply), "");
    EXPECT_EQ(reply.body["data"]["fileStatus"], 1);
}

TEST_F(UploadRequest, LetsAMethodTellItsFilesFromTheTextsOfAClient) {
    Script().params = {{"path", "/etc/passwd"}, {"file_filename", "passwd"}, {"copy", "x"}};
    Script().files = {{"file", kPath}};
    const Reply reply = Serve(UploadTo("trust&uploaded_files=/etc/passwd"));
    ASSERT_EQ(reply.Code(), TALO::kErrorNone) << reply.output;
    EXPECT_EQ(reply.body["data"],
              Parse(R"({"api": false, "version": false, "method": false, "path": false,
                        "file_filename": false, "copy": false, "uploaded_files": false,
                        "file": true})"));
}

// A plain form can name a path as well.
TEST_F(UploadRequest, IsNotWhatAPlainPostPretends) {
    const Reply reply =
        Serve(Post("api=Test.Entry&version=1&method=trust&file=/etc/passwd&"
                   "uploaded_files=[\"/etc/passwd\"]&file_size=3"
                   "&uploaded_files=/etc/passwd"));
    ASSERT_EQ(reply.Code(), TALO::kErrorNone) << reply.output;
    for (const std::string& name : reply.body["data"].getMemberNames()) {
        EXPECT_EQ(reply.body["data"][name], false) << name;
    }
}

TEST_F(UploadRequest, ToAMethodThatTakesNoneIsAnsweredWith115) {
    EXPECT_EQ(Serve(UploadTo("echo")).Code(), TALO::kErrorUploadNotAllowed);
    NameInBody("echo");
    EXPECT_EQ(Serve(Upload("")).Code(), TALO::kErrorUploadNotAllowed);
    Inside(UploadTo("echo"), [](ProbeEntry& entry) {
        (void)entry.Run(Json::Value());
        EXPECT_TRUE(fake::Now().uploadCalls.empty());
    });
}

TEST_F(UploadRequest, ToBeRelayedIsNotRead) {
    Inside(UploadTo("upload&relay_nd=1"), [](ProbeEntry& entry) {
        (void)entry.Run(Json::Value());
        EXPECT_TRUE(fake::Now().uploadCalls.empty());
    });
}

TEST_F(UploadRequest, CanBeASliceWhateverItsContentType) {
    Script().params = {{"text", "hello"}};
    for (const char* name : {"SLICEUPLOAD", "sliceUpload"}) {
        const auto slice = [name](const std::string& method) {
            return UploadTo(method)
                .With("CONTENT_TYPE", "application/octet-stream")
                .With("HTTP_X_TYPE_NAME", name);
        };
        EXPECT_EQ(Serve(slice("echo")).Code(), TALO::kErrorUploadNotAllowed);
        EXPECT_EQ(Serve(slice("upload")).Param("text"), "hello");
        EXPECT_EQ(Serve(slice("deferred")).Param("text"), Json::Value());
        EXPECT_EQ(Serve(slice("deferred")).Code(), TALO::kErrorNone);
        EXPECT_EQ(Serve(slice("upload").With("CONTENT_LENGTH", "0")).Code(), TALO::kErrorUpload);
    }
}

}  // namespace
