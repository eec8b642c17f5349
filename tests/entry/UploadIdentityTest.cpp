#include <unistd.h>

#include <cstdint>
#include <string>
#include <vector>

#include "src/base/ErrorCode.h"
#include "tests/entry/UploadRequestFixture.h"
#include "tests/support/Json.h"

using support::Parse;

// An upload that does not name its API in the query names it in the first fields
// of its body.

namespace {

class UploadIdentity : public UploadRequestTest {};

TEST_F(UploadIdentity, ComesFromTheFirstFieldsOfTheBody) {
    NameInBody("upload");
    Script().params = {{"text", "hello"}};
    Script().files = {{"file", "/volume1/@tmp/x"}};
    for (const Call& call : {Upload(""), Upload("").Without("QUERY_STRING")}) {
        const Reply reply = Serve(call);
        ASSERT_EQ(reply.Code(), TALO::kErrorNone) << reply.output;
        EXPECT_EQ(reply.body["data"]["version"], 1);
        // A form knows no types: what it carries stays text.
        EXPECT_EQ(reply.body["data"]["params"],
                  Parse(R"({"api": "Test.Entry", "version": "1", "method": "upload",
                            "text": "hello", "file": "/volume1/@tmp/x"})"));
    }
}

TEST_F(UploadIdentity, AsksForThreeFieldsInAHashOf256) {
    NameInBody("upload");
    Inside(Upload(""), [](ProbeEntry& entry) {
        EXPECT_TRUE(entry.Initialize(Json::Value()));
        ASSERT_EQ(fake::Now().uploadCalls.size(), 1u);
        const fake::UploadCall& call = fake::Now().uploadCalls[0];
        EXPECT_EQ(call.operation, "TaloCgiLoadUploadNumParams");
        EXPECT_EQ(call.fileName, "3");
        EXPECT_EQ(call.fieldName, "256");
        EXPECT_EQ(call.flags, 0);
        EXPECT_EQ(fake::Now().hashCapacities, std::vector<int>{256});
    });
}

TEST_F(UploadIdentity, EmptiesTheHashThatAnEarlierReadingLeft) {
    NameInBody("upload");
    Inside(Upload(""), [](ProbeEntry& entry) {
        entry.TakeEnvironment();
        Json::Value first(Json::objectValue);
        EXPECT_TRUE(entry.LoadUploadAPIDesc(first));
        EXPECT_EQ(first, Parse(R"({"api": "Test.Entry", "version": "1", "method": "upload"})"));
        Script().firstFields = {{"other", "1"}};
        Json::Value second(Json::objectValue);
        EXPECT_TRUE(entry.LoadUploadAPIDesc(second));
        EXPECT_EQ(second, Parse(R"({"other": "1"})"));
        EXPECT_EQ(fake::Now().hashCapacities, std::vector<int>{256});
        EXPECT_EQ(fake::Now().openHashes, 1);
    });
}

TEST_F(UploadIdentity, LeavesTheRequestTheLengthOfTheRest) {
    const std::vector<std::pair<std::pair<unsigned long long, unsigned long long>, const char*>>
        rows = {{{100, 60}, "40"},
                {{100, 0}, "100"},
                {{100, 100}, "0"},
                {{UINT64_MAX, 0}, "18446744073709551615"},
                {{UINT64_MAX, UINT64_MAX - 1}, "1"},
                {{5000000000, 1}, "4999999999"}};
    for (const auto& row : rows) {
        NameInBody("upload");
        Script().counters = row.first;
        Inside(Upload(""), [&row](ProbeEntry& entry) {
            EXPECT_TRUE(entry.Initialize(Json::Value()));
            EXPECT_EQ(entry.request->GetEnv("CONTENT_LENGTH", Json::Value()), row.second);
            EXPECT_EQ(entry.request->GetEnv("CONTENT_TYPE", Json::Value()),
                      "multipart/form-data; boundary=x");
        });
    }
}

TEST_F(UploadIdentity, NeedsRoomForTheRestAlone) {
    NameInBody("upload", 1000);
    Inside(Upload(""), [](ProbeEntry& entry) {
        (void)entry.Run(Json::Value());
        ASSERT_EQ(fake::Now().volumeCalls.size(), 1u);
        EXPECT_EQ(fake::Now().volumeCalls[0].size, 1000 + (5u << 20));
    });
}

TEST_F(UploadIdentity, WithNothingBehindItLeavesNothingToRead) {
    NameInBody("upload", 0);
    EXPECT_EQ(Serve(Upload("")).bodyText,
              R"({"error":{"code":108,"errors":{"upload_err":-6}},"success":false})");
}

TEST_F(UploadIdentity, IsAlsoThatOfAMethodThatDefersTheReading) {
    NameInBody("deferred");
    const Reply reply = Serve(Upload("x=1"));
    ASSERT_EQ(reply.Code(), TALO::kErrorNone) << reply.output;
    EXPECT_EQ(reply.body["data"]["params"],
              Parse(R"({"api": "Test.Entry", "version": "1", "method": "deferred", "x": 1})"));
}

TEST_F(UploadIdentity, InTheQueryLeavesTheBodyAlone) {
    NameInBody("deferred");
    for (const char* query : {"api=Test.Entry&version=1&method=upload",
                              "method=m&x=&api=&version=7", "api=a&version=1&method=null"}) {
        Inside(Upload(query), [](ProbeEntry& entry) {
            entry.TakeEnvironment();
            Json::Value document(Json::objectValue);
            EXPECT_TRUE(entry.InitParam(document));
            EXPECT_FALSE(document.isMember("postParam"));
            EXPECT_TRUE(fake::Now().uploadCalls.empty());
            EXPECT_EQ(lseek(STDIN_FILENO, 0, SEEK_CUR), 0);
            EXPECT_EQ(entry.request->GetEnv("CONTENT_LENGTH", Json::Value()), "7");
        });
    }
}

TEST_F(UploadIdentity, IsReadFromTheBodyUnlessTheQueryHasAllOfIt) {
    NameInBody("upload");
    for (const char* query :
         {"", "x=1", "api=Test.Entry", "version=1", "method=upload", "api=Test.Entry&version=1",
          "api=Test.Entry&method=upload", "version=1&method=upload", "API=a&Version=1&Method=m"}) {
        Inside(Upload(query), [query](ProbeEntry& entry) {
            (void)entry.Run(Json::Value());
            EXPECT_EQ(Uses("TaloCgiLoadUploadNumParams"), 1) << query;
            EXPECT_EQ(entry.response->GetError(), 0) << query;
        });
    }
}

TEST_F(UploadIdentity, OfTheBodyWinsOverAPartOfItInTheQuery) {
    NameInBody("upload");
    const Reply reply = Serve(Upload("api=Other.API&version=9"));
    ASSERT_EQ(reply.Code(), TALO::kErrorNone) << reply.output;
    EXPECT_EQ(reply.Param("api"), "Test.Entry");
}

TEST_F(UploadIdentity, CanBeSplitBetweenQueryAndBody) {
    Script().firstFields = {{"method", "upload"}};
    Script().counters = {100, 60};
    EXPECT_EQ(Serve(Upload("api=Test.Entry&version=1")).Code(), TALO::kErrorNone);
}

TEST_F(UploadIdentity, ThatNobodyTellsIsAnsweredWith101) {
    Script().counters = {100, 60};
    for (const fake::UploadScript::Texts& fields :
         std::vector<fake::UploadScript::Texts>{{},
                                                {{"api", "Test.Entry"}},
                                                {{"api", "Test.Entry"}, {"version", "1"}},
                                                {{"version", "1"}, {"method", "upload"}},
                                                {{"api", "Test.Entry"}, {"method", "upload"}}}) {
        Script().firstFields = fields;
        EXPECT_EQ(Serve(Upload("")).Code(), TALO::kErrorBadRequest) << fields.size();
    }
}

TEST_F(UploadIdentity, WithAVersionThatIsNoNumberIsAnsweredWith101) {
    for (const char* version : {"", "abc", "1x", "1.5", "-1", "0", "99999999999999999999", " 1"}) {
        NameInBody("upload");
        Script().firstFields["version"] = version;
        const Reply reply = Serve(Upload(""));
        EXPECT_EQ(reply.status, 0) << version;
        EXPECT_EQ(reply.Code(), TALO::kErrorBadRequest) << version << reply.output;
    }
}

TEST_F(UploadIdentity, ThatCannotBeReadIsAnsweredWith101) {
    NameInBody("upload");
    for (const char* operation :
         {"TaloCgiLoadUploadNumParams", "SzHashToJsonObj", "TLIBCSzHashAlloc"}) {
        Inside(Upload(""), [operation](ProbeEntry& entry) {
            fake::Now().FailCall(operation, 1);
            EXPECT_FALSE(entry.Initialize(Json::Value())) << operation;
            EXPECT_EQ(entry.response->GetBody(),
                      Parse(R"({"success": false, "error": {"code": 101}})"));
            EXPECT_EQ(Uses("TaloCgiLoadUploadAll"), 0);
        });
    }
}

TEST_F(UploadIdentity, ThatCannotBeReadLeavesTheLengthAsItWas) {
    NameInBody("upload");
    fake::Now().FailCall("TaloCgiLoadUploadNumParams", 1);
    Inside(Upload(""), [](ProbeEntry& entry) {
        EXPECT_FALSE(entry.Initialize(Json::Value()));
        EXPECT_EQ(entry.request->GetEnv("CONTENT_LENGTH", Json::Value()), "7");
    });
}

TEST_F(UploadIdentity, GoesIntoAnObjectOnly) {
    NameInBody("upload");
    for (const char* target : {"[]", "1", "\"text\"", "true"}) {
        Inside(Upload(""), [target](ProbeEntry& entry) {
            entry.TakeEnvironment();
            Json::Value params = Parse(target);
            EXPECT_FALSE(entry.LoadUploadAPIDesc(params)) << target;
            EXPECT_EQ(params, Parse(target));
        });
    }
}

TEST_F(UploadIdentity, OfASliceCanBeInTheBodyToo) {
    NameInBody("upload");
    Script().params = {{"text", "hello"}};
    EXPECT_EQ(Serve(Upload("")
                        .With("CONTENT_TYPE", "application/octet-stream")
                        .With("HTTP_X_TYPE_NAME", "SLICEUPLOAD"))
                  .Param("text"),
              "hello");
}

// Only a POST has a body to look into.
TEST_F(UploadIdentity, IsNeverReadFromTheBodyOfAnotherMethod) {
    NameInBody("upload");
    for (const char* method : {"GET", "HEAD", "PUT", "post", ""}) {
        Inside(Upload("x=1").With("REQUEST_METHOD", method), [method](ProbeEntry& entry) {
            (void)entry.Run(Json::Value());
            EXPECT_EQ(entry.response->GetError(), TALO::kErrorBadRequest) << method;
            EXPECT_TRUE(fake::Now().uploadCalls.empty()) << method;
            EXPECT_EQ(lseek(STDIN_FILENO, 0, SEEK_CUR), 0);
        });
    }
}

}  // namespace
