#include <vector>

#include "tests/entry/PermissionFixture.h"

namespace {

using support::Parse;
using TALO::APIRequest;
using TALO::APIResponse;

typedef std::vector<int> Codes;

// Several calls in one request, under the login of its cookie.
class CompoundPermission : public rights::PermissionFixture {
  protected:
    static Json::Value Element(const std::string& api, const std::string& method = "who") {
        Json::Value element(Json::objectValue);
        element["api"] = api;
        element["version"] = 1;
        element["method"] = method;
        return element;
    }

    static Json::Value List(const std::vector<Json::Value>& elements) {
        Json::Value list(Json::arrayValue);
        for (const Json::Value& element : elements) {
            list.append(element);
        }
        return list;
    }

    static Json::Value Nested(const Json::Value& list) {
        Json::Value element = Element("TALO.Entry.Request", "request");
        element["compound"] = list;
        return element;
    }

    // Runs the elements in an entry and answers the data of the success.
    static Json::Value RunIn(rights::OpenEntry& entry, const Json::Value& list,
                             const std::string& cookie = "id=s1") {
        Json::Value environ(Json::objectValue);
        environ["REQUEST_METHOD"] = "POST";
        environ["HTTP_COOKIE"] = cookie;
        entry.request->InitEnv(environ);
        Json::Value document(Json::objectValue);
        document["postParam"] = Nested(list);
        entry.request->InitParam(document, false);
        EXPECT_TRUE(entry.Process(entry.request, entry.response));
        EXPECT_EQ(entry.response->GetError(), 0);
        return entry.response->GetBody()["data"];
    }

    Json::Value Data(const Json::Value& list, const std::string& cookie = "id=s1") {
        EndRequest();
        return RunIn(Entry(), list, cookie);
    }

    static Codes CodesOf(const Json::Value& data) {
        Codes codes;
        for (const Json::Value& entry : data["result"]) {
            codes.push_back(entry["success"].asBool() ? 0 : entry["error"]["code"].asInt());
        }
        return codes;
    }
};

TEST_F(CompoundPermission, DecidesEachElementUnderTheLoginOfTheRequest) {
    const Json::Value data = Data(List({Element("Test.Rights"), Element("Test.Rights.Admin"),
                                        Element("Test.Rights.Photo"), Element("Test.Rights.Open"),
                                        Element("Test.Rights.Optional"), Element("Test.Rights")}));
    EXPECT_EQ(CodesOf(data), Codes({0, 105, 105, 0, 0, 0}));
    EXPECT_EQ(data["has_fail"], Json::Value(true));
    EXPECT_EQ(Checks(), 1u);
}

TEST_F(CompoundPermission, OfAnAdministratorIsThatOfAnAdministrator) {
    Session().user = "root";
    fake::Now().administrators.insert("root");
    const Json::Value data = Data(
        List({Element("Test.Rights"), Element("Test.Rights.Admin"), Element("Test.Rights.Photo")}));
    EXPECT_EQ(CodesOf(data), Codes({0, 0, 105}));
    EXPECT_EQ(data["result"][1]["data"]["user"], Json::Value("root"));
    EXPECT_EQ(data["result"][1]["data"]["admin"], Json::Value(true));
}

TEST_F(CompoundPermission, ShowsEachMethodWhoIsCalling) {
    fake::Now().privileges.insert("ann/Photos");
    Session().options = {{7, "App"}, {10, "45"}};
    const Json::Value data = Data(List({Element("Test.Rights"), Element("Test.Rights.Photo")}));
    EXPECT_EQ(data["result"][0]["data"],
              Parse(R"({"user": "ann", "admin": false, "authorized": true, "timeout": 45,
                        "application": "App", "priv": false, "session": "s1"})"));
    EXPECT_EQ(data["result"][1]["data"]["priv"], Json::Value(true));
    EXPECT_EQ(data["result"][1]["data"]["user"], Json::Value("ann"));
    EXPECT_EQ(data["has_fail"], Json::Value(false));
}

TEST_F(CompoundPermission, HandsNoFactsToAnElementBeforeItsCheck) {
    const Json::Value data = Data(List({Element("Test.Rights.Open")}));
    EXPECT_EQ(data["result"][0]["data"]["user"], Json::Value(""));
    EXPECT_EQ(data["result"][0]["data"]["authorized"], Json::Value(false));
    EXPECT_EQ(Checks(), 0u);
}

TEST_F(CompoundPermission, LeavesNoFactsToAnElementThatIsNotChecked) {
    const Json::Value data = Data(List({Element("Test.Rights"), Element("Test.Rights.Open")}));
    EXPECT_EQ(data["result"][0]["data"]["user"], Json::Value("ann"));
    EXPECT_EQ(data["result"][1]["data"]["user"], Json::Value(""));
    EXPECT_EQ(data["result"][1]["data"]["authorized"], Json::Value(false));
}

TEST_F(CompoundPermission, WithoutALoginIs119ForEachElementThatNeedsOne) {
    const Json::Value data = Data(List({Element("Test.Rights"), Element("Test.Rights.Open"),
                                        Element("Test.Rights.Optional"), Element("Test.Rights")}),
                                  "lang=en");
    EXPECT_EQ(CodesOf(data), Codes({119, 0, 0, 119}));
    EXPECT_EQ(Checks(), 0u);
    EXPECT_EQ(Entry().response->GetServerError(), "unauth");
}

TEST_F(CompoundPermission, AsksThePlatformOnceForAThousandElements) {
    std::vector<Json::Value> elements;
    for (int count = 0; count < 1000; ++count) {
        elements.push_back(Element("Test.Rights"));
    }
    const Json::Value data = Data(List(elements));
    EXPECT_EQ(CodesOf(data), Codes(1000, 0));
    EXPECT_EQ(data["result"][999]["data"]["user"], Json::Value("ann"));
    EXPECT_EQ(Checks(), 1u);
}

TEST_F(CompoundPermission, AsksThePlatformOnceForEachVariantOfAThousandElements) {
    Session().result = -1;
    std::vector<Json::Value> elements;
    Codes expected;
    for (int count = 0; count < 1000; ++count) {
        elements.push_back(Element("Test.Rights", count % 2 == 0 ? "tolerant" : "who"));
        expected.push_back(count % 2 == 0 ? 0 : 106);
    }
    EXPECT_EQ(CodesOf(Data(List(elements))), expected);
    EXPECT_EQ(Checks(), 2u);
}

TEST_F(CompoundPermission, RemembersARefusalForAThousandElements) {
    Session().result = -3;
    EXPECT_EQ(CodesOf(Data(List(std::vector<Json::Value>(1000, Element("Test.Rights"))))),
              Codes(1000, 105));
    EXPECT_EQ(Checks(), 1u);
}

TEST_F(CompoundPermission, ReachesNestedElements) {
    const Json::Value inner = List({Element("Test.Rights"), Element("Test.Rights.Admin")});
    const Json::Value data = Data(List({Nested(List({Nested(inner)})), Element("Test.Rights")}));
    EXPECT_EQ(CodesOf(data), Codes({0, 0}));
    const Json::Value& second = data["result"][0]["data"];
    const Json::Value& third = second["result"][0]["data"];
    EXPECT_EQ(CodesOf(third), Codes({0, 105}));
    EXPECT_EQ(third["result"][0]["data"]["user"], Json::Value("ann"));
    EXPECT_EQ(third["result"][0]["data"]["session"], Json::Value("s1"));
    EXPECT_EQ(Checks(), 1u);
}

TEST_F(CompoundPermission, ShowsTheTextOfARefusalOnTheWholeReply) {
    Session().result = -1;
    (void)Data(List({Element("Test.Rights")}));
    EXPECT_EQ(Entry().response->GetServerError(), "timeout");
}

TEST_F(CompoundPermission, LetsNoElementBringItsOwnSession) {
    Session("s2").user = "root";
    fake::Now().administrators.insert("root");
    Json::Value element = Element("Test.Rights.Admin");
    element["_sid"] = "s2";
    element["session"]["username"] = "root";
    element["session"]["isAdmin"] = true;
    EXPECT_EQ(CodesOf(Data(List({element}))), Codes({105}));
    ASSERT_EQ(Checks(), 1u);
    EXPECT_EQ(fake::Now().authCalls[0].sessionId, "s1");
}

// One request object serves all elements: what was given to one must not be seen
// by another that was refused and runs all the same.
TEST_F(CompoundPermission, TakesTheFactsAwayFromAnElementThatIsRefusedAndRuns) {
    Session().result = -1;
    const Json::Value data =
        Data(List({Element("Test.Rights", "tolerant"), Element("Test.Rights.Optional")}));
    EXPECT_EQ(CodesOf(data), Codes({0, 0}));
    EXPECT_EQ(data["result"][0]["data"]["user"], Json::Value("ann"));
    EXPECT_EQ(data["result"][1]["data"]["user"], Json::Value(""));
    EXPECT_EQ(data["result"][1]["data"]["authorized"], Json::Value(false));
}

TEST_F(CompoundPermission, SkipsTheRestAfterARefusal) {
    EndRequest();
    Json::Value outer = Nested(List({Element("Test.Rights"), Element("Test.Rights.Admin"),
                                     Element("Test.Rights"), Element("Test.Rights.Open")}));
    outer["stop_when_error"] = true;
    const Json::Value data = Data(List({outer}));
    EXPECT_EQ(CodesOf(data["result"][0]["data"]), Codes({0, 105, 112, 112}));
}

// Refuses one API without saying why.
class SilentEntry : public rights::OpenEntry {
  public:
    bool CheckPermission(APIRequest* asked, APIResponse* answer) override {
        return asked->GetAPIClass() != "Test.Rights.Photo" &&
               rights::OpenEntry::CheckPermission(asked, answer);
    }
};

TEST_F(CompoundPermission, ShowsTheBodyBeforeForAnElementRefusedWithoutACode) {
    SilentEntry entry;
    const Json::Value data =
        RunIn(entry, List({Element("Test.Rights.Admin"), Element("Test.Rights.Photo", "passive"),
                           Element("Test.Rights"), Element("Test.Rights.Photo")}));
    EXPECT_EQ(CodesOf(data), Codes({105, 105, 0, 0}));
    EXPECT_EQ(data["result"][1]["api"], Json::Value("Test.Rights.Photo"));
    EXPECT_EQ(data["result"][1]["method"], Json::Value("passive"));
    EXPECT_EQ(data["result"][3]["data"], data["result"][2]["data"]);
    EXPECT_EQ(data["result"][3]["api"], Json::Value("Test.Rights.Photo"));
}

TEST_F(CompoundPermission, CountsAnElementRefusedWithoutACodeAsFailed) {
    SilentEntry entry;
    const Json::Value data =
        RunIn(entry, List({Element("Test.Rights"), Element("Test.Rights.Photo")}));
    EXPECT_EQ(CodesOf(data), Codes({0, 0}));
    EXPECT_EQ(data["has_fail"], Json::Value(true));
}

TEST_F(CompoundPermission, AfterNothingShowsOnlyTheNameOfAnElementRefusedWithoutACode) {
    SilentEntry entry;
    const Json::Value data = RunIn(entry, List({Element("Test.Rights.Photo")}));
    EXPECT_EQ(data["result"][0],
              Parse(R"({"api": "Test.Rights.Photo", "version": 1, "method": "who"})"));
    EXPECT_EQ(data["has_fail"], Json::Value(true));
}

}  // namespace
