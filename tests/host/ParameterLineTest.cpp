#include "hosts/linux/util/ParameterLine.h"

#include <gtest/gtest.h>

#include <string>

#include "hosts/linux/util/JsonGrammar.h"
#include "tests/support/Json.h"

namespace {

std::string ArrayOf(size_t values) {
    std::string text = "[0";
    for (size_t value = 1; value < values; ++value) {
        text += ",0";
    }
    return text + "]";
}

// What goes beyond the bound is kept as text, which costs what it weighs.
TEST(ParameterLine, BoundsTheValuesOfAllPairsTogether) {
    const std::string array = ArrayOf(999);
    std::string line;
    for (int pair = 0; pair < 501; ++pair) {
        line += "p" + std::to_string(pair) + "=" + array + "&";
    }
    Json::Value params;
    ASSERT_TRUE(host::MergeParameterLine(line + "last=1", params, true, true));
    EXPECT_TRUE(params["p0"].isArray());
    EXPECT_TRUE(params["p499"].isArray());
    EXPECT_EQ(params["p500"].asString(), array);
    EXPECT_EQ(params["last"], "1");
}

TEST(ParameterLine, ReadsAnObjectOfTooManyValuesAsNoObject) {
    Json::Value params;
    ASSERT_TRUE(host::MergeParameterLine("{\"a\":" + ArrayOf(host::kMaxJsonValues) + "}", params,
                                         true, true));
    EXPECT_FALSE(params.isMember("a"));
}

}  // namespace
