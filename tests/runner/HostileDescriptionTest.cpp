#include "tests/fake/FakePlatform.h"
#include "tests/runner/RunnerFixture.h"

namespace {

using runner::Description;

class HostileDescription : public runner::Fixture {
  protected:
    // The code of A.B, version 1, "list", under the given description file.
    int Under(const std::string& content) {
        Describe("A.B.lib", content);
        return Code("A.B", 1, "list");
    }

    int UnderMethods(const std::string& methods) {
        Json::Value content(Json::objectValue);
        content["A.B"] = Description(methods);
        Describe("A.B.lib", content);
        return Code("A.B", 1, "list");
    }
};

TEST_F(HostileDescription, FileIsNoAPI) {
    const std::string files[] = {
        "",
        " ",
        "{",
        "{}",
        "[]",
        "[{\"A.B\": {}}]",
        "null",
        "5",
        "{\"A.B\": ",
        "{\"A.B\": null}",
        "{\"A.B\": []}",
        "{\"A.B\": \"text\"}",
        "{\"A.B\": {}}",
        "{\"\": {}}",
        "{\"A.B\": {\"lib\": {}, \"minVersion\": [], \"maxVersion\": {}, \"methods\": 1}}",
        std::string("{}\0", 3),
        std::string(100000, '['),
        std::string(100, '[') + std::string(100, ']'),
        "\xff\xfe{\"A.B\": {}}",
    };
    for (const std::string& file : files) {
        EXPECT_EQ(Under(file), 102) << file.substr(0, 80);
    }
}

struct MethodsCase {
    const char* methods;
    int code;
};

// 111 is the code behind all checks: only the library is missing.
const MethodsCase kMethods[] = {
    {R"({})", 103},
    {R"({"1": null})", 103},
    {R"({"1": 5})", 103},
    {R"({"1": "list"})", 103},
    {R"({"1": {"list": {}}})", 103},
    {R"({"1": []})", 103},
    {R"({"1": [null, 1, 1.5, true, {}, [], ["list"], [{"list": {}}], {"x": {"list": 1}}]})", 103},
    {R"({"1": ["LIST", "lis", "list ", ""]})", 103},
    {R"({"01": ["list"], "1.0": ["list"], " 1": ["list"], "": ["list"]})", 103},
    {R"({"1": [null, 1, {}, [], "list"]})", 111},
    {R"({"1": [{"list": null}]})", 111},
    {R"({"1": [{"list": 5}]})", 111},
    {R"({"1": [{"list": [1, 2]}]})", 111},
    {R"({"1": [{"list": {"allowUpload": [], "allowDemo": {}}}]})", 111},
    {R"({"1": [{"list": {"list": {"list": {}}}}]})", 111},
    {R"({"1": [{"a": 1, "list": 2}]})", 111},
};

TEST_F(HostileDescription, ListsOfMethodsAreReadWithCare) {
    for (const MethodsCase& row : kMethods) {
        EXPECT_EQ(UnderMethods(row.methods), row.code) << row.methods;
    }
}

TEST_F(HostileDescription, OfTenThousandMethodsIsServed) {
    std::string methods = R"({"1": [)";
    for (int number = 0; number < 10000; ++number) {
        methods += "{\"m" + std::to_string(number) + "\": {\"allowUpload\": true}},";
    }
    EXPECT_EQ(UnderMethods(methods + R"("list"]})"), 111);
    EXPECT_EQ(Code("A.B", 1, "m9999"), 111);
    EXPECT_EQ(Code("A.B", 1, "m10000"), 103);
    EXPECT_TRUE(Runner().GetMethodAttr("A.B", 1, "m9999", "allowUpload"));
}

TEST_F(HostileDescription, PointsAtWhatIsNoLibrary) {
    const std::string text = std::string(TEST_DESCRIPTION_DIR) + "/Test.Text.lib";
    for (const std::string& path : {std::string(), std::string("/"), std::string(TEST_MODULE_DIR),
                                    std::string("/dev/null"), text, runner::ModulePath("NotThere"),
                                    std::string("no such library"), std::string(70000, 'x')}) {
        Json::Value content(Json::objectValue);
        content["A.B"] = Description();
        content["A.B"]["lib"] = path;
        Describe("A.B.lib", content);
        EXPECT_EQ(Code("A.B", 1, "ok"), 111) << path.substr(0, 80);
    }
}

TEST_F(HostileDescription, OfDefaultsDoesNoHarm) {
    for (const char* defaults :
         {"[]", "{}", R"({"methods": 5, "priority": "high"})", R"({"priority": 1e300})",
          R"({"methods": {"allowUpload": "x", "allowDownload": [1]}, "priority": {}})"}) {
        Defaults(defaults);
        Install("Test.NullCheck");
        EXPECT_EQ(Code("Test.NullCheck", 1, "ok"), 0) << defaults;
    }
}

TEST_F(HostileDescription, NameLeavesTheFolderNever) {
    const std::string letters(70000, 'A');
    for (const std::string& api :
         {std::string("../../etc/x"), std::string("A..B"), std::string("A/../../B"), letters,
          std::string("A\0B", 3), std::string(".A"), std::string("-A"), letters + ".B.C"}) {
        EXPECT_EQ(Code(api, 1, "list"), 102) << api.substr(0, 40);
    }
    EXPECT_EQ(Code("", 1, "list"), 101);
}

}  // namespace
