#include <gtest/gtest.h>

#include "tests/support/Json.h"
#include "webapi/APIRequest.h"

using support::Parse;
using TALO::APIRequest;

namespace {

const char kDocument[] = R"({
    "environ": {"a": "env", "only-env": "1"},
    "getParam": {"a": "param", "only-param": 1, "null": null, "list": [1]},
    "reqLib": {"a": "info", "only-info": 1, "null": null},
    "session": {"a": "session"}})";

class Accessors : public ::testing::Test {
  protected:
    void SetUp() override {
        ASSERT_TRUE(request.SetAttr("a", "attr"));
        ASSERT_TRUE(request.SetAttr("only-attr", 1));
    }

    APIRequest request{Parse(kDocument)};
    const Json::Value none{"none"};
};

TEST_F(Accessors, ReadEachTheirSection) {
    EXPECT_EQ(request.GetParam("a", none), Json::Value("param"));
    EXPECT_EQ(request.GetParamRef("a", none), Json::Value("param"));
    EXPECT_EQ(request.GetEnv("a", none), Json::Value("env"));
    EXPECT_EQ(request.GetAPIInfo("a", none), Json::Value("info"));
    EXPECT_EQ(request.GetAttr("a", none), Json::Value("attr"));
}

TEST_F(Accessors, TestEachTheirSection) {
    EXPECT_TRUE(request.HasParam("only-param"));
    EXPECT_FALSE(request.HasParam("only-env"));
    EXPECT_TRUE(request.HasEnv("only-env"));
    EXPECT_FALSE(request.HasEnv("only-param"));
    EXPECT_TRUE(request.HasAttr("only-attr"));
    EXPECT_FALSE(request.HasAttr("only-param"));
    EXPECT_FALSE(request.HasCookie("a"));
}

TEST_F(Accessors, AnswerTheDefaultForWhatIsAbsent) {
    EXPECT_EQ(request.GetParam("b", none), none);
    EXPECT_EQ(request.GetEnv("b", none), none);
    EXPECT_EQ(request.GetAPIInfo("b", none), none);
    EXPECT_EQ(request.GetAttr("b", none), none);
    EXPECT_EQ(&request.GetParamRef("b", none), &none);
}

TEST_F(Accessors, ApplyNoDefaultToAStoredNull) {
    EXPECT_EQ(request.GetParam("null", none), Json::Value());
    EXPECT_EQ(request.GetParamRef("null", none), Json::Value());
    EXPECT_EQ(request.GetAPIInfo("null", none), Json::Value());
    EXPECT_TRUE(request.HasParam("null"));
}

TEST_F(Accessors, AnswerTheWholeSectionForAnEmptyName) {
    EXPECT_EQ(request.GetParam("", none),
              Parse(R"({"a": "param", "only-param": 1, "null": null, "list": [1]})"));
    EXPECT_EQ(request.GetParamRef("", none).size(), 4u);
    EXPECT_EQ(request.GetEnv("", none), Parse(R"({"a": "env", "only-env": "1"})"));
    EXPECT_EQ(request.GetAPIInfo("", none),
              Parse(R"({"a": "info", "only-info": 1, "null": null})"));
    EXPECT_EQ(request.GetAttr("", none), Parse(R"({"a": "attr", "only-attr": 1})"));
    EXPECT_FALSE(request.HasParam(""));
    EXPECT_FALSE(request.HasEnv(""));
    EXPECT_FALSE(request.HasAttr(""));
}

TEST_F(Accessors, CopyOrReferToTheStoredValue) {
    Json::Value copy = request.GetParam("list", none);
    copy.append(2);
    EXPECT_EQ(request.GetParam("list", none), Parse("[1]"));
    EXPECT_EQ(&request.GetParamRef("list", none), &request.GetParamRef("list", none));
}

TEST_F(Accessors, StoreAttributesOfEveryType) {
    for (const Json::Value& value : Parse(R"([null, 5, 1.5, "text", true, [1], {"a": 1}])")) {
        EXPECT_TRUE(request.SetAttr("key", value));
        EXPECT_TRUE(request.HasAttr("key"));
        EXPECT_EQ(request.GetAttr("key", none), value);
    }
}

TEST_F(Accessors, RefuseAnAttributeWithoutAKey) {
    const Json::Value before = request.GetAttr("", none);
    EXPECT_FALSE(request.SetAttr("", 1));
    EXPECT_EQ(request.GetAttr("", none), before);
}

TEST_F(Accessors, KeepAttributesApartFromParameters) {
    EXPECT_TRUE(request.SetAttr("list", "attr"));
    EXPECT_EQ(request.GetParam("list", none), Parse("[1]"));
}

}  // namespace
