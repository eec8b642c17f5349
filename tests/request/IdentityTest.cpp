#include <gtest/gtest.h>

#include "tests/request/Private.h"
#include "tests/support/Json.h"

using support::Parse;
using TALO::APIRequest;

namespace {

Json::Value Query(const char* name, const Json::Value& value) {
    Json::Value document;
    document["getParam"][name] = value;
    return document;
}

TEST(Identity, ComesFromTheParameters) {
    const APIRequest request(
        Parse(R"({"getParam": {"api": "TALO.System", "version": 2, "method": "ping"}})"));
    EXPECT_EQ(request.GetAPIClass(), "TALO.System");
    EXPECT_EQ(request.GetAPIVersion(), 2);
    EXPECT_EQ(request.GetAPIMethod(), "ping");
    EXPECT_TRUE(request.HasParam("api")) << "they stay ordinary parameters";
    EXPECT_TRUE(request.HasParam("version"));
    EXPECT_TRUE(request.HasParam("method"));
}

TEST(Identity, IsReplacedByTheBodyMemberByMember) {
    const APIRequest request(Parse(R"({"getParam": {"api": "A", "version": 1, "method": "m"},
                                       "postParam": {"version": 2, "method": "n"}})"));
    EXPECT_EQ(request.GetAPIClass(), "A");
    EXPECT_EQ(request.GetAPIVersion(), 2);
    EXPECT_EQ(request.GetAPIMethod(), "n");
}

TEST(Identity, StaysWhenNewParametersLackIt) {
    APIRequest request(Parse(R"({"getParam": {"api": "A", "version": 1, "method": "m"}})"));
    request.InitParam(Parse(R"({"getParam": {"other": 1}})"), true);
    EXPECT_FALSE(request.HasParam("api"));
    EXPECT_EQ(request.GetAPIClass(), "A");
    EXPECT_EQ(request.GetAPIVersion(), 1);
    EXPECT_EQ(request.GetAPIMethod(), "m");
    request.InitParam(Parse(R"({"postParam": {"api": ""}})"), false);
    EXPECT_EQ(request.GetAPIClass(), "");
    EXPECT_EQ(request.GetAPIMethod(), "m");
}

TEST(Identity, IsNotTakenFromAnythingButTheParameters) {
    const APIRequest request(
        Parse(R"({"environ": {"api": "A", "method": "m"}, "reqLib": {"api": "A", "version": 3},
                  "getParam": {"webapi": {"api": "A"}, "API": "A"}})"));
    EXPECT_EQ(request.GetAPIClass(), "");
    EXPECT_EQ(request.GetAPIVersion(), 0);
    EXPECT_EQ(request.GetAPIMethod(), "");
}

struct VersionRow {
    const char* name;
    const char* json;
    int version;
};

const VersionRow kVersions[] = {
    {"integer", "1", 1},
    {"zero", "0", 0},
    {"negative", "-1", -1},
    {"highest", "2147483647", 2147483647},
    {"lowest", "-2147483648", -2147483647 - 1},
    {"text", R"("1")", 1},
    {"text of a negative", R"("-1")", -1},
    {"text of the highest", R"("2147483647")", 2147483647},
    {"whole real", "2.0", 2},
    {"null", "null", 0},
    {"true", "true", 1},
};

TEST(Identity, ReadsTheVersionAsAnInteger) {
    for (const VersionRow& row : kVersions) {
        SCOPED_TRACE(row.name);
        APIRequest request((Json::Value()));
        request.InitParam(Query("version", 77), false);
        EXPECT_NO_THROW(request.InitParam(Query("version", Parse(row.json)), false));
        EXPECT_EQ(request.GetAPIVersion(), row.version);
    }
}

const char* const kNoVersions[] = {"1.5",        R"("abc")",
                                   "[]",         "[1]",
                                   "{}",         R"({"version": 1})",
                                   "2147483648", "-2147483649",
                                   "4294967297", "9223372036854775808",
                                   "1e300",      R"("")",
                                   R"("1.5")",   R"("1.0")",
                                   R"(" 1")",    R"("1 ")",
                                   R"("+1")",    R"("1abc")",
                                   R"("0x1")",   R"("2147483648")",
                                   R"("true")",  R"("1\u0000")"};

TEST(Identity, ThrowsATypeErrorForAVersionThatIsNoInteger) {
    for (const char* json : kNoVersions) {
        SCOPED_TRACE(json);
        APIRequest request(Parse(R"({"getParam": {"version": 7}})"));
        EXPECT_THROW(request.InitParam(Query("version", Parse(json)), false), Json::LogicError);
        EXPECT_EQ(request.GetAPIVersion(), 7) << "stays untouched on failure";
        EXPECT_THROW(APIRequest(Query("version", Parse(json))), Json::LogicError);
    }
}

TEST(Identity, ReadsNumbersAndBooleansAsNames) {
    for (const char* name : {"api", "method"}) {
        APIRequest request((Json::Value()));
        const auto read = [&](const Json::Value& value) {
            request.InitParam(Query(name, value), false);
            return std::string(name) == "api" ? request.GetAPIClass() : request.GetAPIMethod();
        };
        EXPECT_EQ(read("text"), "text");
        EXPECT_EQ(read(""), "");
        EXPECT_EQ(read(5), "5");
        EXPECT_EQ(read(-5), "-5");
        EXPECT_EQ(read(true), "true");
        EXPECT_EQ(read(1.5), "1.5");
        EXPECT_EQ(read(Json::Value()), "");
        EXPECT_EQ(read(std::string("a\0b", 3)), std::string("a\0b", 3));
    }
}

TEST(Identity, ThrowsATypeErrorForANameThatIsNoText) {
    for (const char* name : {"api", "method"}) {
        for (const char* json : {"[]", R"(["a"])", "{}", R"({"a": 1})"}) {
            APIRequest request(Parse(R"({"getParam": {"api": "kept", "method": "kept"}})"));
            EXPECT_THROW(request.InitParam(Query(name, Parse(json)), false), Json::LogicError);
            EXPECT_EQ(request.GetAPIClass(), "kept");
            EXPECT_EQ(request.GetAPIMethod(), "kept");
        }
    }
}

TEST(Identity, ThrowsForTheBodyAsForTheQuery) {
    EXPECT_THROW(APIRequest(Parse(R"({"postParam": {"version": "abc"}})")), Json::LogicError);
    EXPECT_THROW(APIRequest(Parse(R"({"getParam": {"version": 1}, "postParam": {"api": []}})")),
                 Json::LogicError);
}

}  // namespace
