#include "webapi/APIBase.h"

#include <gtest/gtest.h>

#include "tests/support/Json.h"

using support::Parse;

namespace {

class Sections : public TALO::APIBase {
  public:
    Sections() {
        store["known"] = Json::Value(Json::objectValue);
    }
    virtual ~Sections() {}
};

TEST(KeyedStore, RefusesAKeyInASectionThatWasNeverCreated) {
    Sections sections;
    EXPECT_FALSE(sections.SetData("unknown", "key", 1, false));
    EXPECT_FALSE(sections.HasData("unknown", "key"));
    EXPECT_EQ(sections.GetData("unknown", "", Json::Value("none")), Json::Value("none"));
}

TEST(KeyedStore, MergesOnlyTextsWhenAskedTo) {
    Sections sections;
    EXPECT_TRUE(sections.SetData("known", Parse(R"({"n": 7, "s": "text"})"), true));
    EXPECT_EQ(sections.GetData("known", "", Json::Value()), Parse(R"({"s": "text"})"));
}

}  // namespace
