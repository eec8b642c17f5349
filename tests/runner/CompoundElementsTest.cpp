#include "tests/runner/CompoundFixture.h"

namespace {

using runner::CodeList;
using runner::Error;
using runner::Parse;
using TALO::APIRequest;
using TALO::APIResponse;

class CompoundElement : public runner::CompoundFixture {
  protected:
    // The answer to one element that stands between two others.
    Json::Value Answer(const Json::Value& element) {
        const Json::Value data = Data(Document(List({Element("ok"), element, Element("ok")})));
        EXPECT_EQ(runner::ErrorCode(data["result"][0]), 0);
        EXPECT_EQ(runner::ErrorCode(data["result"][2]), 0) << "the others run";
        return data["result"][1];
    }

    static Json::Value With(const std::string& member, const Json::Value& value) {
        Json::Value element = Element("ok");
        element[member] = value;
        return element;
    }
};

TEST_F(CompoundElement, ThatIsNoObjectIs101InItsPlace) {
    for (const char* text : {"null", "5", "true", "\"text\"", "[]", "[{}]"}) {
        EXPECT_EQ(Answer(Parse(text)), Error(101)) << text;
        const Json::Value data = Data(Document(List({Parse(text)})));
        EXPECT_EQ(data["has_fail"], Json::Value(true));
    }
}

TEST_F(CompoundElement, ThatIsNoObjectStopsTheRest) {
    EXPECT_EQ(Codes(Data(Stopping(List({Json::Value(5), Element("ok")}), true))),
              CodeList({101, 112}));
    EXPECT_EQ(Codes(Data(Stopping(List({Element("fail"), Json::Value(5)}), true))),
              CodeList({400, 112}));
}

TEST_F(CompoundElement, OfAnImpossibleIdentityIs101InItsPlace) {
    for (const char* version : {"\"abc\"", "1.5", "[]", "{}", "2147483648"}) {
        EXPECT_EQ(Bare(Answer(With("version", Parse(version)))), Error(101)) << version;
    }
    EXPECT_EQ(Bare(Answer(With("api", Parse("[]")))), Error(101));
    EXPECT_EQ(Bare(Answer(With("method", Parse("{}")))), Error(101));
}

TEST_F(CompoundElement, IsEchoedOnlyWithAWholeIdentity) {
    const Json::Value incomplete[] = {With("version", 0), With("version", -1), With("api", ""),
                                      With("method", "")};
    for (const Json::Value& element : incomplete) {
        EXPECT_EQ(Answer(element), Error(101)) << element;
    }
}

TEST_F(CompoundElement, IsEchoedWhenItIsRefused) {
    Json::Value expected = Error(104);
    expected["api"] = "Test.Basic";
    expected["version"] = 9;
    expected["method"] = "ok";
    EXPECT_EQ(Answer(With("version", 9)), expected);
    EXPECT_EQ(Answer(With("version", "9")), expected) << "echoed as the number that it reads as";
}

TEST_F(CompoundElement, HasTheCodesOfASingleRequest) {
    EXPECT_EQ(Bare(Answer(With("api", "None"))), Error(102));
    EXPECT_EQ(Bare(Answer(With("api", "../../etc/x"))), Error(102));
    EXPECT_EQ(Bare(Answer(With("method", "none"))), Error(103));
    EXPECT_EQ(Bare(Answer(With("relay_nd", 1))), Error(109));
    EXPECT_EQ(Bare(Answer(With("method", "notInTable"))), Error(121));
    EXPECT_EQ(Bare(Answer(With("method", "nothing"))), Error(117));
    EXPECT_EQ(Bare(Answer(With("method", "throwException"))), Error(117));
    EXPECT_EQ(Bare(Answer(With("method", "throwNumber"))), Error(117));
}

TEST_F(CompoundElement, WithoutAnIdentityOfItsOwnHasThatOfTheOneBefore) {
    const Json::Value data =
        Data(Document(List({Element("echo", R"({"a": 1})"), Parse(R"({"b": 2})")})));
    EXPECT_EQ(data["result"][1], Parse(R"({"success": true, "data": {"b": 2},
                                           "api": "Test.Basic", "version": 1,
                                           "method": "echo"})"));
}

TEST_F(CompoundElement, SeesOnlyItsOwnParameters) {
    Json::Value document =
        Document(List({Element("echo", R"({"a": 1})"), Element("echo", R"({"b": 2})")}));
    document["getParam"] = Parse(R"({"outer": 1})");
    document["postParam"]["other"] = 1;
    const Json::Value data = Data(document);
    EXPECT_EQ(Bare(data["result"][0]["data"]), Parse(R"({"a": 1})"));
    EXPECT_EQ(Bare(data["result"][1]["data"]), Parse(R"({"b": 2})"));
}

TEST_F(CompoundElement, HasTheEnvironmentAsAPostWithoutTheQuery) {
    Json::Value document = Document(List({Element("caller")}));
    document["environ"] = Parse(R"({"REQUEST_METHOD": "GET", "QUERY_STRING": "a=b",
                                    "HTTP_COOKIE": "id=xyz", "HTTP_HOST": "h"})");
    Runner().need = [](APIRequest* request) {
        EXPECT_EQ(request->GetSessionID(), "xyz");
        return false;
    };
    const Json::Value seen = Data(document)["result"][0]["data"];
    EXPECT_EQ(seen["environment"]["REQUEST_METHOD"], Json::Value("POST"));
    EXPECT_EQ(seen["environment"]["HTTP_HOST"], Json::Value("h"));
    EXPECT_FALSE(seen["environment"].isMember("QUERY_STRING"));
    EXPECT_EQ(seen["requestMethod"], Json::Value(2));
    EXPECT_EQ(Runner().request->GetEnv("QUERY_STRING", ""), Json::Value("a=b"));
    EXPECT_EQ(Runner().request->GetRequestMethod(), 1) << "the outer request keeps its own";
}

TEST_F(CompoundElement, HasNoSessionSection) {
    Json::Value document = Document(List({Element("caller")}));
    document["session"] = Parse(R"({"username": "ada", "isAdmin": true, "isTimeout": false})");
    const Json::Value seen = Data(document)["result"][0]["data"];
    EXPECT_EQ(seen["user"], Json::Value(""));
    EXPECT_EQ(seen["admin"], Json::Value(false));
    EXPECT_EQ(seen["timeout"], Json::Value(true));
}

TEST_F(CompoundElement, ThatUploadsOrDownloadsIs113) {
    for (const char* method : {"upload", "uploadDeferred", "download", "printRaw"}) {
        Json::Value expected = Error(113);
        expected["api"] = "Test.Basic";
        expected["version"] = 1;
        expected["method"] = method;
        EXPECT_EQ(Answer(Element(method)), expected);
    }
    EXPECT_EQ(Data(Document(List({Element("upload")})))["has_fail"], Json::Value(true));
}

TEST_F(CompoundElement, ThatUploadsByDefaultIs113BeforeItIsLookedFor) {
    Defaults(R"({"methods": {"allowDownload": true}})");
    Json::Value element = Element("ok");
    element["api"] = "None.At.All";
    EXPECT_EQ(Codes(Data(Document(List({element})))), CodeList({113}));
}

TEST_F(CompoundElement, IsAuthorisedOnItsOwn) {
    std::vector<std::string> asked;
    Runner().need = [](APIRequest*) { return true; };
    Runner().skip = [](APIRequest*) { return false; };
    Runner().check = [&](APIRequest* request, APIResponse* response) {
        asked.push_back(request->GetAPIMethod());
        if (request->GetAPIMethod() == "echo") {
            response->SetError(105, Json::Value());
            return false;
        }
        return true;
    };
    EXPECT_EQ(Codes(Data(Document(List({Element("ok"), Element("echo"), Element("ok")})))),
              CodeList({0, 105, 0}));
    EXPECT_EQ(asked, std::vector<std::string>({"ok", "echo", "ok"}));
}

TEST_F(CompoundElement, RefusedWithoutACodeShowsTheBodyOfTheOneBefore) {
    Runner().need = [](APIRequest* request) { return request->GetAPIMethod() == "caller"; };
    Runner().check = [](APIRequest*, APIResponse*) { return false; };
    Runner().skip = [](APIRequest*) { return false; };
    const Json::Value data =
        Data(Document(List({Element("echo", R"({"a": 1})"), Element("caller")})));
    EXPECT_EQ(Bare(data["result"][1]), Bare(data["result"][0]));
    EXPECT_EQ(data["result"][1]["method"], Json::Value("caller"));
    EXPECT_EQ(data["result"][1]["data"]["a"], Json::Value(1));
    EXPECT_EQ(data["has_fail"], Json::Value(true));
    EXPECT_EQ(Codes(Data(Stopping(List({Element("ok"), Element("caller"), Element("ok")}), true))),
              CodeList({0, 0, 112}));
}

TEST_F(CompoundElement, RefusedFirstWithoutACodeShowsAnEmptyBody) {
    Runner().need = [](APIRequest*) { return true; };
    Runner().check = [](APIRequest*, APIResponse*) { return false; };
    Runner().skip = [](APIRequest*) { return false; };
    const Json::Value data = Data(Document(List({Element("ok")})));
    EXPECT_EQ(data["result"][0], Parse(R"({"api": "Test.Basic", "version": 1, "method": "ok"})"));
    EXPECT_EQ(data["has_fail"], Json::Value(true));
}

}  // namespace
