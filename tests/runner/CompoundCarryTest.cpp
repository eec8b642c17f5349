#include <stdlib.h>
#include <unistd.h>

#include <fstream>
#include <iterator>

#include "tests/runner/CompoundFixture.h"

namespace {

using TALO::APIResponse;

// What an element's response hands to the reply as a whole.
class CompoundCarry : public runner::CompoundFixture {
  protected:
    APIResponse& Outer(const std::vector<Json::Value>& elements) {
        (void)Data(Document(List(elements)));
        return *Runner().response;
    }
};

TEST_F(CompoundCarry, TheRestartOfTheServer) {
    EXPECT_FALSE(Outer({Element("ok")}).GetHttpdRestart());
    EXPECT_TRUE(Outer({Element("ok"), Element("restart"), Element("ok")}).GetHttpdRestart());
    EXPECT_EQ(Runner().GetResponse()["httpd_restart"], Json::Value(true));
}

TEST_F(CompoundCarry, TheRestartOutOfANestedCompound) {
    EXPECT_TRUE(Outer({Nested(List({Nested(List({Element("restart")}))}))}).GetHttpdRestart());
}

TEST_F(CompoundCarry, TheLastServerError) {
    EXPECT_FALSE(Outer({Element("ok")}).HasServerError());
    APIResponse& outer = Outer({Element("serverError", R"({"text": "first"})"),
                                Element("serverError", R"({"text": "second"})"), Element("ok")});
    EXPECT_EQ(outer.GetServerError(), "second");
}

TEST_F(CompoundCarry, TheServerErrorOutOfANestedCompound) {
    const Json::Value inner = Nested(List({Element("serverError", R"({"text": "deep"})")}));
    EXPECT_EQ(Outer({inner, Element("ok")}).GetServerError(), "deep");
}

TEST_F(CompoundCarry, NeitherHeadersNorStatusNorTheOutputSwitch) {
    APIResponse& outer =
        Outer({Element("header", R"({"name": "X-Test", "value": "v"})"), Element("status")});
    EXPECT_FALSE(outer.HasHeader("X-Test"));
    EXPECT_FALSE(outer.HasHeader("Status"));
    EXPECT_EQ(outer.GetStatus(), 200);
    EXPECT_TRUE(outer.IsEnableOutput());
}

TEST_F(CompoundCarry, NothingOfAnElementThatIsNotRun) {
    (void)Data(Stopping(List({Element("fail"), Element("restart"), Element("serverError"),
                              Element("later", R"({"file": "/dev/null", "text": "x"})")}),
                        true));
    EXPECT_FALSE(Runner().response->GetHttpdRestart());
    EXPECT_FALSE(Runner().response->HasServerError());
    EXPECT_TRUE(Runner().response->GetCallbackFuncs()->empty());
}

TEST_F(CompoundCarry, TheWorkForAfterwardsInOrderAndOnce) {
    char file[] = "/tmp/compound-later-XXXXXX";
    const int descriptor = mkstemp(file);
    ASSERT_GE(descriptor, 0);
    (void)close(descriptor);
    const auto later = [&file](const char* text) {
        Json::Value element = Element("later");
        element["file"] = file;
        element["text"] = text;
        return element;
    };
    APIResponse& outer = Outer({later("a"), Nested(List({later("b")})), later("a"), later("c")});
    EXPECT_EQ(outer.GetCallbackFuncs()->size(), 3u);
    for (const auto& callback : *outer.GetCallbackFuncs()) {
        callback.first(callback.second);
    }
    std::ifstream written(file);
    EXPECT_EQ(std::string(std::istreambuf_iterator<char>(written), {}), "abc");
    (void)unlink(file);
}

TEST_F(CompoundCarry, TheWorkBesideTheOutersOwn) {
    const auto nothing = [](void*) {};
    Runner().response->SetCallbackFunc(nothing, nullptr);
    APIResponse& outer = Outer({Element("later", R"({"file": "/dev/null", "text": "y"})")});
    ASSERT_EQ(outer.GetCallbackFuncs()->size(), 2u);
    EXPECT_EQ(outer.GetCallbackFuncs()->front().second, nullptr);
}

}  // namespace
