#include <json/json.h>

#include <string>

#include "src/base/ErrorCode.h"
#include "tests/entry/RelayFixture.h"
#include "tests/support/Json.h"
#include "webapi/APIRunner.h"

using support::Parse;

// When a call goes to another appliance, and what of it.

namespace {

class Relay : public RelayFixture {};

TEST_F(Relay, ForwardsTheCallToTheApplianceThatItNames) {
    (void)Forward(ByAnn(Get("api=Test.Far&version=2&method=list&relay_nd=7")),
                  [](const fake::RelayCall& call) {
                      EXPECT_FALSE(call.streamed);
                      EXPECT_EQ(call.target, 7);
                      EXPECT_EQ(call.api, "Test.Far");
                      EXPECT_EQ(call.version, 2);
                      EXPECT_EQ(call.method, "list");
                  });
}

TEST_F(Relay, ForwardsEveryParameterButItsOwn) {
    const Call call =
        ByAnn(Post("text=a%20b&list=[1,\"two\"]&n=1.5&none=null&relay_timeout=3&a=body"))
            .With("QUERY_STRING", "api=Test.Far&version=1&method=list&relay_nd=7&a=query&q=");
    (void)Forward(call, [](const fake::RelayCall& forwarded) {
        EXPECT_EQ(forwarded.params,
                  Parse(R"({"api": "Test.Far", "version": 1, "method": "list", "text": "a b",
                            "list": [1, "two"], "n": 1.5, "none": null, "a": "body", "q": ""})"));
    });
}

// Only the parameters of those names are the relay's, not what resembles them.
TEST_F(Relay, LeavesOtherParametersOfSimilarNames) {
    Json::Value params = Parse(R"({"relay": 1, "relay_nd2": 2, "RELAY_ND": 3, "relay_timeouts": 4,
                                   "deep": {"relay_nd": 5, "relay_timeout": 6}})");
    params[std::string("relay_nd\0x", 10)] = 8;
    Json::Value sent = params;
    sent["relay_nd"] = 7;
    sent["relay_timeout"] = 9;
    (void)Forward(FarWith(sent), [&params](const fake::RelayCall& call) {
        Json::Value got = call.params;
        for (const char* name : {"api", "version", "method"}) {
            got.removeMember(name);
        }
        EXPECT_EQ(got, params);
    });
}

TEST_F(Relay, FollowsTheParameterOfTheBodyWhereTheQueryHasOneToo) {
    const Call call =
        ByAnn(Post("relay_nd=8&relay_timeout=2"))
            .With("QUERY_STRING", "api=Test.Far&version=1&method=list&relay_nd=7&relay_timeout=1");
    (void)Forward(call, [](const fake::RelayCall& forwarded) {
        EXPECT_EQ(forwarded.target, 8);
        EXPECT_EQ(forwarded.timeouts, std::vector<long>{2});
    });
}

TEST_F(Relay, UsesTheClientOfOtherAppliancesInItsOrder) {
    (void)Forward(Far("&relay_timeout=5"), [](const fake::RelayCall&) {
        EXPECT_EQ(Operations(),
                  "CredRequestMgr.CredRequestMgr CredRequestMgr.AddWebAPIRequest "
                  "CredRequestMgr.GetRequest CredRequest.SetResponseTimeout "
                  "CredRequestMgr.Run CredRequestMgr.GetResponse ");
    });
    (void)Forward(Far(), [](const fake::RelayCall&) {
        EXPECT_EQ(Operations(),
                  "CredRequestMgr.CredRequestMgr CredRequestMgr.AddWebAPIRequest "
                  "CredRequestMgr.Run CredRequestMgr.GetResponse ");
    });
}

// The library of the API need not even be there.
TEST_F(Relay, RunsNothingHere) {
    EXPECT_EQ(Serve(ByAnn(GetMethod("printing", "&relay_nd=7"))).output, kBlock + Peer().response);
    Refuse(ByAnn(Get("api=Test.Far&version=1&method=list")), TALO::kErrorLibrary);
}

TEST_F(Relay, IsNotAskedForWithoutItsParameter) {
    EXPECT_EQ(Serve(ByAnn(GetMethod("echo", "&relay_timeout=5"))).Param("relay_timeout"), 5);
}

TEST_F(Relay, FindsAWrongCallOutBeforeTheSession) {
    const struct {
        const char* what;
        const char* query;
        int code;
    } rows[] = {
        {"no API", "version=1&method=list", TALO::kErrorBadRequest},
        {"no version", "api=Test.Far&method=list", TALO::kErrorBadRequest},
        {"version 0", "api=Test.Far&version=0&method=list", TALO::kErrorBadRequest},
        {"no method", "api=Test.Far&version=1", TALO::kErrorBadRequest},
        {"unknown API", "api=Test.None&version=1&method=list", TALO::kErrorNoSuchAPI},
        {"API beside it in the file", "api=Test.Far.Other&version=1&method=list",
         TALO::kErrorNoSuchAPI},
        {"version too high", "api=Test.Far&version=4&method=list", TALO::kErrorVersion},
        {"unlisted method", "api=Test.Far&version=2&method=take", TALO::kErrorNoSuchMethod},
        {"version without methods", "api=Test.Far&version=3&method=list", TALO::kErrorNoSuchMethod},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.what);
        for (const char* cookie : {"id=s1", ""}) {
            Refuse(Get(std::string(row.query) + "&relay_nd=7").With("HTTP_COOKIE", cookie),
                   row.code, [](ProbeEntry&) {
                       EXPECT_EQ(Operations(), "");
                       EXPECT_TRUE(fake::Now().authCalls.empty());
                   });
        }
    }
}

TEST_F(Relay, TellsWhetherAnAnswerWasWritten) {
    (void)Inside(Far(), [](ProbeEntry& entry) {
        ASSERT_TRUE(entry.Initialize(Json::Value()));
        EXPECT_TRUE(entry.ProcessRelay(entry.request, entry.response));
        EXPECT_FALSE(entry.response->IsEnableOutput());
        Peer().succeeds = false;
        entry.response->SetEnableOutput(true);
        EXPECT_FALSE(entry.ProcessRelay(entry.request, entry.response));
        EXPECT_TRUE(entry.response->IsEnableOutput());
    });
}

class CompoundRelay : public RelayFixture {
  protected:
    CompoundRelay() {
        fake::Now().WriteJson("TALO.Entry.Request.lib", Parse(R"({"TALO.Entry.Request": {
            "lib": "", "minVersion": 1, "maxVersion": 1, "methods": {"1": ["request"]}}})"));
    }

    static Call Compound(const std::string& more) {
        return ByAnn(Get("api=TALO.Entry.Request&version=1&method=request" + more));
    }
};

TEST_F(CompoundRelay, ForwardsACompoundRequestWhole) {
    (void)Forward(Compound("&relay_nd=7&compound=[{\"api\":\"Far.Only\",\"relay_nd\":8}]"),
                  [](const fake::RelayCall& call) {
                      EXPECT_EQ(call.target, 7);
                      EXPECT_EQ(call.api, "TALO.Entry.Request");
                      EXPECT_EQ(call.params["compound"],
                                Parse(R"([{"api": "Far.Only", "relay_nd": 8}])"));
                  });
}

TEST_F(CompoundRelay, OfOneElementIsAnsweredWith109) {
    const Reply reply = Serve(
        Compound("&compound=[{\"api\":\"Test.Far\",\"version\":1,\"method\":\"list\","
                 "\"relay_nd\":7},{\"api\":\"Test.Entry\",\"version\":1,\"method\":\"echo\"}]"));
    ASSERT_EQ(reply.Code(), 0) << reply.output;
    const Json::Value& results = reply.body["data"]["result"];
    EXPECT_EQ(results[0]["error"], Parse(R"({"code": 109})")) << reply.output;
    EXPECT_EQ(results[1]["success"], true) << reply.output;
    (void)Inside(Compound("&compound=[{\"api\":\"Test.Entry\",\"version\":1,\"method\":\"echo\","
                          "\"relay_nd\":7}]"),
                 [](ProbeEntry& entry) {
                     (void)entry.Run(Json::Value());
                     EXPECT_EQ(Operations(), "");
                 });
}

TEST_F(Relay, IsNoneOfTheBareRunner) {
    (void)Inside(Call(), [](ProbeEntry&) {
        Json::Value out;
        TALO::APIRunner::Exec(out, "Test.Entry", 1, "echo", Parse(R"({"relay_nd": 7})"), "ann");
        EXPECT_EQ(out["error"]["code"], TALO::kErrorBadRequest) << out;
        EXPECT_EQ(Operations(), "");
    });
}

}  // namespace
