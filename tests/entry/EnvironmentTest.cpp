#include "src/entry/Environment.h"

#include <stdlib.h>

#include "tests/entry/EntryTest.h"

namespace {

class RequestEnvironment : public ::testing::Test {
  protected:
    RequestEnvironment() {
        (void)unsetenv(kName);
    }
    ~RequestEnvironment() override {
        (void)unsetenv(kName);
    }

    static constexpr char kName[] = "ENVIRONMENT_TEST";
    Json::Value changes;
};

TEST_F(RequestEnvironment, GoesBackToWhatItWas) {
    (void)setenv(kName, "before", 1);
    TALO::SetForRequest(&changes, kName, "first");
    TALO::SetForRequest(&changes, kName, "second");
    EXPECT_STREQ(getenv(kName), "second");
    TALO::EndEnvironment(changes);
    EXPECT_STREQ(getenv(kName), "before");
}

TEST_F(RequestEnvironment, LosesWhatItDidNotHave) {
    TALO::SetForRequest(&changes, kName, "value");
    TALO::EndEnvironment(changes);
    EXPECT_EQ(getenv(kName), nullptr);
}

TEST_F(RequestEnvironment, KeepsWhatSomebodyElseSetMeanwhile) {
    TALO::SetForRequest(&changes, kName, "value");
    (void)setenv(kName, "other", 1);
    TALO::EndEnvironment(changes);
    EXPECT_STREQ(getenv(kName), "other");
    (void)unsetenv(kName);
    TALO::EndEnvironment(changes);
    EXPECT_EQ(getenv(kName), nullptr);
}

TEST_F(RequestEnvironment, IsLeftAloneWhereNothingWasSet) {
    TALO::EndEnvironment(Json::Value());
    TALO::EndEnvironment(Json::Value(Json::objectValue));
}

class EntryEnvironment : public EntryTest {};

TEST_F(EntryEnvironment, HasNoSessionOfAnEarlierEntry) {
    Inside(Get("_sid=XYZ"), [](ProbeEntry&) {
        {
            ProbeEntry first;
            EXPECT_TRUE(first.Initialize(Json::Value()));
            EXPECT_STREQ(getenv("HTTP_COOKIE"), "id=XYZ");
        }
        EXPECT_EQ(getenv("HTTP_COOKIE"), nullptr);
    });
}

}  // namespace
