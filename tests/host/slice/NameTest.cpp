#include <gtest/gtest.h>

#include <string>

#include "hosts/linux/slice/Folder.h"

using host::SliceNameKind;

namespace {

const std::string kId = "u0123456789abcdef0123456789abcdef01234567";

struct Row {
    const char* name;
    std::string text;
    SliceNameKind kind;
};

const Row kRows[] = {
    {"a record", kId, SliceNameKind::kRecord},
    {"data", kId + ".data", SliceNameKind::kData},
    {"a complete one's record", kId + ".done", SliceNameKind::kDone},
    {"a record being written", kId + ".a1B2c3", SliceNameKind::kUnwritten},
    {"nothing", "", SliceNameKind::kOther},
    {"the marker", ".swept", SliceNameKind::kOther},
    {"this folder", ".", SliceNameKind::kOther},
    {"the parent", "..", SliceNameKind::kOther},
    {"a digit too few", kId.substr(0, 40), SliceNameKind::kOther},
    {"a digit too many", kId + "0", SliceNameKind::kOther},
    {"another letter", "s" + kId.substr(1), SliceNameKind::kOther},
    {"capitals", "u0123456789ABCDEF0123456789ABCDEF01234567", SliceNameKind::kOther},
    {"another suffix", kId + ".dat", SliceNameKind::kOther},
    {"data in capitals", kId + ".DATA", SliceNameKind::kOther},
    {"a suffix behind data", kId + ".data.x", SliceNameKind::kOther},
    {"a suffix without its point", kId + "xdata12", SliceNameKind::kOther},
    {"a line end behind it", kId + "\n", SliceNameKind::kOther},
    {"a path", "../" + kId, SliceNameKind::kOther},
};

TEST(SliceName, TellsWhatAFileIs) {
    for (const Row& row : kRows) {
        const host::SliceName read = host::ReadSliceName(row.text);
        EXPECT_EQ(read.kind, row.kind) << row.name;
        EXPECT_EQ(read.id, row.kind == SliceNameKind::kOther ? "" : kId) << row.name;
    }
}

TEST(SliceName, IsAnIdInOneFormOnly) {
    EXPECT_TRUE(talo::IsSliceId(kId));
    for (const Row& row : kRows) {
        EXPECT_EQ(talo::IsSliceId(row.text), row.kind == SliceNameKind::kRecord) << row.name;
    }
    for (const size_t place : {size_t{1}, size_t{20}, size_t{40}}) {
        for (const char byte : std::string("/.\0 g%-_A\n\xc3\xff", 12)) {
            std::string id = kId;
            id[place] = byte;
            EXPECT_FALSE(talo::IsSliceId(id)) << place << " " << static_cast<int>(byte);
        }
    }
    EXPECT_FALSE(talo::IsSliceId(std::string(1 << 20, 'u')));
}

TEST(SliceName, IsNewEveryTime) {
    const std::string id = host::NewSliceId();
    EXPECT_TRUE(talo::IsSliceId(id)) << id;
    EXPECT_NE(id, host::NewSliceId());
}

TEST(SliceDigest, IsSixtyFourHexadecimalDigits) {
    const std::string digits = "0123456789abcdefABCDEF0123456789abcdefABCDEF01234567890123456789";
    EXPECT_TRUE(talo::IsSliceDigest(digits));
    EXPECT_FALSE(talo::IsSliceDigest(""));
    EXPECT_FALSE(talo::IsSliceDigest(digits.substr(1)));
    EXPECT_FALSE(talo::IsSliceDigest(digits + "0"));
    EXPECT_FALSE(talo::IsSliceDigest("g" + digits.substr(1)));
    EXPECT_FALSE(talo::IsSliceDigest(std::string(64, '\0')));
    EXPECT_FALSE(talo::IsSliceDigest("0x" + digits.substr(2)));
}

}  // namespace
