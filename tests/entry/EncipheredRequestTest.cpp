#include <string>

#include "src/base/ErrorCode.h"
#include "tests/entry/EntryTest.h"
#include "tests/support/Json.h"

using support::Parse;

namespace {

// Whole requests with enciphered parameters, from the line to the method.
class EncipheredRequest : public EntryTest {
  protected:
    // What "echo" is given, without the identity.
    static Json::Value Given(const Call& call) {
        const Reply reply = Serve(call);
        EXPECT_EQ(reply.Code(), 0) << reply.output;
        Json::Value params = reply.body["data"]["params"];
        for (const char* identity : {"api", "version", "method"}) {
            params.removeMember(identity);
        }
        return params;
    }

    static Call PostMethod(const std::string& more) {
        return Post("api=Test.Entry&version=1&method=echo" + more);
    }
};

// The carriers as they come, in the query or in the body of a call, and what the
// method then finds.
const struct {
    const char* name;
    const char* line;
    const char* params;
} kRows[] = {
    {"line", "&a=1&__cIpHeRtExT=sealed:a=2%26b=2", R"({"a": 2, "b": 2})"},
    {"text and token", "&a=1&__tXeTrEhPiC=under+t:a=2%26b=2&__nEkOtReHpIc=t",
     R"({"a": 2, "b": 2})"},
    {"both", "&__cIpHeRtExT=sealed:a=2%26b=2&__tXeTrEhPiC=under+t:a=3&__nEkOtReHpIc=t",
     R"({"a": 2, "b": 2})"},
    {"line that holds a text and its token",
     "&__cIpHeRtExT=sealed:__tXeTrEhPiC=under%2Bt:b=2%26__nEkOtReHpIc=t", R"({"b": 2})"},
    {"text that holds a line", "&__tXeTrEhPiC=under+t:__cIpHeRtExT=sealed:b=2&__nEkOtReHpIc=t",
     R"({"b": 2})"},
    {"nested line", "&webapi={%22__cIpHeRtExT%22:%22sealed:b=2%22,%22__cIpHeRtOkEn%22:%22t%22}",
     R"({"webapi": {"b": 2}})"},
    {"nested text and token",
     "&webapi={%22__tXeTrEhPiC%22:%22under+t:b=2%22,%22__nEkOtReHpIc%22:%22t%22}",
     R"({"webapi": {"b": 2}})"},
    {"nested twice", "&webapi={%22webapi%22:{%22__cIpHeRtExT%22:%22sealed:b=2%22}}",
     R"({"webapi": {"webapi": {"b": 2}}})"},
    {"nested line that holds another",
     "&webapi={%22__cIpHeRtExT%22:%22sealed:__cIpHeRtExT=sealed:b=2%22}",
     R"({"webapi": {"b": 2}})"},
    {"line that cannot be opened", "&a=1&__cIpHeRtExT=x", R"({"a": 1})"},
    {"empty line", "&a=1&__cIpHeRtExT=", R"({"a": 1})"},
    {"nested line that cannot be opened",
     "&webapi={%22__cIpHeRtExT%22:%22c%22,%22__cIpHeRtOkEn%22:%22t%22,%22a%22:1}",
     R"({"webapi": {"a": 1}})"},
    {"nested text that cannot be opened",
     "&webapi={%22__tXeTrEhPiC%22:%22x%22,%22__nEkOtReHpIc%22:%22t%22,%22a%22:1}",
     R"({"webapi": {"a": 1}})"},
    {"lone text", "&__tXeTrEhPiC=under+t:b=2", R"({"__tXeTrEhPiC": "under t:b=2"})"},
    {"lone token", "&__nEkOtReHpIc=t", R"({"__nEkOtReHpIc": "t"})"},
};

TEST_F(EncipheredRequest, GivesTheMethodOrdinaryParameters) {
    for (const auto& row : kRows) {
        SCOPED_TRACE(row.name);
        EXPECT_EQ(Given(GetMethod("echo", row.line)), Parse(row.params));
        EXPECT_EQ(Given(PostMethod(row.line)), Parse(row.params));
    }
}

TEST_F(EncipheredRequest, MayNameItsMethodInAnyCarrier) {
    for (const char* line :
         {"sealed:api=Test.Entry&version=1&method=echo",
          "__cIpHeRtExT=sealed:api=Test.Entry%26version=1%26method=echo",
          "__tXeTrEhPiC=under+t:api=Test.Entry%26version=1%26method=echo&__nEkOtReHpIc=t",
          "api=Test.Entry&version=1&method=none&__cIpHeRtExT=sealed:method=echo"}) {
        EXPECT_EQ(Given(Get(line)), Json::Value(Json::objectValue)) << line;
        EXPECT_EQ(Given(Post(line)), Json::Value(Json::objectValue)) << line;
    }
}

TEST_F(EncipheredRequest, TakesItsSessionFromACarrier) {
    const Reply reply = Serve(GetMethod("echo", "&__cIpHeRtExT=sealed:_sid=XYZ"));
    ASSERT_EQ(reply.Code(), 0) << reply.output;
    EXPECT_EQ(reply.body["data"]["session"], "XYZ");
}

// Both the entry and the request look for carriers; the cipher opens a line once.
TEST_F(EncipheredRequest, OpensEachCarrierOnce) {
    for (const char* line :
         {"&__cIpHeRtExT=sealed:b=2", "&webapi={%22__cIpHeRtExT%22:%22sealed:b=2%22}",
          "&webapi={%22webapi%22:{%22__cIpHeRtExT%22:%22sealed:b=2%22}}"}) {
        Inside(PostMethod(line), [line](ProbeEntry& entry) {
            EXPECT_TRUE(entry.Initialize(Json::Value()));
            EXPECT_EQ(fake::Now().decryptCalls.size(), 1u) << line;
        });
    }
    Inside(PostMethod("&__tXeTrEhPiC=under+t:b=2&__nEkOtReHpIc=t"), [](ProbeEntry& entry) {
        EXPECT_TRUE(entry.Initialize(Json::Value()));
        EXPECT_EQ(fake::Now().keyCalls.size(), 1u);
        EXPECT_EQ(fake::Now().textCalls.size(), 1u);
    });
}

// As the entry reads it: a body that cannot be read is a bad request, a query that
// cannot be read has no answer of its own.
TEST_F(EncipheredRequest, IsRefusedWhenATextUnderATokenCannotBeRead) {
    for (const char* carriers :
         {"&__tXeTrEhPiC=&__nEkOtReHpIc=", "&__tXeTrEhPiC=x&__nEkOtReHpIc=t",
          "&__tXeTrEhPiC=under+t:b=2&__nEkOtReHpIc=", "&__tXeTrEhPiC=&__nEkOtReHpIc=t",
          "&__tXeTrEhPiC=under+t:b=2&__nEkOtReHpIc=u"}) {
        EXPECT_EQ(Serve(PostMethod(carriers)).Code(), TALO::kErrorBadRequest) << carriers;
        EXPECT_EQ(Serve(GetMethod("echo", carriers)).bodyText, "{}") << carriers;
    }
}

TEST_F(EncipheredRequest, IsRefusedWhenItIsEncipheredWholeAndCannotBeRead) {
    fake::Now().FailCall("TaloCgiDetectAndDecryptParamLine", 1);
    EXPECT_EQ(Serve(Post("sealed:api=Test.Entry&version=1&method=echo")).Code(),
              TALO::kErrorBadRequest);
    EXPECT_EQ(Serve(Get("sealed:api=Test.Entry&version=1&method=echo")).bodyText, "{}");
}

TEST_F(EncipheredRequest, HasElementsWithCarriersOfTheirOwn) {
    fake::Now().WriteJson("TALO.Entry.Request.lib", Parse(R"({"TALO.Entry.Request": {
        "lib": "", "minVersion": 1, "maxVersion": 1, "methods": {"1": ["request"]}}})"));
    const Reply reply = Serve(Post(
        "api=TALO.Entry.Request&version=1&method=request&compound="
        R"([{"api":"Test.Entry","version":1,"method":"echo","__cIpHeRtExT":"sealed:b=2"},)"
        R"({"__tXeTrEhPiC":"under+t:api=Test.Entry%26version=1%26method=echo","__nEkOtReHpIc":"t"},)"
        R"({"api":"Test.Entry","version":1,"method":"echo","__cIpHeRtExT":"x","c":3}])"));
    ASSERT_EQ(reply.Code(), 0) << reply.output;
    const Json::Value& results = reply.body["data"]["result"];
    ASSERT_EQ(results.size(), 3u);
    EXPECT_EQ(results[0]["data"]["params"]["b"], 2) << results;
    EXPECT_FALSE(results[0]["data"]["params"].isMember("__cIpHeRtExT"));
    EXPECT_EQ(results[1]["method"], "echo") << results;
    EXPECT_EQ(results[2]["data"]["params"]["c"], 3) << results;
    EXPECT_EQ(reply.bodyText.find("__"), std::string::npos) << reply.bodyText;
}

}  // namespace
