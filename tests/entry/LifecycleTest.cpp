#include "tests/entry/EntryTest.h"
#include "tests/support/Json.h"
#include "tests/support/PrivateMember.h"
#include "tests/support/Slots.h"

namespace support {

struct UploadFiles {
    typedef Json::Value TALO::WebEntry::*Type;
    friend Type Find(UploadFiles);
};
template struct PrivateMember<UploadFiles, &TALO::WebEntry::uploadFiles>;

struct PermissionCache {
    typedef Json::Value TALO::WebEntry::*Type;
    friend Type Find(PermissionCache);
};
template struct PrivateMember<PermissionCache, &TALO::WebEntry::permissionCache>;

}  // namespace support

using support::Parse;
using support::SlotOf;

namespace {

class Widened : public TALO::WebEntry {
  public:
    virtual void Next() {}
};

class WebEntryLife : public EntryTest {};

TEST_F(WebEntryLife, OverridesTheSixSlotsOfTheRunnerAndAddsNone) {
    EXPECT_EQ(SlotOf(&TALO::WebEntry::Run), 0);
    EXPECT_EQ(SlotOf(&TALO::WebEntry::Initialize), 1);
    EXPECT_EQ(SlotOf(&TALO::WebEntry::NeedPermission), 2);
    EXPECT_EQ(SlotOf(static_cast<bool (TALO::WebEntry::*)(TALO::APIRequest*, TALO::APIResponse*)>(
                  &TALO::WebEntry::CheckPermission)),
              3);
    EXPECT_EQ(SlotOf(&TALO::WebEntry::HandleUpload), 4);
    EXPECT_EQ(SlotOf(&TALO::WebEntry::SkipPermission), 5);
    EXPECT_EQ(SlotOf(&Widened::Next), 6);
}

TEST_F(WebEntryLife, BeginsWithAnEmptyFileListAndAnEmptyListOfPermissionResults) {
    Inside({}, [](ProbeEntry& entry) {
        EXPECT_EQ(entry.*Find(support::UploadFiles()), Json::Value(Json::arrayValue));
        EXPECT_EQ(entry.*Find(support::PermissionCache()), Parse(R"({"permResult": []})"));
    });
}

TEST_F(WebEntryLife, PreparesTheContextAndThenLoadsTheCookies) {
    Inside(Call().With("HTTP_COOKIE", "id=A"), [](ProbeEntry&) {
        const std::vector<std::string> expected = {"ReadJsonFile", "TaloCgiInit",
                                                   "TaloCgiLoadInCookies"};
        EXPECT_EQ(fake::Now().journal, expected);
        EXPECT_EQ(fake::Now().cookiesRead, std::vector<std::string>{"id=A"});
        EXPECT_EQ(fake::Now().openContexts, 1);
    });
}

TEST_F(WebEntryLife, ReleasesTheContextAndThenDeletesTheUploadedFiles) {
    const support::ChildResult result = support::InChild([] {
        fake::Now().files["/tmp/one"] = "1";
        fake::Now().files["/tmp/two"] = "2";
        {
            ProbeEntry entry;
            entry.*Find(support::UploadFiles()) =
                Parse(R"(["/tmp/one", 7, null, "/tmp/gone", ["/x"], "/tmp/two"])");
            fake::Now().journal.clear();
        }
        const std::vector<std::string> expected = {"TaloCgiFree", "TLIBCSysUnlink",
                                                   "TLIBCSysUnlink", "TLIBCSysUnlink"};
        EXPECT_EQ(fake::Now().journal, expected);
        const std::vector<std::string> paths = {"/tmp/one", "/tmp/gone", "/tmp/two"};
        EXPECT_EQ(fake::Now().unlinked, paths);
        EXPECT_EQ(fake::Now().files.count("/tmp/one") + fake::Now().files.count("/tmp/two"), 0);
        EXPECT_EQ(fake::Now().openContexts, 0);
        return 0;
    });
    EXPECT_EQ(result.status, 0) << result.output;
}

TEST_F(WebEntryLife, KeepsUploadedFilesUntilTheReplyIsOut) {
    Inside(GetMethod("echo"), [](ProbeEntry& entry) {
        fake::Now().files["/tmp/one"] = "1";
        (entry.*Find(support::UploadFiles())).append("/tmp/one");
        (void)entry.Run(Json::Value());
        EXPECT_TRUE(fake::Now().unlinked.empty());
    });
}

TEST_F(WebEntryLife, SurvivesAContextThatCannotBePrepared) {
    fake::Now().FailCall("TaloCgiInit", 1);
    const Reply reply = Serve(GetMethod("echo", "&_sid=XYZ"));
    EXPECT_EQ(reply.status, 0);
    EXPECT_EQ(reply.Code(), 0);
    EXPECT_EQ(reply.body["data"]["session"], "XYZ");
}

}  // namespace
