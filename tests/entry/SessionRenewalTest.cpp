#include <stdlib.h>

#include <filesystem>
#include <fstream>

#include "tests/entry/PermissionFixture.h"
#include "webapi/APIAuth.h"

namespace {

using TALO::APIAuth;
using TALO::APIRequest;

// A folder of real session files, since an id is resolved on the real disk.
class SessionRenewal : public rights::PermissionFixture {
  protected:
    SessionRenewal() {
        char name[] = "/tmp/webapi-renewal-XXXXXX";
        folder_ = std::filesystem::canonical(mkdtemp(name)).string();
        sessions_ = folder_ + "/session";
        std::filesystem::create_directory(sessions_);
        WriteFile(sessions_ + "/s1");
        fake::Now().sessionDir = sessions_;
    }
    ~SessionRenewal() override {
        std::filesystem::remove_all(folder_);
    }

    static void WriteFile(const std::string& path) {
        std::ofstream(path) << "{}";
    }

    static bool Renews(const std::string& id) {
        APIRequest request{Json::Value()};
        EXPECT_TRUE(request.SetCookie("id", id));
        return APIAuth::UpdateTimeout(&request);
    }

    static size_t Touched() {
        return fake::Now().touched.size();
    }

    std::string folder_;
    std::string sessions_;
};

TEST_F(SessionRenewal, SetsTheTimeOfTheSessionFileToNow) {
    EXPECT_TRUE(Renews("s1"));
    ASSERT_EQ(Touched(), 1u);
    EXPECT_EQ(fake::Now().touched[0].path, sessions_ + "/s1");
    EXPECT_EQ(fake::Now().touched[0].now, 1);
    EXPECT_EQ(fake::Now().touched[0].when, 0);
    EXPECT_EQ(fake::Now().calls["TaloCgiInit"], 1);
    EXPECT_EQ(fake::Now().openContexts, 0);
}

TEST_F(SessionRenewal, FailsWithTheTouch) {
    fake::Now().FailCall("TLIBCFileUTime", 1);
    EXPECT_FALSE(Renews("s1"));
    EXPECT_EQ(Touched(), 1u);
    EXPECT_EQ(fake::Now().openContexts, 0);
}

TEST_F(SessionRenewal, RefusesWhatIsNoFileOfTheSessionFolder) {
    WriteFile(folder_ + "/outside");
    std::filesystem::create_directory(sessions_ + "/sub");
    WriteFile(sessions_ + "/sub/s2");
    std::filesystem::create_symlink(sessions_ + "/s1", sessions_ + "/link");
    std::filesystem::create_symlink("s1", sessions_ + "/relative");
    std::filesystem::create_symlink(folder_ + "/outside", sessions_ + "/away");
    std::filesystem::create_directory_symlink(sessions_ + "/sub", sessions_ + "/linkedFolder");
    const std::string ids[] = {
        "",
        ".",
        "..",
        "/",
        "../outside",
        "../session/s1",
        "./s1",
        "/s1",
        "//s1",
        "s1/",
        "s1/.",
        "sub/../s1",
        "sub//s2",
        "linkedFolder/s2",
        "link",
        "relative",
        "away",
        "missing",
        "S1",
        "s1 ",
        "%2e%2e",
        "..%2foutside",
        std::string("s1\0", 3),
        std::string("s1\0x", 4),
        std::string("\0", 1),
        std::string(300, 'a'),
        std::string(65536, 'a'),
    };
    for (const std::string& id : ids) {
        EXPECT_FALSE(Renews(id)) << id.substr(0, 40);
    }
    EXPECT_EQ(Touched(), 0u);
    EXPECT_EQ(fake::Now().openContexts, 0);
}

TEST_F(SessionRenewal, RefusesEveryIdBehindALinkedFolder) {
    std::filesystem::create_directory_symlink(sessions_, folder_ + "/linked");
    fake::Now().sessionDir = folder_ + "/linked";
    EXPECT_FALSE(Renews("s1"));
    EXPECT_EQ(Touched(), 0u);
}

TEST_F(SessionRenewal, RefusesANullRequestWithoutAContext) {
    EXPECT_FALSE(APIAuth::UpdateTimeout(nullptr));
    EXPECT_EQ(fake::Now().calls["TaloCgiInit"], 0);
}

TEST_F(SessionRenewal, RefusesWithoutASessionFolder) {
    fake::Now().FailCall("TaloCgiInit", 1);
    EXPECT_FALSE(Renews("tmp")) << "the folder of an empty context is the root";
    EXPECT_EQ(Touched(), 0u);
}

TEST_F(SessionRenewal, FollowsAnAuthorisedRequestOnce) {
    Asked();
    EXPECT_TRUE(Permitted());
    ASSERT_EQ(Touched(), 1u);
    EXPECT_EQ(fake::Now().touched[0].path, sessions_ + "/s1");
    EXPECT_TRUE(Permitted());
    EXPECT_EQ(Touched(), 1u);
    EndRequest();
    Asked();
    EXPECT_TRUE(Permitted());
    EXPECT_EQ(Touched(), 2u) << "another request renews again";
}

TEST_F(SessionRenewal, IsTriedOnceAndItsFailureRefusesNobody) {
    std::filesystem::remove(sessions_ + "/s1");
    Asked();
    EXPECT_TRUE(Permitted());
    EXPECT_EQ(Entry().response->GetError(), 0);
    EXPECT_EQ(Touched(), 0u);
    WriteFile(sessions_ + "/s1");
    EXPECT_TRUE(Permitted());
    EXPECT_EQ(Touched(), 0u);
}

TEST_F(SessionRenewal, DoesNotFollowARequestInTheBackground) {
    Asked("passive");
    EXPECT_TRUE(Permitted());
    EndRequest();
    Asked("tolerantPassive");
    EXPECT_TRUE(Permitted());
    EXPECT_EQ(Touched(), 0u);
    EXPECT_EQ(Checks(), 2u) << "nor does it ask for more than it needs";
}

TEST_F(SessionRenewal, FollowsTheFirstElementThatIsNotInTheBackground) {
    Asked("passive");
    EXPECT_TRUE(Permitted());
    EXPECT_EQ(Touched(), 0u);
    const auto element = Element("who");
    TALO::APIResponse response(element.get());
    EXPECT_TRUE(Entry().CheckPermission(element.get(), &response));
    EXPECT_EQ(Touched(), 1u);
}

TEST_F(SessionRenewal, OfAnElementIsThatOfTheEntrysSession) {
    WriteFile(sessions_ + "/other");
    Asked("passive");
    const auto element = Element("who");
    EXPECT_TRUE(element->SetCookie("id", "other"));
    TALO::APIResponse response(element.get());
    EXPECT_TRUE(Entry().CheckPermission(element.get(), &response));
    ASSERT_EQ(Touched(), 1u);
    EXPECT_EQ(fake::Now().touched[0].path, sessions_ + "/s1");
}

TEST_F(SessionRenewal, DoesNotReviveATimedOutSessionThatIsLetIn) {
    Session().result = -1;
    Asked("tolerant");
    EXPECT_TRUE(Permitted());
    EXPECT_EQ(Touched(), 0u);
}

TEST_F(SessionRenewal, FollowsALiveSessionOfAMethodThatAllowsATimeOut) {
    Asked("tolerant");
    EXPECT_TRUE(Permitted());
    EXPECT_EQ(Touched(), 1u);
}

TEST_F(SessionRenewal, DoesNotFollowARefusedRequest) {
    for (const int result : {-1, -2, -3, 0, 3}) {
        Session().result = result;
        EndRequest();
        Asked();
        EXPECT_FALSE(Permitted()) << result;
    }
    Session().result = 1;
    EndRequest();
    Asked("who", "Test.Rights.Admin");
    EXPECT_FALSE(Permitted()) << "of another class";
    EndRequest();
    Asked("who", "Test.Rights.Photo");
    EXPECT_FALSE(Permitted()) << "without the privilege";
    EndRequest();
    Asked("who", "Test.Rights", "");
    EXPECT_FALSE(Permitted()) << "without a session";
    EXPECT_EQ(Touched(), 0u);
}

TEST_F(SessionRenewal, DoesNotFollowACallThatNeedsNoLogin) {
    Call("who", "Test.Rights.Open");
    EXPECT_EQ(Run(), 0);
    EXPECT_EQ(Touched(), 0u);
}

TEST_F(SessionRenewal, DoesNotFollowTheSessionCheckAlone) {
    EXPECT_EQ(Asked().CheckPermission(false), 0);
    EXPECT_EQ(Entry().CheckPermission(true), 0);
    EXPECT_EQ(Touched(), 0u);
}

}  // namespace
