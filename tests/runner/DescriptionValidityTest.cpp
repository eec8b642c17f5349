#include "tests/runner/RunnerFixture.h"

namespace {

using runner::Description;
using runner::Parse;

class DescriptionValidity : public runner::Fixture {};

TEST_F(DescriptionValidity, WantsAnObject) {
    for (const char* text : {"null", "1", "true", "\"text\"", "[]", "[{}]", "{}"}) {
        Json::Value desc = Parse(text);
        EXPECT_EQ(Runner().CheckLibDescription(desc), 0) << text;
        EXPECT_EQ(desc, Parse(text));
    }
}

struct MemberCase {
    const char* member;
    const char* value;  // null for a description without it
    bool valid;
};

const MemberCase kMembers[] = {
    {"lib", nullptr, false},
    {"lib", "null", false},
    {"lib", "1", false},
    {"lib", "[\"a\"]", false},
    {"lib", "{}", false},
    {"lib", "\"\"", true},
    {"minVersion", nullptr, false},
    {"minVersion", "null", false},
    {"minVersion", "\"1\"", false},
    {"minVersion", "1.5", false},
    {"minVersion", "true", false},
    {"minVersion", "[]", false},
    {"minVersion", "4294967296", false},
    {"minVersion", "9", true},
    {"minVersion", "-1", true},
    {"maxVersion", nullptr, false},
    {"maxVersion", "\"1\"", false},
    {"maxVersion", "1.5", false},
    {"maxVersion", "0", true},
    {"methods", nullptr, false},
    {"methods", "null", false},
    {"methods", "[]", false},
    {"methods", "\"ok\"", false},
    {"methods", "1", false},
    {"methods", "{}", true},
    {"methods", "{\"1\": 5, \"x\": null}", true},
    {"priority", nullptr, true},
    {"priority", "10", true},
    {"priority", "-10", true},
    {"priority", "0", true},
    {"priority", "11", false},
    {"priority", "-11", false},
    {"priority", "2147483648", false},
    {"priority", "1e300", false},
    {"priority", "1.5", false},
    {"priority", "\"1\"", false},
    {"priority", "null", false},
    {"priority", "true", false},
    {"authLevel", "\"odd\"", true},
    {"allowUser", "7", true},
    {"requestFormat", "[]", true},
    {"unknown", "{}", true},
};

TEST_F(DescriptionValidity, RestsOnTheTypesOfTheRequiredMembersAndThePriority) {
    for (const MemberCase& row : kMembers) {
        Json::Value desc = Description();
        if (row.value == nullptr) {
            desc.removeMember(row.member);
        } else {
            desc[row.member] = Parse(row.value);
        }
        const Json::Value before = desc;
        EXPECT_EQ(Runner().CheckLibDescription(desc), row.valid ? 1 : 0)
            << row.member << " " << (row.value != nullptr ? row.value : "absent");
        EXPECT_EQ(desc, before) << "a look must not insert";
    }
}

TEST_F(DescriptionValidity, DropsTheWholeEntryForItsPriority) {
    Json::Value content(Json::objectValue);
    content["A.Good"] = content["A.High"] = content["A.Low"] = Description();
    content["A.Good"]["priority"] = -10;
    content["A.High"]["priority"] = 11;
    content["A.Low"]["priority"] = -11;
    for (const char* api : {"A.Good", "A.High", "A.Low"}) {
        Describe(api + std::string(".lib"), content);
    }
    EXPECT_NE(Code("A.Good", 1, "ok"), 102);
    EXPECT_EQ(Code("A.High", 1, "ok"), 102);
    EXPECT_EQ(Code("A.Low", 1, "ok"), 102);
}

class DescriptionDefaults : public runner::Fixture {};

TEST_F(DescriptionDefaults, FillWhatTheDescriptionLacks) {
    Defaults(R"({"authLevel": 7, "allowUser": ["x"], "priority": 3, "requestFormat": "XML",
                 "methods": {}, "other": 1})");
    Json::Value desc(Json::objectValue);
    Json::Value& filled = Runner().ApplyLibDef(desc);
    EXPECT_EQ(&filled, &desc);
    EXPECT_EQ(desc, Parse(R"({"authLevel": 7, "allowUser": ["x"], "priority": 3,
                              "requestFormat": "JSON"})"));
}

TEST_F(DescriptionDefaults, LeaveWhatTheDescriptionHas) {
    const char text[] = R"({"authLevel": null, "allowUser": false, "priority": -4,
                            "requestFormat": "OWN"})";
    Json::Value desc = Parse(text);
    EXPECT_EQ(Runner().ApplyLibDef(desc), Parse(text));
}

TEST_F(DescriptionDefaults, AreNullWhereTheDefaultsFileLacksThem) {
    Defaults("{}");
    Json::Value desc(Json::objectValue);
    EXPECT_EQ(Runner().ApplyLibDef(desc), Parse(R"({"authLevel": null, "allowUser": null,
                                                    "priority": null, "requestFormat": "JSON"})"));
    EXPECT_EQ(Runner().libDef, Json::Value(Json::objectValue)) << "a look must not insert";
}

TEST_F(DescriptionDefaults, AreReadOnceByTheConstructor) {
    Defaults(R"({"authLevel": 3})");
    (void)Runner();
    Defaults(R"({"authLevel": 4})");
    EXPECT_EQ(Runner().libDef, Parse(R"({"authLevel": 3})"));
    Json::Value desc(Json::objectValue);
    EXPECT_EQ(Runner().ApplyLibDef(desc)["authLevel"], Json::Value(3));
}

TEST_F(DescriptionDefaults, AreEmptyWithoutAReadableFile) {
    for (const char* text : {"", "{", "[1]", "\"text\"", "{} x"}) {
        Defaults(text);
        runner::OpenRunner runner;
        EXPECT_EQ(runner.libDef, Json::Value(Json::objectValue)) << text;
        EXPECT_EQ(runner.libDesc, Json::Value(Json::objectValue));
    }
}

}  // namespace
