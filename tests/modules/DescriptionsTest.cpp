#include <dlfcn.h>
#include <gtest/gtest.h>

#include <set>
#include <string>
#include <utility>

#include "tests/fake/FakePlatform.h"
#include "tests/runner/RunnerFixture.h"

namespace {

typedef std::set<std::pair<int, std::string>> Methods;

class TestModules : public runner::Fixture {
  protected:
    Methods InDescription(const std::string& api) {
        Json::Value descs(Json::objectValue);
        Methods methods;
        EXPECT_TRUE(Runner().InitLibDesc(descs, api)) << api;
        const Json::Value& versions = descs[api]["methods"];
        for (auto version = versions.begin(); version != versions.end(); ++version) {
            for (const Json::Value& entry : *version) {
                methods.emplace(std::stoi(version.name()),
                                entry.isString() ? entry.asString() : entry.begin().name());
            }
        }
        return methods;
    }

    static Methods InTable(const std::string& api, const std::string& module) {
        Methods methods;
        void* handle = dlopen(runner::ModulePath(module).c_str(), RTLD_LAZY);
        const auto get =
            reinterpret_cast<TALO::APITableFunc>(handle ? dlsym(handle, "GetAPITable") : nullptr);
        if (get == nullptr) {
            ADD_FAILURE() << module;
            return methods;
        }
        for (const TALO::_tag_API_TABLE* row = get(); row->apiName != nullptr; ++row) {
            EXPECT_EQ(row->apiName, api);
            methods.emplace(row->version, row->method);
        }
        (void)dlclose(handle);
        return methods;
    }
};

TEST_F(TestModules, ServeExactlyWhatTheirDescriptionsListBesidesTheDeliberateGap) {
    const std::pair<const char*, const char*> modules[] = {
        {"Test.Basic", "TestBasic"}, {"Test.Check", "TestCheck"}, {"Test.Guard", "TestGuard"}};
    for (const auto& [api, module] : modules) {
        Install(api);
        Methods served = InTable(api, module);
        served.emplace(1, "notInTable");
        EXPECT_EQ(InDescription(api), served) << api;
    }
}

TEST_F(TestModules, HaveValidDescriptionsForTheBrokenOnesToo) {
    for (const char* api : {"Test.NoTable", "Test.NullTable", "Test.NullCheck", "Test.Missing",
                            "Test.Folder", "Test.Text"}) {
        Install(api);
        EXPECT_EQ(InDescription(api), Methods({{1, "ok"}})) << api;
    }
}

}  // namespace
