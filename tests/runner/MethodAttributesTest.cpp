#include "tests/runner/RunnerFixture.h"

namespace {

using runner::Description;
using runner::Parse;

class MethodAttributes : public runner::Fixture {
  protected:
    void SetUp() override {
        Defaults(R"({"methods": {"allowUpload": false, "byDefault": true}})");
    }

    void List(const std::string& methods) {
        Json::Value content(Json::objectValue);
        content["A.B"] = Description(methods);
        Describe("A.B.lib", content);
    }

    const Json::Value& Of(const std::string& method, int version = 1) {
        return Runner().GetMethod("A.B", version, method);
    }

    const Json::Value defaults = Parse(R"({"allowUpload": false, "byDefault": true})");
};

TEST_F(MethodAttributes, AreTheDefaultsOfAnUnknownAPI) {
    EXPECT_EQ(Of("list"), defaults);
    EXPECT_EQ(Runner().GetMethod("", 1, "list"), defaults);
    EXPECT_EQ(Runner().GetMethod("../x", 1, "list"), defaults);
    EXPECT_TRUE(Runner().libDesc.empty()) << "a look must not insert";
}

TEST_F(MethodAttributes, AreTheDefaultsOfAPlainText) {
    List(R"({"1": ["list"]})");
    EXPECT_EQ(Of("list"), defaults);
    EXPECT_EQ(Of("unlisted"), defaults);
}

TEST_F(MethodAttributes, AreTheValueOfTheEntry) {
    List(R"({"1": ["list", {"send": {"allowUpload": true}}, {"get": {}}]})");
    EXPECT_EQ(Of("send"), Parse(R"({"allowUpload": true})"));
    EXPECT_EQ(Of("get"), Json::Value(Json::objectValue));
}

TEST_F(MethodAttributes, AreTheDefaultsOfAnAPIThatItsFileLacks) {
    List(R"({"1": [{"list": {"n": 1}}]})");
    EXPECT_EQ(Runner().GetMethod("A.B.C", 1, "list"), defaults);
    EXPECT_EQ(Runner().libDesc.getMemberNames(), std::vector<std::string>({"A.B"}));
}

TEST_F(MethodAttributes, BelongToOneVersion) {
    List(R"({"1": [{"send": {"v": 1}}], "2": [{"send": {"v": 2}}], "02": [{"send": {"v": 3}}]})");
    EXPECT_EQ(Of("send", 1)["v"], Json::Value(1));
    EXPECT_EQ(Of("send", 2)["v"], Json::Value(2));
    EXPECT_EQ(Of("send", 3), defaults);
    EXPECT_EQ(Of("send", -1), defaults);
}

TEST_F(MethodAttributes, AreOfTheFirstEntryThatMatches) {
    List(R"({"1": ["send", 5, null, [], {}, {"send": {"n": 1}}, {"send": {"n": 2}}]})");
    EXPECT_EQ(Of("send"), Parse(R"({"n": 1})"));
}

TEST_F(MethodAttributes, AreOfAnEntrysFirstMemberInByteOrderOnly) {
    List(R"({"1": [{"b": {"n": 2}, "a": {"n": 1}, "C": {"n": 3}}]})");
    EXPECT_EQ(Of("C"), Parse(R"({"n": 3})"));
    EXPECT_EQ(Of("a"), defaults);
    EXPECT_EQ(Of("b"), defaults);
}

TEST_F(MethodAttributes, ListAMethodThatIsASecondMemberWithoutGivingItAny) {
    List(R"({"1": [{"a": {}, "b": {"allowUpload": true}}]})");
    EXPECT_EQ(Code("A.B", 1, "b"), 111) << "listed: only the library is missing";
    EXPECT_FALSE(Runner().GetMethodAttr("A.B", 1, "b", "allowUpload"));
}

TEST_F(MethodAttributes, AreTheDefaultsWhereTheVersionHoldsNoList) {
    for (const char* list : {"5", "null", "\"send\"", R"({"send": {"n": 1}})"}) {
        runner::OpenRunner runner;
        List(R"({"1": )" + std::string(list) + "}");
        EXPECT_EQ(runner.GetMethod("A.B", 1, "send"), defaults) << list;
    }
}

TEST_F(MethodAttributes, AreNullWithoutDefaults) {
    Defaults("{}");
    EXPECT_TRUE(Of("list").isNull());
    EXPECT_TRUE(Runner().libDef.empty()) << "a look must not insert";
    EXPECT_FALSE(Runner().GetMethodAttr("A.B", 1, "list", "allowUpload"));
}

TEST_F(MethodAttributes, AreNotInsertedByLooking) {
    List(R"({"1": [{"send": {"a": true}}]})");
    ASSERT_EQ(Runner().InitLibDesc(Runner().libDesc, "A.B"), 1);
    const Json::Value before = Runner().libDesc;
    (void)Of("send");
    (void)Of("other", 7);
    (void)Runner().GetMethodAttr("A.B", 1, "send", "missing");
    (void)Runner().GetMethodAttr("A.B", 9, "send", "missing");
    EXPECT_EQ(Runner().libDesc, before);
    EXPECT_EQ(Runner().libDef["methods"], defaults);
}

struct AttributeCase {
    const char* value;
    bool reads;
};

const AttributeCase kValues[] = {
    {"true", true},      {"false", false},   {"1", true},   {"0", false},  {"null", false},
    {"\"\"", false},     {"\"true\"", true}, {"[]", false}, {"[0]", true}, {"{}", false},
    {"\"false\"", true}, {"0.5", true},      {"-1", true},
};

TEST_F(MethodAttributes, ReadAsBooleans) {
    for (const AttributeCase& row : kValues) {
        runner::OpenRunner runner;
        List(R"({"1": [{"send": {"attr": )" + std::string(row.value) + "}}]}");
        EXPECT_EQ(runner.GetMethodAttr("A.B", 1, "send", "attr"), row.reads) << row.value;
    }
}

TEST_F(MethodAttributes, DoNotMixWithTheDefaults) {
    List(R"({"1": [{"send": {"allowUpload": true}}, "list"]})");
    EXPECT_FALSE(Runner().GetMethodAttr("A.B", 1, "send", "byDefault"));
    EXPECT_TRUE(Runner().GetMethodAttr("A.B", 1, "list", "byDefault"));
    EXPECT_TRUE(Runner().GetMethodAttr("A.None", 1, "list", "byDefault"));
}

TEST_F(MethodAttributes, ThatAreNoObjectGiveWayToTheDefaults) {
    for (const char* value : {"null", "5", "true", "\"byDefault\"", "[\"byDefault\"]"}) {
        runner::OpenRunner runner;
        List(R"({"1": [{"send": )" + std::string(value) + "}]}");
        EXPECT_EQ(runner.GetMethod("A.B", 1, "send"), Parse(value));
        EXPECT_TRUE(runner.GetMethodAttr("A.B", 1, "send", "byDefault")) << value;
        EXPECT_FALSE(runner.GetMethodAttr("A.B", 1, "send", "other")) << value;
    }
}

TEST_F(MethodAttributes, OfDefaultsThatAreNoObjectAreFalse) {
    for (const char* value : {"null", "5", "true", "\"attr\"", "[\"attr\"]"}) {
        Defaults(R"({"methods": )" + std::string(value) + "}");
        runner::OpenRunner runner;
        EXPECT_FALSE(runner.GetMethodAttr("A.B", 1, "send", "attr")) << value;
    }
}

TEST_F(MethodAttributes, OfARequestAreOfItsIdentity) {
    List(R"({"1": [{"send": {"attr": true}}, {"get": {"attr": false}}]})");
    TALO::APIRequest send(Post("A.B", 1, "send"));
    TALO::APIRequest get(Post("A.B", 1, "get"));
    EXPECT_TRUE(Runner().GetMethodAttr(&send, "attr"));
    EXPECT_FALSE(Runner().GetMethodAttr(&get, "attr"));
}

TEST_F(MethodAttributes, OfNoRequestOrNoNameAreFalse) {
    Defaults(R"({"methods": {"": true, "attr": true}})");
    TALO::APIRequest request(Post("A.B", 1, "list"));
    EXPECT_FALSE(Runner().GetMethodAttr(nullptr, "attr"));
    EXPECT_FALSE(Runner().GetMethodAttr(&request, ""));
    EXPECT_TRUE(Runner().GetMethodAttr(&request, "attr"));
}

}  // namespace
