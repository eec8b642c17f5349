#include <gtest/gtest.h>

#include <cstring>
#include <filesystem>
#include <fstream>
#include <string>

#include "platform/Paths.h"
#include "platform/System.h"

namespace {

typedef int (*FolderGet)(const char* name, char* buffer, size_t size);

const struct {
    const char* what;
    const char* parent;
    FolderGet get;
} kKinds[] = {
    {"user", TALO_USER_PREFERENCE_DIR, TALOUserPreferenceDirGet},
    {"group", TALO_GROUP_PREFERENCE_DIR, TALOGroupPreferenceDirGet},
};

class Preference : public ::testing::Test {
  protected:
    void SetUp() override {
        for (const auto& kind : kKinds) {
            std::filesystem::create_directories(std::string(kind.parent) + kName);
            std::ofstream(std::string(kind.parent) + kFile) << "";
        }
    }

    void TearDown() override {
        for (const auto& kind : kKinds) {
            std::filesystem::remove_all(std::string(kind.parent) + kName);
            std::filesystem::remove(std::string(kind.parent) + kFile);
        }
    }

    static constexpr char kName[] = "preference-test";
    static constexpr char kFile[] = "preference-test-file";
};

TEST_F(Preference, IsTheFolderOfThatName) {
    for (const auto& kind : kKinds) {
        char buffer[1024] = {};
        EXPECT_EQ(kind.get(kName, buffer, sizeof buffer), 0) << kind.what;
        EXPECT_EQ(std::string(buffer), std::string(kind.parent) + kName);
    }
}

TEST_F(Preference, NeverLeavesItsPlace) {
    const std::string names[] = {"",
                                 ".",
                                 "..",
                                 "/",
                                 "a/b",
                                 "../preference",
                                 "/etc",
                                 "x/../",
                                 "none",
                                 kFile,
                                 std::string(5000, 'a'),
                                 std::string(kName) + "/"};
    for (const auto& kind : kKinds) {
        for (const std::string& name : names) {
            char buffer[1024] = "untouched";
            EXPECT_LT(kind.get(name.c_str(), buffer, sizeof buffer), 0) << kind.what << name;
            EXPECT_STREQ(buffer, "untouched") << kind.what << name;
        }
        char buffer[16] = "untouched";
        EXPECT_LT(kind.get(nullptr, buffer, sizeof buffer), 0);
    }
}

TEST_F(Preference, FitsWithItsEndOrNotAtAll) {
    for (const auto& kind : kKinds) {
        const size_t length = std::strlen(kind.parent) + std::strlen(kName);
        std::string buffer(length + 1, '?');
        for (const size_t size : {size_t(0), size_t(1), length}) {
            EXPECT_LT(kind.get(kName, &buffer[0], size), 0) << kind.what << size;
            EXPECT_EQ(buffer, std::string(length + 1, '?'));
        }
        EXPECT_EQ(kind.get(kName, &buffer[0], length + 1), 0);
    }
}

}  // namespace
