#include <gtest/gtest.h>

#include <string>
#include <thread>

#include "platform/System.h"
#include "tests/support/TempFolder.h"

namespace {

TEST(PlatformError, IsThatOfTheThread) {
    TLIBCErrSet(10496);
    int other = -1;
    std::thread([&] {
        other = TLIBCErrGet();
        TLIBCErrSet(3072);
    }).join();
    EXPECT_EQ(other, 0);
    EXPECT_EQ(TLIBCErrGet(), 10496);
}

TEST(FileCheckKeyValue, ComparesTheValueExactly) {
    const support::TempFolder folder;
    const std::string file =
        folder.Write("conf", "minibox=\"no\"\nminibox=\"yes\"\nempty=\"\"\n#off=\"yes\"\n");
    const struct {
        const char* key;
        const char* value;
        bool has;
    } rows[] = {
        {"minibox", "yes", true},    {"minibox", "no", false}, {"minibox", "YES", false},
        {"minibox", "ye", false},    {"minibox", "", false},   {"MINIBOX", "yes", false},
        {"empty", "", true},         {"absent", "", false},    {"off", "yes", false},
        {"#off", "yes", false},      {"", "", false},          {nullptr, "yes", false},
        {"minibox", nullptr, false},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(TLIBCFileCheckKeyValue(file.c_str(), row.key, row.value, 0) != 0, row.has)
            << (row.key != nullptr ? row.key : "null");
    }
    EXPECT_EQ(TLIBCFileCheckKeyValue(folder.Path("absent").c_str(), "a", "", 0), 0);
    EXPECT_EQ(TLIBCFileCheckKeyValue(nullptr, "a", "b", 0), 0);
    EXPECT_EQ(TLIBCFileCheckKeyValue("/", "a", "b", 0), 0);
}

}  // namespace
