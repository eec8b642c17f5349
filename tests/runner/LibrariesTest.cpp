#include <dlfcn.h>

#include "tests/runner/RunnerFixture.h"

namespace {

using runner::ModulePath;

bool IsLoaded(const std::string& path) {
    void* handle = dlopen(path.c_str(), RTLD_LAZY | RTLD_NOLOAD);
    if (handle != nullptr) {
        (void)dlclose(handle);
    }
    return handle != nullptr;
}

class Libraries : public runner::Fixture {
  protected:
    // Opens the library of that path, as a description would name it.
    int Open(const Json::Value& path) {
        TALO::APIRequest request{Json::Value()};
        Json::Value description(Json::objectValue);
        description["lib"] = path;
        request.InitAPIInfo(description);
        table = nullptr;
        checkTable = nullptr;
        return Runner().OpenLib(&request, &table, &checkTable);
    }

    TALO::_tag_API_TABLE* table = nullptr;
    TALO::_tag_API_CHECK_TABLE* checkTable = nullptr;
};

TEST_F(Libraries, AreNotOpenedWithoutARequestOrAPlaceForTheTable) {
    TALO::APIRequest request{Json::Value()};
    EXPECT_EQ(Runner().OpenLib(nullptr, &table, &checkTable), 0);
    EXPECT_EQ(Runner().OpenLib(&request, nullptr, &checkTable), 0);
    ASSERT_EQ(log.Lines().size(), 2u);
    EXPECT_TRUE(Logged("Bad parameters"));
    EXPECT_EQ(log.Lines()[0].priority, LOG_ERR);
    EXPECT_TRUE(Runner().libHandles.empty());
}

TEST_F(Libraries, ThatCannotBeOpenedAreLoggedWithTheReason) {
    EXPECT_EQ(Open("/nowhere/None.so"), 0);
    EXPECT_EQ(table, nullptr);
    EXPECT_EQ(checkTable, nullptr);
    EXPECT_TRUE(Runner().libHandles.empty());
    EXPECT_TRUE(
        Logged("cannot open library: /nowhere/None.so. error = /nowhere/None.so: cannot "
               "open shared object file: No such file or directory"));
    EXPECT_EQ(log.Lines().size(), 1u);
}

TEST_F(Libraries, GiveBothTables) {
    ASSERT_EQ(Open(ModulePath("TestCheck")), 1);
    ASSERT_NE(table, nullptr);
    EXPECT_STREQ(table->apiName, "Test.Check");
    ASSERT_NE(checkTable, nullptr);
    EXPECT_STREQ(checkTable->apiName, "Test.Other");
    EXPECT_TRUE(log.Lines().empty());
}

TEST_F(Libraries, GiveTheMethodTableAloneWhenAsked) {
    TALO::APIRequest request{Json::Value()};
    Json::Value description(Json::objectValue);
    description["lib"] = ModulePath("TestNullCheck");
    request.InitAPIInfo(description);
    EXPECT_EQ(Runner().OpenLib(&request, &table, nullptr), 1);
    EXPECT_NE(table, nullptr);
    EXPECT_TRUE(log.Lines().empty()) << "the check table was not asked for";
}

TEST_F(Libraries, WithoutACheckTableAreOpenedWithoutAWord) {
    EXPECT_EQ(Open(ModulePath("TestBasic")), 1);
    EXPECT_NE(table, nullptr);
    EXPECT_EQ(checkTable, nullptr);
    EXPECT_TRUE(log.Lines().empty());
}

TEST_F(Libraries, WithANullCheckTableAreOpenedAndLogged) {
    EXPECT_EQ(Open(ModulePath("TestNullCheck")), 1);
    EXPECT_NE(table, nullptr);
    EXPECT_EQ(checkTable, nullptr);
    EXPECT_TRUE(Logged("cannot get api check table"));
    EXPECT_EQ(log.Lines().size(), 1u);
}

TEST_F(Libraries, WithoutAMethodTableFail) {
    EXPECT_EQ(Open(ModulePath("TestNoTable")), 0);
    EXPECT_EQ(table, nullptr);
    ASSERT_EQ(log.Lines().size(), 2u);
    EXPECT_EQ(log.Lines()[0].priority, LOG_DEBUG);
    EXPECT_NE(log.Lines()[0].text.find("cannot load table: "), std::string::npos);
    EXPECT_NE(log.Lines()[0].text.find("GetAPITable"), std::string::npos);
    EXPECT_EQ(log.Lines()[1].priority, LOG_ERR);
    EXPECT_TRUE(Logged("Get API Table Fail"));
    EXPECT_EQ(Runner().libHandles.count(ModulePath("TestNoTable")), 1u) << "it stays open";
}

TEST_F(Libraries, WithANullMethodTableFail) {
    EXPECT_EQ(Open(ModulePath("TestNullTable")), 0);
    EXPECT_EQ(table, nullptr);
    EXPECT_TRUE(Logged("cannot get api table"));
    EXPECT_TRUE(Logged("Get API Table Fail"));
    EXPECT_EQ(log.Lines().size(), 2u);
}

TEST_F(Libraries, OfANamelessPathFail) {
    EXPECT_EQ(Open(""), 0);
    EXPECT_EQ(Open(Json::Value()), 0);
    EXPECT_EQ(Open(Json::Value(Json::arrayValue)), 0);
    EXPECT_TRUE(Logged("Get API Table Fail"));
}

TEST_F(Libraries, AreOpenedOncePerPath) {
    const std::string path = ModulePath("TestNoTable");
    ASSERT_FALSE(IsLoaded(path));
    (void)Open(path);
    ASSERT_EQ(Runner().libHandles.size(), 1u);
    void* handle = Runner().libHandles[path];
    (void)Open(path);
    EXPECT_EQ(Runner().libHandles.size(), 1u);
    EXPECT_EQ(Runner().libHandles[path], handle);
    // One close takes it away, so it was opened once.
    Runner().CloseLib();
    EXPECT_FALSE(IsLoaded(path));
}

TEST_F(Libraries, AreOpenedAgainUnderAnotherSpelling) {
    const std::string path = ModulePath("TestBasic");
    const std::string other = std::string(TEST_MODULE_DIR) + "/./TestBasic.so";
    ASSERT_EQ(Open(path), 1);
    ASSERT_EQ(Open(other), 1);
    EXPECT_EQ(Runner().libHandles.size(), 2u);
    EXPECT_EQ(Runner().libHandles.begin()->first, other) << "ordered by path";
}

TEST_F(Libraries, AreKnownByTheirPathBeforeTheLoaderIsAsked) {
    ASSERT_EQ(Open(ModulePath("TestBasic")), 1);
    void* handle = Runner().libHandles[ModulePath("TestBasic")];
    Runner().libHandles["no such path"] = handle;
    EXPECT_EQ(Open("no such path"), 1);
    Runner().libHandles.erase("no such path");
}

TEST_F(Libraries, AreClosedOnDemandAndByTheDestructor) {
    const std::string path = ModulePath("TestNullTable");
    {
        runner::OpenRunner runner;
        TALO::APIRequest request{Json::Value()};
        Json::Value description(Json::objectValue);
        description["lib"] = path;
        request.InitAPIInfo(description);
        (void)runner.OpenLib(&request, &table, nullptr);
        EXPECT_TRUE(IsLoaded(path));
        runner.CloseLib();
        EXPECT_TRUE(runner.libHandles.empty());
        EXPECT_FALSE(IsLoaded(path));
        runner.CloseLib();
        (void)runner.OpenLib(&request, &table, nullptr);
        EXPECT_TRUE(IsLoaded(path));
    }
    EXPECT_FALSE(IsLoaded(path));
}

TEST_F(Libraries, ServeRepeatedCallsOfOneRunner) {
    Install("Test.Basic");
    for (int round = 0; round < 3; ++round) {
        (void)Runner().Run(Post("Test.Basic", 1, "ok"));
        EXPECT_EQ(Runner().response->GetError(), 0);
    }
    EXPECT_EQ(Runner().libHandles.size(), 1u);
}

}  // namespace
