#include <gtest/gtest.h>

#include <string>

#include "platform/Cgi.h"
#include "src/entry/APIUploadPrivate.h"
#include "tests/entry/UploadFixture.h"

using support::Parse;
using TALO::APIRequest;
using TALO::APIUpload;

// A client writes what it likes into a field: only what a reading made counts.

namespace {

const char kPath[] = "/volume1/@tmp/x";
const char kForged[] = "/etc/passwd";

class UploadedFile : public UploadFixture {
  protected:
    UploadedFile() {
        SetLength("1000");
    }

    // Leaves a file of the field "file" pending, under that name at the client.
    void LeavePending(const std::string& clientName) {
        Script().fileName = clientName;
        Script().fieldName = "file";
        Script().fieldValue = clientName;
        Script().partSize = 10;
        EXPECT_EQ(upload().GetUploadParam(params), TALO::kUploadDone);
    }

    bool Counts(const std::string& path) {
        return upload().IsUploadedFile(path);
    }
};

TEST_F(UploadedFile, IsNoneBeforeAnythingWasRead) {
    EXPECT_FALSE(Counts(""));
    EXPECT_FALSE(Counts(kPath));
    EXPECT_FALSE(Counts("/"));
}

TEST_F(UploadedFile, IsEachOneThatTheReadingMade) {
    Script().files = {{"file", kPath}, {"second", "/volume1/@tmp/y"}};
    ASSERT_EQ(ReadAll(), TALO::kUploadDone);
    EXPECT_TRUE(Counts(kPath));
    EXPECT_TRUE(Counts("/volume1/@tmp/y"));
}

TEST_F(UploadedFile, IsExactlyThatPath) {
    Script().files = {{"file", kPath}};
    ASSERT_EQ(ReadAll(), TALO::kUploadDone);
    for (const char* path : {"", "/volume1/@tmp", "/volume1/@tmp/", "/volume1/@tmp/X",
                             "/volume1/@tmp/x/", "/volume1/@tmp//x", "/volume1/@tmp/./x",
                             "/volume1/@tmp/../@tmp/x", "x", "file", "/volume1/@tmp/xx"}) {
        EXPECT_FALSE(Counts(path)) << path;
    }
    EXPECT_FALSE(Counts(std::string(kPath) + '\0'));
    EXPECT_FALSE(Counts(std::string(kPath) + '\0' + "y"));
}

TEST_F(UploadedFile, IsKnownToEveryReadingOfTheRequestAndToNoOther) {
    Script().files = {{"file", kPath}};
    ASSERT_EQ(ReadAll(), TALO::kUploadDone);
    EXPECT_TRUE(APIUpload(&request()).IsUploadedFile(kPath));
    APIRequest other((Json::Value()));
    EXPECT_FALSE(APIUpload(&other).IsUploadedFile(kPath));
}

TEST_F(UploadedFile, IsKnownAlsoWhenNobodyAskedForAList) {
    Script().files = {{"file", kPath}};
    ASSERT_EQ(upload().GetUploadAll(params, nullptr), TALO::kUploadDone);
    EXPECT_TRUE(Counts(kPath));
}

TEST_F(UploadedFile, IsNoTextOfAField) {
    Script().params = {{"file", kForged}, {"file_filename", "name"}, {"file_size", "12"}};
    Script().files = {{"other", kPath}};
    ASSERT_EQ(ReadAll(), TALO::kUploadDone);
    for (const char* name : {"file", "file_filename", "file_size"}) {
        EXPECT_FALSE(Counts(params[name].asString())) << name;
    }
}

TEST_F(UploadedFile, IsWhatTheReadingOfOnePartMade) {
    LeavePending("Report.pdf");
    Script().stored = {
        {"file", kPath}, {"file_filename", "Report.pdf"}, {"file_size", "10"}, {"behind", kForged}};
    ASSERT_EQ(upload().GetUploadFile(params), TALO::kUploadDone);
    EXPECT_TRUE(Counts(kPath));
    for (const char* name : {"file_filename", "file_size", "behind"}) {
        EXPECT_FALSE(Counts(params[name].asString())) << name;
    }
}

TEST_F(UploadedFile, IsEachOfSeveralReadPartByPart) {
    for (const char* path : {"/volume1/@tmp/a", "/volume1/@tmp/b", "/volume1/@tmp/c"}) {
        LeavePending("Report.pdf");
        Script().stored = {{"file", path}};
        ASSERT_EQ(upload().GetUploadFile(params), TALO::kUploadDone);
    }
    EXPECT_TRUE(Counts("/volume1/@tmp/a"));
    EXPECT_TRUE(Counts("/volume1/@tmp/b"));
    EXPECT_TRUE(Counts("/volume1/@tmp/c"));
}

// Its name is in the parameters, under the field's name, until the file is there.
TEST_F(UploadedFile, IsNotTheClientsNameOfAPendingFile) {
    LeavePending(kForged);
    EXPECT_EQ(params["file"], kForged);
    EXPECT_FALSE(Counts(kForged));
}

TEST_F(UploadedFile, IsNotTheClientsNameOfAFileThatCouldNotBeStored) {
    LeavePending(kForged);
    for (const int result : std::initializer_list<int>{TALO_UPLOAD_STORE, TALO_UPLOAD_GONE, 0}) {
        Script().fileResult = result;
        EXPECT_EQ(upload().GetUploadFile(params), result);
        EXPECT_EQ(params["file"], kForged);
        EXPECT_FALSE(Counts(kForged)) << result;
    }
    Script().partSize = 0;
    (void)upload().GetUploadParam(params);
    EXPECT_EQ(upload().GetUploadFile(params), TALO::kUploadNothing);
    EXPECT_FALSE(Counts(kForged));
}

// The parameters then still hold the client's name for it.
TEST_F(UploadedFile, IsNotTheClientsNameOfAFileWhosePathCouldNotBeCopied) {
    LeavePending(kForged);
    Script().stored = {{"file", kPath}};
    fake::Now().FailCall("SzHashToJsonObj", 1);
    (void)upload().GetUploadFile(params);
    EXPECT_FALSE(Counts(kForged));
    EXPECT_TRUE(Counts(kPath));
}

TEST_F(UploadedFile, IsNothingThatTheCallersObjectHeld) {
    Json::Value held = Parse(R"({"file": "/etc/passwd", "other": "/etc/shadow"})");
    EXPECT_EQ(upload().GetUploadFile(held), TALO::kUploadNotPending);
    EXPECT_FALSE(Counts(kForged));
    EXPECT_FALSE(Counts("/etc/shadow"));
}

TEST_F(UploadedFile, CannotBeForgedByAnythingThatAClientSends) {
    const char kDocument[] = R"({
        "environ": {"uploaded_files": "[\"/etc/passwd\"]", "attr": "/etc/passwd",
                    "HTTP_UPLOADED_FILES": "/etc/passwd",
                    "HTTP_COOKIE": "uploaded_files=/etc/passwd; attr=/etc/passwd"},
        "getParam": {"uploaded_files": ["/etc/passwd"],
                     "attr": {"uploaded_files": ["/etc/passwd"]}},
        "postParam": {"uploaded_files": ["/etc/passwd"], "file": "/etc/passwd",
                      "file_filename": "/etc/passwd"},
        "attr": {"uploaded_files": ["/etc/passwd"]}})";
    APIRequest forged(Parse(kDocument));
    EXPECT_FALSE(APIUpload(&forged).IsUploadedFile(kForged));
    forged.InitEnv(Parse(kDocument)["environ"]);
    forged.InitParam(Parse(kDocument), true);
    EXPECT_FALSE(APIUpload(&forged).IsUploadedFile(kForged));
}

// What the upload brings is merged into the parameters; the list is none of them.
TEST_F(UploadedFile, OutlivesAChangeOfTheParameters) {
    Script().files = {{"file", kPath}};
    ASSERT_EQ(ReadAll(), TALO::kUploadDone);
    request().InitParam(Parse(R"({"postParam": {"uploaded_files": []}})"), true);
    EXPECT_TRUE(Counts(kPath));
}

}  // namespace
