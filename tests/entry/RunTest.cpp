#include <string>

#include "src/base/ErrorCode.h"
#include "tests/entry/EntryTest.h"

namespace {

class EntryRun : public EntryTest {};

TEST_F(EntryRun, AnswersAGetWithTheMethodsResult) {
    const Reply reply = Serve(GetMethod("echo", "&text=hi"));
    EXPECT_EQ(reply.status, 0);
    ASSERT_EQ(reply.Code(), 0) << reply.output;
    EXPECT_EQ(reply.Param("text"), "hi");
}

TEST_F(EntryRun, AnswersAPost) {
    const Reply reply = Serve(Post("api=Test.Entry&version=2&method=echo&text=hi"));
    ASSERT_EQ(reply.Code(), 0) << reply.output;
    EXPECT_EQ(reply.Param("text"), "hi");
    EXPECT_EQ(reply.body["data"]["version"], 2);
}

TEST_F(EntryRun, DoesNotUseItsArgument) {
    const std::string output = Inside(GetMethod("echo", "&text=mine"), [](ProbeEntry& entry) {
        Json::Value other(Json::objectValue);
        other["getParam"]["text"] = "other";
        other["getParam"]["method"] = "silent";
        EXPECT_EQ(entry.Run(other), 0);
        EXPECT_EQ(entry.request->GetAPIMethod(), "echo");
    });
    EXPECT_NE(output.find("\"text\":\"mine\""), std::string::npos) << output;
}

TEST_F(EntryRun, OutputsTheErrorWhenInitializeFailed) {
    const Reply reply = Serve(Post(""));
    EXPECT_EQ(reply.bodyText, R"({"error":{"code":101},"success":false})");
}

TEST_F(EntryRun, OutputsTheErrorWhenTheProcessCannotBeNamed) {
    const Reply reply = Serve(Get("version=1&method=echo"));
    EXPECT_EQ(reply.bodyText, R"({"error":{"code":101},"success":false})");
}

TEST_F(EntryRun, LeavesTheErrorsOfDispatchInTheReply) {
    const struct {
        const char* what;
        const char* query;
        int code;
    } rows[] = {
        {"no query", "", TALO::kErrorBadRequest},
        {"no method", "api=Test.Entry&version=1", TALO::kErrorBadRequest},
        {"no version", "api=Test.Entry&method=echo", TALO::kErrorBadRequest},
        {"unknown API", "api=Test.Nothing&version=1&method=echo", TALO::kErrorNoSuchAPI},
        {"version too high", "api=Test.Entry&version=4&method=echo", TALO::kErrorVersion},
        {"unlisted method", "api=Test.Entry&version=2&method=silent", TALO::kErrorNoSuchMethod},
        {"no row", "api=Test.Entry&version=3&method=unknown", TALO::kErrorNotInTable},
        {"no result", "api=Test.Entry&version=1&method=silent", TALO::kErrorNoResult},
        {"exception", "api=Test.Entry&version=1&method=throwing", TALO::kErrorNoResult},
    };
    for (const auto& row : rows) {
        const Reply reply = Serve(Get(row.query));
        EXPECT_EQ(reply.status, 0) << row.what;
        EXPECT_EQ(reply.Code(), row.code) << row.what << ": " << reply.output;
    }
}

TEST_F(EntryRun, KeepsWhatAMethodPrintsOutOfTheReply) {
    const Reply reply = Serve(GetMethod("printing"));
    EXPECT_EQ(reply.bodyText, R"({"success":true})");
    EXPECT_EQ(reply.output.find("stray"), std::string::npos);
}

TEST_F(EntryRun, WritesNothingWhenOutputIsOff) {
    const Reply reply = Serve(Traced(GetMethod("ownOutput")));
    EXPECT_EQ(reply.status, 0);
    EXPECT_EQ(reply.output, "own");
}

}  // namespace
