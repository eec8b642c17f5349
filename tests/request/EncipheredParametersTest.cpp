#include <gtest/gtest.h>

#include "tests/fake/FakePlatform.h"
#include "tests/support/Json.h"
#include "webapi/APIRequest.h"

using support::Parse;
using TALO::APIRequest;

namespace {

// What a request makes of query and body.
class EncipheredParameters : public ::testing::Test {
  protected:
    EncipheredParameters() {
        fake::Reset();
    }
    ~EncipheredParameters() override {
        fake::Reset();
    }

    static Json::Value ParamsOf(const char* document) {
        const APIRequest request(Parse(document));
        return request.GetParam("", Json::Value());
    }
};

TEST_F(EncipheredParameters, AreOrdinaryParameters) {
    const APIRequest request(Parse(R"({
        "getParam": {"__cIpHeRtExT": "sealed:api=TALO.System&version=2&a=1"},
        "postParam": {"__tXeTrEhPiC": "under t:method=ping&b=2", "__nEkOtReHpIc": "t"}})"));
    EXPECT_EQ(request.GetParam("", Json::Value()),
              Parse(R"({"api": "TALO.System", "version": 2, "method": "ping", "a": 1, "b": 2})"));
    EXPECT_EQ(request.GetAPIClass(), "TALO.System");
    EXPECT_EQ(request.GetAPIVersion(), 2);
    EXPECT_EQ(request.GetAPIMethod(), "ping");
}

TEST_F(EncipheredParameters, WinOverPlainOnesOfTheSameObject) {
    EXPECT_EQ(ParamsOf(R"({"getParam": {"a": 1, "__cIpHeRtExT": "sealed:a=2"}})"),
              Parse(R"({"a": 2})"));
}

TEST_F(EncipheredParameters, OfTheQueryLoseAgainstPlainOnesOfTheBody) {
    EXPECT_EQ(ParamsOf(R"({"getParam": {"__cIpHeRtExT": "sealed:a=2"}, "postParam": {"a": 1}})"),
              Parse(R"({"a": 1})"));
}

TEST_F(EncipheredParameters, LetTheOthersThroughWhenTheyCannotBeRead) {
    const APIRequest request(Parse(R"({
        "getParam": {"__cIpHeRtExT": "x", "api": "TALO.System", "version": 1, "a": 1},
        "postParam": {"__tXeTrEhPiC": "x", "__nEkOtReHpIc": "y", "method": "ping", "b": 2,
                      "webapi": 5}})"));
    EXPECT_EQ(request.GetParam("", Json::Value()),
              Parse(R"({"api": "TALO.System", "version": 1, "method": "ping", "a": 1, "b": 2,
                        "webapi": 5})"));
    EXPECT_EQ(request.GetAPIClass(), "TALO.System");
    EXPECT_EQ(request.GetAPIMethod(), "ping");
}

TEST_F(EncipheredParameters, OfTheBodyAreReadWhenThoseOfTheQueryCannotBe) {
    EXPECT_EQ(ParamsOf(R"({"getParam": {"__cIpHeRtExT": "x"},
                           "postParam": {"__cIpHeRtExT": "sealed:b=2"}})"),
              Parse(R"({"b": 2})"));
}

TEST_F(EncipheredParameters, OfQueryAndBodyAreNotPutTogether) {
    EXPECT_EQ(
        ParamsOf(
            R"({"getParam": {"__tXeTrEhPiC": "under t:b=2"}, "postParam": {"__nEkOtReHpIc": "t"}})"),
        Parse(R"({"__tXeTrEhPiC": "under t:b=2", "__nEkOtReHpIc": "t"})"));
}

TEST_F(EncipheredParameters, LeaveTheDocumentAsItWas) {
    const Json::Value document = Parse(R"({"getParam": {"__cIpHeRtExT": "sealed:a=1"}})");
    const Json::Value before = document;
    APIRequest request((Json::Value()));
    request.InitParam(document, true);
    EXPECT_EQ(request.GetParam("", Json::Value()), Parse(R"({"a": 1})"));
    EXPECT_EQ(document, before);
}

TEST_F(EncipheredParameters, OfANestedObjectStayInIt) {
    EXPECT_EQ(ParamsOf(R"({"postParam": {"webapi": {"__cIpHeRtExT": "sealed:api=A.B&a=1"}}})"),
              Parse(R"({"webapi": {"api": "A.B", "a": 1}})"));
}

TEST_F(EncipheredParameters, MayMakeAnIdentityThatIsNone) {
    EXPECT_THROW(APIRequest(Parse(R"({"getParam": {"__cIpHeRtExT": "sealed:version=x"}})")),
                 Json::LogicError);
}

}  // namespace
