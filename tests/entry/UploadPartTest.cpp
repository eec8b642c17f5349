#include <gtest/gtest.h>

#include <string>
#include <utility>
#include <vector>

#include "platform/Cgi.h"
#include "src/entry/APIUploadPrivate.h"
#include "tests/entry/UploadFixture.h"

using support::Parse;

namespace {

constexpr unsigned long long kReserve = 5ULL << 20;

std::vector<std::pair<unsigned long long, unsigned long long>> reports;

void Note(unsigned long long done, unsigned long long total) {
    reports.emplace_back(done, total);
}

// A body with one field and one file, read part by part.
class UploadPart : public UploadFixture {
  protected:
    UploadPart() {
        reports.clear();
        Script().params = {{"text", "hello"}};
        Script().fileName = "report.pdf";
        Script().fieldName = "file";
        Script().fieldValue = "Report.pdf";
        Script().partSize = 1000;
        Script().stored = {{"file", "/volume1/@tmp/x"},
                           {"file_filename", "Report.pdf"},
                           {"file_size", "990"},
                           {"behind", "1"}};
        Script().counters = {2000, 500};
    }

    int ReadFields() {
        return upload().GetUploadParam(params);
    }
    int ReadFile() {
        return upload().GetUploadFile(params);
    }

    static size_t FilesStored() {
        size_t count = 0;
        for (const fake::UploadCall& call : fake::Now().uploadCalls) {
            count += call.operation == "TaloCgiLoadUploadFileToDir" ? 1U : 0U;
        }
        return count;
    }
};

TEST_F(UploadPart, ReadsTheFieldsAndTellsTheFileThatIsPending) {
    EXPECT_EQ(ReadFields(), TALO::kUploadDone);
    EXPECT_EQ(params, Parse(R"({"text": "hello", "file": "Report.pdf"})"));
}

TEST_F(UploadPart, OffersThePlatformTheRoomOfItsThreeNames) {
    (void)ReadFields();
    ASSERT_EQ(fake::Now().uploadCalls.size(), 1u);
    EXPECT_EQ(LastCall().operation, "TaloCgiLoadUploadParams");
    EXPECT_EQ(LastCall().fileName, "256");
    EXPECT_EQ(LastCall().fieldName, "64");
    EXPECT_EQ(LastCall().fieldValue, "491");
    EXPECT_FALSE(LastCall().hasProgress);
}

TEST_F(UploadPart, TakesNamesThatFillTheirRoom) {
    Script().fileName = std::string(255, 'a');
    Script().fieldName = std::string(63, 'b');
    Script().fieldValue = std::string(490, 'c');
    EXPECT_EQ(ReadFields(), TALO::kUploadDone);
    EXPECT_EQ(params[std::string(63, 'b')], std::string(490, 'c'));
    EXPECT_EQ(ReadFile(), TALO::kUploadDone);
    EXPECT_EQ(LastCall().fileName, Script().fileName);
    EXPECT_EQ(LastCall().fieldName, Script().fieldName);
    EXPECT_EQ(LastCall().fieldValue, Script().fieldValue);
}

TEST_F(UploadPart, AnswersTheStatusAndNotTheNumberOfFields) {
    for (const int fields : {-3, 0, 1, 9}) {
        for (const int status : {1, 0, -1, -4, -77}) {
            Script().paramsResult = fields;
            Script().paramsStatus = status;
            EXPECT_EQ(ReadFields(), status) << fields;
        }
    }
}

TEST_F(UploadPart, CopiesTheFieldsOnlyWhenSomeWereRead) {
    for (const int fields : {-3, 0}) {
        Script().paramsResult = fields;
        params = Json::Value(Json::objectValue);
        (void)ReadFields();
        EXPECT_EQ(params, Parse(R"({"file": "Report.pdf"})")) << fields;
    }
    Script().paramsResult = 1;
    (void)ReadFields();
    EXPECT_EQ(params["text"], "hello");
}

TEST_F(UploadPart, TellsAPendingFileOnlyWithBothItsNames) {
    for (const auto& names : std::vector<std::pair<std::string, std::string>>{
             {"", ""}, {"file", ""}, {"", "Report.pdf"}}) {
        Script().fieldName = names.first;
        Script().fieldValue = names.second;
        params = Json::Value(Json::objectValue);
        EXPECT_EQ(ReadFields(), TALO::kUploadDone);
        EXPECT_EQ(params, Parse(R"({"text": "hello"})"));
    }
    Script().fieldName = "file";
    Script().fieldValue = "Report.pdf";
    Script().fileName = "";
    EXPECT_EQ(ReadFields(), TALO::kUploadDone);
    EXPECT_EQ(params["file"], "Report.pdf");
}

TEST_F(UploadPart, ReplacesAFieldByThePendingFileOfItsName) {
    Script().params = {{"file", "a field"}};
    EXPECT_EQ(ReadFields(), TALO::kUploadDone);
    EXPECT_EQ(params, Parse(R"({"file": "Report.pdf"})"));
}

TEST_F(UploadPart, KeepsWhatTheParametersHold) {
    params = Parse(R"({"kept": 1, "text": "old"})");
    EXPECT_EQ(ReadFields(), TALO::kUploadDone);
    EXPECT_EQ(params, Parse(R"({"kept": 1, "text": "hello", "file": "Report.pdf"})"));
}

TEST_F(UploadPart, LeavesParametersAloneThatAreNoObject) {
    for (const char* target : {"[]", "1", "\"text\"", "true"}) {
        params = Parse(target);
        EXPECT_EQ(ReadFields(), TALO::kUploadDone) << target;
        EXPECT_EQ(ReadFile(), TALO::kUploadDone) << target;
        EXPECT_EQ(params, Parse(target));
    }
}

TEST_F(UploadPart, StoresTheFileWithTheFieldsBehindIt) {
    (void)ReadFields();
    EXPECT_EQ(ReadFile(), TALO::kUploadDone);
    EXPECT_EQ(params, Parse(R"({"text": "hello", "file": "/volume1/@tmp/x",
                                "file_filename": "Report.pdf", "file_size": "990",
                                "behind": "1"})"));
}

TEST_F(UploadPart, HandsThePlatformWhatItToldOfTheFile) {
    (void)ReadFields();
    (void)ReadFile();
    EXPECT_EQ(LastCall().operation, "TaloCgiLoadUploadFileToDir");
    EXPECT_EQ(LastCall().dir, "/volume1/@tmp");
    EXPECT_EQ(LastCall().fileName, "report.pdf");
    EXPECT_EQ(LastCall().fieldName, "file");
    EXPECT_EQ(LastCall().fieldValue, "Report.pdf");
    EXPECT_FALSE(LastCall().hasProgress);
}

TEST_F(UploadPart, IsMinus8BeforeTheFieldsWereRead) {
    EXPECT_EQ(ReadFile(), TALO::kUploadNotPending);
    EXPECT_TRUE(fake::Now().uploadCalls.empty());
    EXPECT_TRUE(fake::Now().volumeCalls.empty());
    EXPECT_EQ(params, Json::Value(Json::objectValue));
}

TEST_F(UploadPart, IsMinus8WithoutAnyOfItsNamesWhateverElseIsWrong) {
    Script().partSize = 0;
    for (std::string fake::UploadScript::*name :
         {&fake::UploadScript::fileName, &fake::UploadScript::fieldName,
          &fake::UploadScript::fieldValue}) {
        const std::string kept = Script().*name;
        (Script().*name).clear();
        (void)ReadFields();
        EXPECT_EQ(ReadFile(), TALO::kUploadNotPending);
        Script().*name = kept;
    }
    EXPECT_EQ(FilesStored(), 0u);
}

TEST_F(UploadPart, IsMinus6WhenItIsEmptyWhateverTheRoom) {
    Script().partSize = 0;
    fake::Now().volume = "";
    fake::Now().fileSystems = {{"/tmp", {}}, {"/", {}}};
    (void)ReadFields();
    const Json::Value before = params;
    EXPECT_EQ(ReadFile(), TALO::kUploadNothing);
    EXPECT_EQ(FilesStored(), 0u);
    EXPECT_TRUE(fake::Now().volumeCalls.empty());
    EXPECT_EQ(params, before);
}

TEST_F(UploadPart, IsMinus2WithoutAFolder) {
    fake::Now().volume = "";
    fake::Now().fileSystems = {{"/tmp", {}}, {"/", {}}};
    (void)ReadFields();
    const Json::Value before = params;
    EXPECT_EQ(ReadFile(), TALO::kUploadNoSpace);
    EXPECT_EQ(FilesStored(), 0u);
    EXPECT_EQ(params, before);
}

TEST_F(UploadPart, AsksForItsSizeAndTheReserve) {
    const std::vector<std::pair<unsigned long long, unsigned long long>> rows = {
        {1, 1 + kReserve},
        {1ULL << 32, (1ULL << 32) + kReserve},
        {UINT64_MAX - kReserve, UINT64_MAX},
        {UINT64_MAX - kReserve + 1, UINT64_MAX},
        {UINT64_MAX, UINT64_MAX}};
    for (const auto& row : rows) {
        Script().partSize = row.first;
        (void)ReadFields();
        EXPECT_EQ(ReadFile(), TALO::kUploadDone);
        EXPECT_EQ(fake::Now().volumeCalls.back().size, row.second) << row.first;
    }
}

// Its own length is not that of the body.
TEST_F(UploadPart, NeedsNoContentLength) {
    SetLength("0");
    EXPECT_EQ(ReadFields(), TALO::kUploadDone);
    EXPECT_EQ(ReadFile(), TALO::kUploadDone);
}

TEST_F(UploadPart, AnswersThePlatformsStatusAndAddsNothingWhenItFails) {
    for (const int result : std::initializer_list<int>{
             TALO_UPLOAD_GONE, TALO_UPLOAD_MALFORMED, TALO_UPLOAD_LIMIT, TALO_UPLOAD_STORE,
             TALO_UPLOAD_MEMORY, TALO_UPLOAD_NO_PART, 0}) {
        Script().fileResult = result;
        (void)ReadFields();
        const Json::Value before = params;
        EXPECT_EQ(ReadFile(), result);
        EXPECT_EQ(params, before) << result;
    }
}

TEST_F(UploadPart, AnswersAStatusOfAnEarlierFailureNoMore) {
    EXPECT_EQ(ReadFile(), TALO::kUploadNotPending);
    EXPECT_EQ(ReadFields(), TALO::kUploadDone);
    EXPECT_EQ(ReadFile(), TALO::kUploadDone);
}

TEST_F(UploadPart, ReportsProgressWhileFieldsAndFileAreRead) {
    upload().SetUploadCallback(Note);
    (void)ReadFields();
    EXPECT_TRUE(LastCall().hasProgress);
    EXPECT_EQ(reports.size(), 1u);
    (void)ReadFile();
    EXPECT_TRUE(LastCall().hasProgress);
    ASSERT_EQ(reports.size(), 2u);
    EXPECT_EQ(reports[1].first, 500u);
    EXPECT_EQ(reports[1].second, 2000u);
}

TEST_F(UploadPart, ReportsNothingOnceTheCallbackIsTakenBack) {
    upload().SetUploadCallback(Note);
    upload().SetUploadCallback(nullptr);
    (void)ReadFields();
    (void)ReadFile();
    EXPECT_FALSE(LastCall().hasProgress);
    EXPECT_TRUE(reports.empty());
}

}  // namespace
