#include <dlfcn.h>

#include "tests/runner/RunnerFixture.h"

namespace {

// The two look-ups in a library that is open already.
class Tables : public runner::Fixture {
  protected:
    void Load(const std::string& module) {
        handle = dlopen(runner::ModulePath(module).c_str(), RTLD_LAZY);
        ASSERT_NE(handle, nullptr) << dlerror();
    }
    void TearDown() override {
        if (handle != nullptr) {
            (void)dlclose(handle);
        }
    }

    void* handle = nullptr;
    TALO::_tag_API_TABLE untouchedRow = {};
    TALO::_tag_API_CHECK_TABLE untouchedCheckRow = {};
    TALO::_tag_API_TABLE* table = &untouchedRow;
    TALO::_tag_API_CHECK_TABLE* checkTable = &untouchedCheckRow;
};

TEST_F(Tables, NeedAHandleAndAPlaceAndSayNothingWithout) {
    Load("TestCheck");
    EXPECT_EQ(Runner().GetTableFunc(nullptr, &table), 0);
    EXPECT_EQ(Runner().GetTableFunc(handle, nullptr), 0);
    EXPECT_EQ(Runner().GetCheckTableFunc(nullptr, &checkTable), 0);
    EXPECT_EQ(Runner().GetCheckTableFunc(handle, nullptr), 0);
    EXPECT_EQ(table, &untouchedRow);
    EXPECT_EQ(checkTable, &untouchedCheckRow);
    EXPECT_TRUE(log.Lines().empty());
}

TEST_F(Tables, AreWhatTheLibraryAnswers) {
    Load("TestCheck");
    EXPECT_EQ(Runner().GetTableFunc(handle, &table), 1);
    EXPECT_STREQ(table->apiName, "Test.Check");
    EXPECT_EQ(Runner().GetCheckTableFunc(handle, &checkTable), 1);
    EXPECT_STREQ(checkTable->apiName, "Test.Other");
}

TEST_F(Tables, AreFoundDespiteAnEarlierErrorOfTheLoader) {
    Load("TestCheck");
    (void)dlsym(handle, "NoSuchSymbol");
    EXPECT_EQ(Runner().GetTableFunc(handle, &table), 1);
    (void)dlsym(handle, "NoSuchSymbol");
    EXPECT_EQ(Runner().GetCheckTableFunc(handle, &checkTable), 1);
    EXPECT_STREQ(checkTable->apiName, "Test.Other");
}

TEST_F(Tables, OfMethodsAreRequired) {
    Load("TestNoTable");
    EXPECT_EQ(Runner().GetTableFunc(handle, &table), 0);
    EXPECT_EQ(table, &untouchedRow);
    ASSERT_EQ(log.Lines().size(), 1u);
    EXPECT_EQ(log.Lines()[0].priority, LOG_DEBUG);
}

TEST_F(Tables, OfChecksAreOptional) {
    Load("TestNoTable");
    EXPECT_EQ(Runner().GetCheckTableFunc(handle, &checkTable), 1);
    EXPECT_EQ(checkTable, &untouchedCheckRow);
    EXPECT_TRUE(log.Lines().empty());
}

TEST_F(Tables, OfMethodsThatAreNullFail) {
    Load("TestNullTable");
    EXPECT_EQ(Runner().GetTableFunc(handle, &table), 0);
    EXPECT_EQ(table, nullptr);
    EXPECT_TRUE(Logged("cannot get api table"));
    EXPECT_EQ(log.Lines()[0].priority, LOG_ERR);
}

TEST_F(Tables, OfChecksThatAreNullFail) {
    Load("TestNullCheck");
    EXPECT_EQ(Runner().GetCheckTableFunc(handle, &checkTable), 0);
    EXPECT_EQ(checkTable, nullptr);
    EXPECT_TRUE(Logged("cannot get api check table"));
    EXPECT_EQ(log.Lines()[0].priority, LOG_ERR);
}

}  // namespace
