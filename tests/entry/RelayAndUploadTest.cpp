#include "src/base/ErrorCode.h"
#include "tests/entry/EntryTest.h"

namespace {

Call Upload(const std::string& query) {
    return Post("--x--\r\n")
        .With("CONTENT_TYPE", "multipart/form-data; boundary=x")
        .With("QUERY_STRING", query);
}

class RelayAndUpload : public EntryTest {};

TEST_F(RelayAndUpload, AnswersARelayWith109) {
    EXPECT_EQ(Serve(GetMethod("echo", "&relay_nd=1")).Code(), TALO::kErrorRelay);
    EXPECT_EQ(Serve(Post("api=Test.Entry&version=1&method=echo&relay_nd=1")).Code(),
              TALO::kErrorRelay);
}

TEST_F(RelayAndUpload, AnswersAnUploadThatTheMethodDoesNotReadItselfWith108) {
    EXPECT_EQ(Serve(Upload("api=Test.Entry&version=1&method=upload")).Code(), TALO::kErrorUpload);
}

TEST_F(RelayAndUpload, CallsAMethodThatReadsTheUploadItself) {
    EXPECT_EQ(Serve(Upload("api=Test.Entry&version=1&method=deferred")).Code(), TALO::kErrorNone);
}

TEST_F(RelayAndUpload, AnswersAnUploadToAMethodThatTakesNoneWith115) {
    EXPECT_EQ(Serve(Upload("api=Test.Entry&version=1&method=echo")).Code(),
              TALO::kErrorUploadNotAllowed);
}

TEST_F(RelayAndUpload, AnswersAnUploadThatNobodyNamesWith101) {
    for (const char* query : {"", "api=Test.Entry&version=1", "api=Test.Entry&method=deferred",
                              "version=1&method=deferred"}) {
        EXPECT_EQ(Serve(Upload(query)).Code(), TALO::kErrorBadRequest) << query;
    }
    EXPECT_EQ(Serve(Upload("").Without("QUERY_STRING")).Code(), TALO::kErrorBadRequest);
}

}  // namespace
