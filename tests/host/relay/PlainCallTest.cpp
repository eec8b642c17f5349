#include <stdlib.h>

#include "tests/host/relay/RelayFixture.h"
#include "tests/support/Json.h"

namespace {

using support::Parse;
using talo::RelayError;

class PlainCall : public RelayTest {
  protected:
    Json::Value Seen() const {
        const std::vector<Json::Value> requests = target.Requests("TALO.Test");
        EXPECT_EQ(requests.size(), 1);
        return requests.empty() ? Json::Value() : requests[0];
    }
};

TEST_F(PlainCall, AnswersWithTheBodyAsItStands) {
    target.Plan(R"({"TALO.Test":{"body":" {\"success\":true}\n","headers":{"X-Other":"1"}}})");
    const Outcome outcome = Call();
    EXPECT_EQ(outcome.error, 0);
    EXPECT_EQ(outcome.answer, " {\"success\":true}\n");
}

TEST_F(PlainCall, IsAFormOfJsonTexts) {
    (void)Call(
        Parse(R"({"number":9007199254740993,"text":"\u00e4 &","_sid":"mine","relay_nd":2})"));
    EXPECT_EQ(Seen()["line"], "POST /webapi/entry.cgi HTTP/1.1");
    EXPECT_EQ(HeaderOf(Seen(), "Content-Type"), "application/x-www-form-urlencoded");
    EXPECT_EQ(Seen()["body"].asString(),
              "api=TALO.Test&version=3&method=do&number=9007199254740993&"
              "text=%22%C3%A4%20%26%22");
}

TEST_F(PlainCall, SaysForWhomItIsWhenItOpensTheSession) {
    (void)Call();
    const std::vector<Json::Value> opened = target.Requests("TALO.Relay");
    ASSERT_EQ(opened.size(), 1);
    EXPECT_EQ(opened[0]["line"], "POST /webapi/entry.cgi HTTP/1.1");
    EXPECT_EQ(opened[0]["body"].asString(),
              "api=TALO.Relay&version=1&method=open&lang=%22ger%22&node=1&secret=%22" +
                  std::string(43, 'A') + "%22&user=%22anna%22");
    EXPECT_EQ(HeaderOf(opened[0], "Cookie"), "none");
}

TEST_F(PlainCall, CarriesTheSessionTheHopsAndANameOfItsOwn) {
    (void)Call();
    EXPECT_EQ(HeaderOf(Seen(), "Cookie"), "id=session-1");
    EXPECT_EQ(HeaderOf(Seen(), "X-Relay-Hops"), "1");
    EXPECT_EQ(HeaderOf(Seen(), "User-Agent"), "webapi-relay/1");
    EXPECT_EQ(HeaderOf(Seen(), "Expect"), "none");
}

TEST_F(PlainCall, GoesOverTheConnectionOfTheOpening) {
    (void)Call();
    const std::vector<Json::Value> requests = target.Requests();
    ASSERT_EQ(requests.size(), 2);
    EXPECT_EQ(requests[0]["connection"], requests[1]["connection"]);
}

TEST_F(PlainCall, GoesBehindAQueryOfTheUrlButTheOpeningDoesNot) {
    talo::Node node = NodeOf(target);
    node.url += "?relay_nd=7";
    Enter(node);
    (void)Call();
    EXPECT_EQ(Seen()["line"], "POST /webapi/entry.cgi?relay_nd=7 HTTP/1.1");
    EXPECT_EQ(target.Requests("TALO.Relay")[0]["line"], "POST /webapi/entry.cgi HTTP/1.1");
}

TEST_F(PlainCall, SendsAMegabyteWithoutAskingFirst) {
    Json::Value params(Json::objectValue);
    params["text"] = std::string(1 << 20, 'x');
    EXPECT_EQ(Call(params).error, 0);
    EXPECT_EQ(HeaderOf(Seen(), "Expect"), "none");
    EXPECT_GT(Seen()["came"].asInt(), 1 << 20);
}

TEST_F(PlainCall, TakesAnAnswerInChunksOrOneThatEndsWithTheConnection) {
    for (const char* way : {"chunked", "sizeless"}) {
        target.Plan(std::string(R"({"TALO.Test":{"body":"as it came","chunked":false,")") + way +
                    R"(":true}})");
        const Outcome outcome = Call();
        EXPECT_EQ(outcome.error, 0);
        EXPECT_EQ(outcome.answer, "as it came");
    }
}

TEST_F(PlainCall, CountsTheHopsThatItCameOver) {
    (void)setenv("HTTP_X_RELAY_HOPS", "3", 1);
    EXPECT_EQ(Call().error, 0);
    EXPECT_EQ(HeaderOf(Seen(), "X-Relay-Hops"), "4");
}

TEST_F(PlainCall, IsNotSentOverAFifthAppliance) {
    (void)setenv("HTTP_X_RELAY_HOPS", "4", 1);
    EXPECT_EQ(Call().error, Number(RelayError::kTooManyHops));
    EXPECT_TRUE(target.Requests().empty());
}

TEST_F(PlainCall, CountsAnewWhenTheHopsAreNoNumber) {
    (void)setenv("HTTP_X_RELAY_HOPS", "-9", 1);
    EXPECT_EQ(Call().error, 0);
    EXPECT_EQ(HeaderOf(Seen(), "X-Relay-Hops"), "1");
}

TEST_F(PlainCall, KnowsNoOtherAppliance) {
    EXPECT_EQ(Call(Json::Value(), 3).error, Number(RelayError::kUnknownNode));
    EXPECT_EQ(Call(Json::Value(), -2).error, Number(RelayError::kUnknownNode));
    EXPECT_TRUE(WasLogged("call of appliance 3: no such appliance"));
}

TEST_F(PlainCall, KnowsNoWayToAnApplianceThatOnlyCalls) {
    talo::Node node;
    node.id = 3;
    node.secretHash = std::string(64, 'a');
    node.classes = {"normal.local"};
    Enter(node);
    EXPECT_EQ(Call(Json::Value(), 3).error, Number(RelayError::kUnknownNode));
}

TEST_F(PlainCall, IsForNobodyWithoutAnAcceptedSession) {
    LogOut();
    EXPECT_EQ(Call().error, Number(RelayError::kNoCaller));
    EXPECT_TRUE(target.Requests().empty());
}

TEST_F(PlainCall, PassesByEveryProxyOfTheEnvironment) {
    for (const char* name :
         {"http_proxy", "https_proxy", "HTTPS_PROXY", "all_proxy", "ALL_PROXY", "HTTP_PROXY"}) {
        (void)setenv(name, "http://127.0.0.1:1", 1);
    }
    (void)setenv("CURL_CA_BUNDLE", "/nonexistent", 1);
    (void)setenv("SSL_CERT_FILE", "/nonexistent", 1);
    EXPECT_EQ(Call().error, 0);
    for (const char* name : {"http_proxy", "https_proxy", "HTTPS_PROXY", "all_proxy", "ALL_PROXY",
                             "HTTP_PROXY", "CURL_CA_BUNDLE", "SSL_CERT_FILE"}) {
        (void)unsetenv(name);
    }
}

TEST_F(PlainCall, IsNotMadeAgainByASecondRun) {
    TALO::CredRequestMgr manager;
    (void)manager.AddWebAPIRequest(2, "TALO.Test", 1, "do", Json::Value());
    EXPECT_TRUE(manager.Run());
    EXPECT_TRUE(manager.Run());
    EXPECT_EQ(manager.GetResponse(0), "{\"success\":true}");
    EXPECT_EQ(target.Requests("TALO.Test").size(), 1);
}

TEST(RelayManager, HasNothingUnderAnIndexThatIsNone) {
    TALO::CredRequestMgr manager;
    for (const int index : {-1, 0, 1}) {
        EXPECT_EQ(manager.GetRequest(index), nullptr);
        EXPECT_EQ(manager.GetResponse(index), "");
    }
    EXPECT_EQ(manager.GetError(), 0);
    EXPECT_TRUE(manager.Run());
}

TEST(RelayManager, RefusesParametersThatAreNoObject) {
    TALO::CredRequestMgr manager;
    EXPECT_LT(manager.AddWebAPIRequest(2, "A", 1, "m", Json::Value("text")), 0);
    EXPECT_LT(manager.AddWebAPIRequest(2, "A", 1, "m", Json::Value(Json::arrayValue)), 0);
    EXPECT_EQ(manager.AddWebAPIRequest(2, "A", 1, "m", Json::Value()), 0);
}

}  // namespace
