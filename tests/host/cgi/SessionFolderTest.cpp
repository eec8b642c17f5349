#include <sys/stat.h>

#include <cstring>
#include <filesystem>
#include <string>

#include "hosts/linux/cgi/SessionStore.h"
#include "platform/Cgi.h"
#include "platform/Paths.h"
#include "tests/host/cgi/SessionFixture.h"

namespace fs = std::filesystem;

namespace {

class SessionFolder : public ::testing::Test {
  protected:
    ~SessionFolder() override {
        fs::remove_all(TALO_SESSION_DIR);
    }

    static bool Begin(std::string* id) {
        talo::Session session;
        session.user = "normal";
        return talo::CreateSession(session, id);
    }

    Host host;
};

TEST_F(SessionFolder, IsMadeWhenItIsNeededAndOnlyForItsOwner) {
    fs::remove_all(fs::path(TALO_SESSION_DIR).parent_path());
    EXPECT_TRUE(talo::ListSessions().empty());
    std::string id;
    ASSERT_TRUE(Begin(&id));
    struct stat facts = {};
    ASSERT_EQ(stat(TALO_SESSION_DIR, &facts), 0);
    EXPECT_EQ(facts.st_mode & 07777, 0700u);
    EXPECT_TRUE(fs::is_regular_file(TALO_SESSION_DIR "/" + id));
}

TEST_F(SessionFolder, IsMadeForAContextWhateverTheUmask) {
    const mode_t before = umask(0);
    TALOCGI ctx;
    std::memset(&ctx, 0, sizeof ctx);
    EXPECT_EQ(TaloCgiInit("", &ctx), 0);
    TaloCgiFree(&ctx);
    struct stat facts = {};
    ASSERT_EQ(stat(TALO_SESSION_DIR, &facts), 0);
    EXPECT_EQ(facts.st_mode & 07777, 0700u);
    (void)umask(before);
}

TEST_F(SessionFolder, IsNamedWithoutTheLinksThatLeadToIt) {
    const fs::path place = fs::path(TALO_SESSION_DIR).parent_path() / "elsewhere";
    fs::create_directories(place);
    fs::create_directory_symlink(place, TALO_SESSION_DIR);
    EXPECT_EQ(host::SessionDir(), fs::canonical(place).string());
    std::string id;
    ASSERT_TRUE(Begin(&id));
    EXPECT_TRUE(fs::exists(place / id));
    fs::remove_all(place);
}

TEST_F(SessionFolder, ThatCannotBeUsedBeginsNoSession) {
    fs::create_directories(fs::path(TALO_SESSION_DIR).parent_path());
    fs::create_directory_symlink("/nowhere/at/all", TALO_SESSION_DIR);
    std::string id = "untouched";
    EXPECT_FALSE(Begin(&id));
    EXPECT_EQ(id, "untouched");
    EXPECT_TRUE(talo::ListSessions().empty());
    EXPECT_FALSE(talo::EndSessionByHandle("h"));
    EXPECT_FALSE(talo::RenewSession(UnusedId()));
}

}  // namespace
