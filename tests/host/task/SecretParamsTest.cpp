#include <fstream>
#include <iterator>

#include "TaskRoot.h"
#include "tests/support/Json.h"

namespace {

struct Row {
    const char* name;
    const char* names;
    const char* info;
    const char* stored;
};

class SecretParams : public TaskRoot, public ::testing::WithParamInterface<Row> {};

TEST_P(SecretParams, AreMaskedWhereInfoIsStored) {
    const Row& row = GetParam();
    ORB::Task task("anna", "one");
    task.setSecretParams(support::Parse(row.names));
    ASSERT_TRUE(task.setProperty("info", support::Parse(row.info)));
    EXPECT_EQ(task.getProperty("info"), support::Parse(row.stored));
    EXPECT_EQ(Stored("one", "info"), support::Parse(row.stored));
}

INSTANTIATE_TEST_SUITE_P(
    Rows, SecretParams,
    ::testing::Values(Row{"theSession", "[]", "{\"param\":{\"_sid\":\"x\",\"a\":1}}",
                          "{\"param\":{\"_sid\":\"*****\",\"a\":1}}"},
                      Row{"thePassword", "[]", "{\"param\":{\"passwd\":{\"a\":1}}}",
                          "{\"param\":{\"passwd\":\"*****\"}}"},
                      Row{"namesGiven", "[\"key\",\"pin\"]",
                          "{\"param\":{\"key\":1,\"pin\":null,\"_sid\":2}}",
                          "{\"param\":{\"key\":\"*****\",\"pin\":\"*****\",\"_sid\":\"*****\"}}"},
                      Row{"othersIgnored", "[1,null,[\"a\"],{\"a\":1},\"b\"]",
                          "{\"param\":{\"a\":1,\"b\":2}}", "{\"param\":{\"a\":1,\"b\":\"*****\"}}"},
                      Row{"noArray", "{\"a\":\"b\"}", "{\"param\":{\"a\":1,\"b\":2}}",
                          "{\"param\":{\"a\":1,\"b\":2}}"},
                      Row{"text", "\"a\"", "{\"param\":{\"a\":1}}", "{\"param\":{\"a\":1}}"},
                      Row{"onlyInParam", "[\"api\"]", "{\"api\":\"x\",\"_sid\":1,\"param\":{}}",
                          "{\"api\":\"x\",\"_sid\":1,\"param\":{}}"},
                      Row{"nothingAdded", "[\"a\"]", "{\"param\":{}}", "{\"param\":{}}"},
                      Row{"paramNoObject", "[\"a\"]", "{\"param\":[\"a\"]}", "{\"param\":[\"a\"]}"},
                      Row{"noParam", "[\"a\"]", "{\"x\":1}", "{\"x\":1}"},
                      Row{"infoNoObject", "[\"a\"]", "[1]", "[1]"},
                      Row{"null", "null", "null", "null"}),
    [](const auto& row) { return std::string(row.param.name); });

TEST_F(TaskRoot, LeavesNoSecretInTheFiles) {
    ORB::Task task("anna", "one");
    task.setSecretParams(support::Parse("[\"key\"]"));
    task.beginUpdate();
    ASSERT_TRUE(task.setProperty(
        "info", support::Parse("{\"param\":{\"_sid\":\"SECRET1\",\"key\":\"SECRET2\"}}")));
    ASSERT_TRUE(task.setProperty("kept", "VISIBLE"));
    ASSERT_TRUE(task.endUpdate());
    std::string content;
    for (const char* end : {"", "-wal"}) {
        std::ifstream file(Database() + end, std::ios::binary);
        content.append(std::istreambuf_iterator<char>(file), {});
    }
    EXPECT_EQ(content.find("SECRET"), std::string::npos);
    EXPECT_NE(content.find("VISIBLE"), std::string::npos);
}

TEST_F(TaskRoot, LeavesOtherPropertiesUnmasked) {
    const Json::Value value = support::Parse("{\"param\":{\"_sid\":\"x\"}}");
    ASSERT_TRUE(ORB::Task("anna", "one").setProperty("body", value));
    EXPECT_EQ(Stored("one", "body"), value);
}

}  // namespace
