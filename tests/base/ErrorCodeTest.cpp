#include "src/base/ErrorCode.h"

#include <gtest/gtest.h>

#include <fstream>
#include <string>
#include <vector>

using namespace TALO;

// Clients know the numbers.

namespace {

TEST(ErrorCodes, KeepTheirNumbers) {
    EXPECT_EQ(kErrorNone, 0);
    EXPECT_EQ(kErrorBadRequest, 101);
    EXPECT_EQ(kErrorNoSuchAPI, 102);
    EXPECT_EQ(kErrorNoSuchMethod, 103);
    EXPECT_EQ(kErrorVersion, 104);
    EXPECT_EQ(kErrorPermission, 105);
    EXPECT_EQ(kErrorSessionTimeout, 106);
    EXPECT_EQ(kErrorSessionRefused, 107);
    EXPECT_EQ(kErrorUpload, 108);
    EXPECT_EQ(kErrorRelay, 109);
    EXPECT_EQ(kErrorCompoundOrFork, 110);
    EXPECT_EQ(kErrorLibrary, 111);
    EXPECT_EQ(kErrorCompoundSkipped, 112);
    EXPECT_EQ(kErrorCompoundTransfer, 113);
    EXPECT_EQ(kErrorShareGroup, 114);
    EXPECT_EQ(kErrorUploadNotAllowed, 115);
    EXPECT_EQ(kErrorDemoMode, 116);
    EXPECT_EQ(kErrorNoResult, 117);
    EXPECT_EQ(kErrorProcessName, 118);
    EXPECT_EQ(kErrorNoSession, 119);
    EXPECT_EQ(kErrorNotInTable, 121);
}

TEST(ErrorCodes, StandInTheTableOnceEachInOrder) {
    std::vector<int> wanted;
    for (int code = kErrorBadRequest; code <= kErrorNoSession; ++code) {
        wanted.push_back(code);
    }
    wanted.push_back(kErrorNotInTable);
    std::vector<int> found;
    for (size_t index = 0; index < kErrorCodeCount; ++index) {
        found.push_back(kErrorCodes[index].code);
        EXPECT_GT(std::string(kErrorCodes[index].meaning).size(), 5u);
    }
    EXPECT_EQ(found, wanted);
}

// The rows "| 101 | meaning |" of the page.
std::vector<std::string> PageRows() {
    std::ifstream page(ERROR_CODES_PAGE);
    std::vector<std::string> rows;
    for (std::string line; std::getline(page, line);) {
        if (line.size() > 2 && line.compare(0, 2, "| ") == 0 && line[2] >= '0' && line[2] <= '9') {
            rows.push_back(line);
        }
    }
    return rows;
}

TEST(ErrorCodes, AreTheOnesOnThePage) {
    std::vector<std::string> wanted;
    for (size_t index = 0; index < kErrorCodeCount; ++index) {
        wanted.push_back("| " + std::to_string(kErrorCodes[index].code) + " | " +
                         kErrorCodes[index].meaning + " |");
    }
    EXPECT_EQ(PageRows(), wanted) << "in " << ERROR_CODES_PAGE;
}

}  // namespace
