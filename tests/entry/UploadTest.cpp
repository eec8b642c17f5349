#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <vector>

#include "platform/Cgi.h"
#include "src/entry/APIUploadPrivate.h"
#include "tests/entry/UploadFixture.h"

using support::Parse;
using TALO::APIUpload;

namespace {

constexpr unsigned long long kReserve = 5ULL << 20;
constexpr int kNoSpace = 10496;

class UploadAll : public UploadFixture {
  protected:
    UploadAll() {
        SetLength("1000");
    }
};

TEST_F(UploadAll, ReadsFieldsAndFilesIntoOneObject) {
    Script().params = {{"text", "hello"}, {"number", "12"}, {"file_filename", "a.txt"}};
    Script().files = {{"file", "/volume1/@tmp/x1"}, {"second", "/volume1/@tmp/x2"}};
    EXPECT_EQ(ReadAll(), TALO::kUploadDone);
    EXPECT_EQ(params, Parse(R"({"text": "hello", "number": "12", "file_filename": "a.txt",
                                "file": "/volume1/@tmp/x1", "second": "/volume1/@tmp/x2"})"));
    EXPECT_EQ(fileList, Parse(R"(["/volume1/@tmp/x1", "/volume1/@tmp/x2"])"));
}

TEST_F(UploadAll, IsOneCallOfThePlatformWithTheFolderFound) {
    EXPECT_EQ(ReadAll(), TALO::kUploadDone);
    ASSERT_EQ(fake::Now().uploadCalls.size(), 1u);
    EXPECT_EQ(LastCall().operation, "TaloCgiLoadUploadAll");
    EXPECT_EQ(LastCall().dir, "/volume1/@tmp");
    EXPECT_EQ(LastCall().flags, 0);
}

TEST_F(UploadAll, UsesTwoHashesOf256AndFreesThem) {
    EXPECT_EQ(ReadAll(), TALO::kUploadDone);
    EXPECT_EQ(fake::Now().hashCapacities, (std::vector<int>{256, 256}));
    EXPECT_EQ(fake::Now().openHashes, 0);
}

TEST_F(UploadAll, ReplacesAFieldByTheFileOfItsName) {
    Script().params = {{"file", "/etc/passwd"}};
    Script().files = {{"file", "/volume1/@tmp/x"}};
    EXPECT_EQ(ReadAll(), TALO::kUploadDone);
    EXPECT_EQ(params["file"], "/volume1/@tmp/x");
}

TEST_F(UploadAll, AddsToWhatParametersAndListHold) {
    params = Parse(R"({"kept": 1, "text": "old"})");
    fileList = Parse(R"(["/kept"])");
    Script().params = {{"text", "new"}};
    Script().files = {{"file", "/volume1/@tmp/x"}};
    EXPECT_EQ(ReadAll(), TALO::kUploadDone);
    EXPECT_EQ(params, Parse(R"({"kept": 1, "text": "new", "file": "/volume1/@tmp/x"})"));
    EXPECT_EQ(fileList, Parse(R"(["/kept", "/volume1/@tmp/x"])"));
}

TEST_F(UploadAll, NeedsNoFileList) {
    Script().files = {{"file", "/volume1/@tmp/x"}};
    EXPECT_EQ(upload().GetUploadAll(params, nullptr), TALO::kUploadDone);
    EXPECT_EQ(params, Parse(R"({"file": "/volume1/@tmp/x"})"));
}

TEST_F(UploadAll, ListsTheFilesWhateverTheResult) {
    Script().params = {{"text", "hello"}};
    Script().files = {{"file", "/volume1/@tmp/x"}};
    for (const int result : std::initializer_list<int>{
             TALO_UPLOAD_GONE, TALO_UPLOAD_MALFORMED, TALO_UPLOAD_LIMIT, TALO_UPLOAD_STORE,
             TALO_UPLOAD_MEMORY, TALO_UPLOAD_NO_PART, 0, 2, 77, INT32_MIN, INT32_MAX}) {
        Script().allResult = result;
        fileList = Json::Value(Json::arrayValue);
        EXPECT_EQ(ReadAll(), result);
        EXPECT_EQ(fileList, Parse(R"(["/volume1/@tmp/x"])")) << result;
        EXPECT_EQ(params, Json::Value(Json::objectValue)) << result;
        EXPECT_EQ(fake::Now().openHashes, 0) << result;
    }
    EXPECT_TRUE(log.Lines().empty());
}

TEST_F(UploadAll, IsMinus9WhenAHashCannotBeMade) {
    for (const int nth : {1, 2}) {
        fake::Now().FailCall("TLIBCSzHashAlloc", nth);
        EXPECT_EQ(ReadAll(), TALO::kUploadNoMemory) << nth;
        EXPECT_EQ(fake::Now().openHashes, 0) << nth;
        EXPECT_EQ(log.Lines().size(), static_cast<size_t>(nth));
    }
    EXPECT_TRUE(log.Has("APIUpload.cpp", "cannot alloc memory for hash!"));
    EXPECT_EQ(log.Lines().front().priority, LOG_ERR);
    EXPECT_TRUE(fake::Now().uploadCalls.empty());
}

TEST_F(UploadAll, IsMinus9WhenFieldsOrFilesCannotBeCopied) {
    Script().params = {{"text", "hello"}};
    Script().files = {{"file", "/volume1/@tmp/x"}};
    for (const int nth : {1, 2}) {
        fake::Now().FailCall("SzHashToJsonObj", nth);
        fileList = Json::Value(Json::arrayValue);
        EXPECT_EQ(ReadAll(), TALO::kUploadNoMemory) << nth;
        EXPECT_EQ(fileList, Parse(R"(["/volume1/@tmp/x"])")) << nth;
        EXPECT_EQ(fake::Now().openHashes, 0) << nth;
        EXPECT_EQ(log.Lines().size(), static_cast<size_t>(nth));
    }
    EXPECT_TRUE(log.Has("APIUpload.cpp", "cannot convert hash to Json object!"));
    EXPECT_EQ(log.Lines().front().priority, LOG_ERR);
}

TEST_F(UploadAll, IsMinus9ForParametersThatAreNoObject) {
    for (const char* target : {"[]", "1", "\"text\"", "true"}) {
        params = Parse(target);
        EXPECT_EQ(ReadAll(), TALO::kUploadNoMemory) << target;
        EXPECT_EQ(params, Parse(target));
    }
    params = Json::Value();
    EXPECT_EQ(ReadAll(), TALO::kUploadDone);
}

TEST_F(UploadAll, IsMinus2WithoutAFolderAndTouchesNothing) {
    fake::Now().volume = "";
    fake::Now().fileSystems = {{"/tmp", {}}, {"/", {}}};
    EXPECT_EQ(ReadAll(), TALO::kUploadNoSpace);
    EXPECT_EQ(fake::Now().errors, (std::vector<int>{kNoSpace, kNoSpace}));
    EXPECT_TRUE(fake::Now().hashCapacities.empty());
    EXPECT_TRUE(fake::Now().uploadCalls.empty());
    EXPECT_EQ(params, Json::Value(Json::objectValue));
    EXPECT_EQ(fileList, Json::Value(Json::arrayValue));
}

TEST_F(UploadAll, GoesToTmpOrBeyondByTheLengthAndTheReserve) {
    fake::Now().volume = "";
    fake::FileSystem tmp;
    tmp.freeBlocks = 105ULL << 20;
    tmp.fragmentSize = 1;
    fake::Now().fileSystems = {{"/tmp", tmp}, {"/", {}}};
    SetLength("104857600");
    EXPECT_EQ(ReadAll(), TALO::kUploadDone);
    EXPECT_EQ(LastCall().dir, "/tmp");
    SetLength("104857601");
    EXPECT_EQ(ReadAll(), TALO::kUploadNoSpace);
}

struct Length {
    const char* name;
    const char* text;
    unsigned long long needed;  // 0: nothing to read
};

const Length kLengths[] = {
    {"Empty", "", 0},
    {"Zero", "0", 0},
    {"Zeros", "000", 0},
    {"One", "1", 1 + kReserve},
    {"LeadingZeros", "007", 7 + kReserve},
    {"FourGibibytes", "4294967296", 4294967296 + kReserve},
    {"PastSignedNumbers", "9223372036854775808", 9223372036854775808u + kReserve},
    {"LastBeforeTheReserveOverflows", "18446744073704308735", UINT64_MAX},
    {"FirstWithAnOverflowingReserve", "18446744073704308736", UINT64_MAX},
    {"Largest", "18446744073709551615", UINT64_MAX},
    {"OneTooLarge", "18446744073709551616", 0},
    {"TenTimesTooLarge", "184467440737095516150", 0},
    {"FarTooLarge", "99999999999999999999999999999999", 0},
    {"Negative", "-1", 0},
    {"Signed", "+1", 0},
    {"BlankBefore", " 1", 0},
    {"BlankBehind", "1 ", 0},
    {"LineEnd", "1\n", 0},
    {"TextBehind", "12abc", 0},
    {"Text", "abc", 0},
    {"Hexadecimal", "0x10", 0},
    {"Exponent", "1e3", 0},
    {"Fraction", "1.5", 0},
    {"TwoNumbers", "1, 1", 0},
    {"ArabicDigits", "\xD9\xA1", 0},
};

class UploadLength : public UploadFixture, public ::testing::WithParamInterface<Length> {};

TEST_P(UploadLength, AsksForItsNumberAndTheReserve) {
    SetLength(GetParam().text);
    if (GetParam().needed == 0) {
        EXPECT_EQ(ReadAll(), TALO::kUploadNothing);
        EXPECT_TRUE(fake::Now().volumeCalls.empty());
        EXPECT_TRUE(fake::Now().hashCapacities.empty());
        EXPECT_TRUE(fake::Now().uploadCalls.empty());
        return;
    }
    EXPECT_EQ(ReadAll(), TALO::kUploadDone);
    ASSERT_EQ(fake::Now().volumeCalls.size(), 1u);
    EXPECT_EQ(fake::Now().volumeCalls[0].size, GetParam().needed);
}

INSTANTIATE_TEST_SUITE_P(Lengths, UploadLength, ::testing::ValuesIn(kLengths),
                         [](const auto& info) { return std::string(info.param.name); });

class Upload : public UploadFixture {};

TEST_F(Upload, WithoutALengthHasNothingToRead) {
    EXPECT_EQ(ReadAll(), TALO::kUploadNothing);
    EXPECT_TRUE(fake::Now().uploadCalls.empty());
}

TEST_F(Upload, KeepsAContextAsLongAsItLives) {
    {
        const APIUpload other(&request());
        EXPECT_EQ(fake::Now().openContexts, 1);
    }
    EXPECT_EQ(fake::Now().openContexts, 0);
}

TEST_F(Upload, SurvivesAContextThatCannotBePrepared) {
    fake::Now().FailCall("TaloCgiInit", 1);
    SetLength("10");
    Script().files = {{"file", "/volume1/@tmp/x"}};
    EXPECT_EQ(ReadAll(), TALO::kUploadDone);
}

TEST_F(Upload, ReleasesTheHashOfAContext) {
    Script().params = {{"a", "1"}};
    {
        APIUpload reading(&request());
        (void)reading.GetUploadParam(params);
        EXPECT_EQ(fake::Now().openHashes, 1);
    }
    EXPECT_EQ(fake::Now().openHashes, 0);
}

}  // namespace
