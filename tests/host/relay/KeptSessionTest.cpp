#include <sys/stat.h>

#include <filesystem>
#include <fstream>
#include <iterator>

#include "platform/Paths.h"
#include "tests/host/relay/RelayFixture.h"
#include "tests/support/Json.h"

namespace {

namespace fs = std::filesystem;
using talo::RelayError;

class KeptSession : public RelayTest {
  protected:
    size_t Opened() const {
        return target.Requests("TALO.Relay").size();
    }
    size_t Called() const {
        return target.Requests("TALO.Test").size();
    }
    std::string LastCookie() const {
        return HeaderOf(target.Requests("TALO.Test").back(), "Cookie");
    }

    static std::vector<std::string> Files() {
        std::vector<std::string> files;
        if (fs::exists(TALO_RELAY_DIR)) {
            for (const fs::directory_entry& entry : fs::directory_iterator(TALO_RELAY_DIR)) {
                files.push_back(entry.path());
            }
        }
        return files;
    }
    static std::string File() {
        EXPECT_EQ(Files().size(), 1);
        return Files().at(0);
    }
    static std::string Content() {
        std::ifstream file(File());
        return std::string(std::istreambuf_iterator<char>(file), {});
    }
};

TEST_F(KeptSession, IsOpenedOnceForManyCalls) {
    for (int round = 0; round < 3; ++round) {
        EXPECT_EQ(Call().error, 0);
        EXPECT_EQ(LastCookie(), "id=session-1");
    }
    EXPECT_EQ(Opened(), 1);
}

TEST_F(KeptSession, LiesWhereOnlyItsOwnerLooks) {
    (void)Call();
    struct stat facts = {};
    ASSERT_EQ(stat(TALO_RELAY_DIR, &facts), 0);
    EXPECT_EQ(facts.st_mode & 0777, 0700);
    ASSERT_EQ(stat(File().c_str(), &facts), 0);
    EXPECT_EQ(facts.st_mode & 0777, 0600);
}

TEST_F(KeptSession, IsOfOneUserAndOneLanguage) {
    (void)Call();
    LogIn("bert", "ger");
    (void)Call();
    EXPECT_EQ(LastCookie(), "id=session-2");
    LogIn("bert", "");
    (void)Call();
    EXPECT_EQ(LastCookie(), "id=session-3");
    LogIn("anna", "ger");
    (void)Call();
    EXPECT_EQ(LastCookie(), "id=session-1");
}

TEST_F(KeptSession, IsOfNobodyWhoseNamesOnlyReadTheSameTogether) {
    LogIn("ann", "ager");
    (void)Call();
    LogIn("annager", "");
    (void)Call();
    EXPECT_EQ(LastCookie(), "id=session-2");
}

TEST_F(KeptSession, IsOfOneAppliance) {
    Enter(NodeOf(target, 3));
    (void)Call();
    (void)Call(Json::Value(), 3);
    EXPECT_EQ(LastCookie(), "id=session-2");
}

TEST_F(KeptSession, IsNotToldToAnApplianceThatTookThePlace) {
    (void)Call();
    Target other(certificates);
    Enter(NodeOf(other));
    EXPECT_EQ(Call().error, 0);
    EXPECT_EQ(other.Requests("TALO.Relay").size(), 1);
    EXPECT_EQ(HeaderOf(other.Requests()[0], "Cookie"), "none");
}

TEST_F(KeptSession, HoldsForANameOfAnyLength) {
    LogIn(std::string(2000, 'x') + "/../\n", "ger");
    EXPECT_EQ(Call().error, 0);
    EXPECT_EQ(Call().error, 0);
    EXPECT_EQ(Opened(), 1);
}

TEST_F(KeptSession, IsOpenedAnewAndTheCallMadeOnceMoreWhenItIsRefused) {
    for (const char* word : {"timeout", "unauth", "noprivilege"}) {
        SCOPED_TRACE(word);
        target.Plan(R"({"TALO.Test":{"body":"yes"}})");
        EXPECT_EQ(Call().answer, "yes");
        const size_t opened = Opened();
        const size_t called = Called();
        target.Plan(R"({"TALO.Test":{"body":"yes","session":"session-)" +
                    std::to_string(opened + 1) + R"(","refusal":")" + word + R"("}})");
        EXPECT_EQ(Call().answer, "yes");
        EXPECT_EQ(Opened(), opened + 1);
        EXPECT_EQ(Called(), called + 2);
        EXPECT_EQ(LastCookie(), "id=session-" + std::to_string(opened + 1));
        EXPECT_EQ(Call().answer, "yes");
        EXPECT_EQ(Opened(), opened + 1);
    }
}

TEST_F(KeptSession, IsNotOpenedASecondTimeForOneCall) {
    (void)Call();
    target.Plan(R"({"TALO.Test":{"body":"no","headers":{"x-request-error":"noprivilege"}}})");
    const Outcome outcome = Call();
    EXPECT_EQ(outcome.error, 0);
    EXPECT_EQ(outcome.answer, "no");
    EXPECT_EQ(Opened(), 2);
    EXPECT_EQ(Called(), 3);
}

TEST_F(KeptSession, IsNotOpenedAnewWhereItIsNew) {
    target.Plan(R"({"TALO.Test":{"body":"no","headers":{"x-request-error":"noprivilege"}}})");
    EXPECT_EQ(Call().answer, "no");
    EXPECT_EQ(Opened(), 1);
    EXPECT_EQ(Called(), 1);
}

TEST_F(KeptSession, StaysWithAnotherErrorOfTheCall) {
    target.Plan(R"({"TALO.Test":{"body":"no","headers":{"x-request-error":"disk full"}}})");
    EXPECT_EQ(Call().answer, "no");
    EXPECT_EQ(Call().answer, "no");
    EXPECT_EQ(Opened(), 1);
    EXPECT_EQ(Called(), 2);
}

TEST_F(KeptSession, IsForgottenWhenNoOtherIsGranted) {
    (void)Call();
    target.Plan(R"({"TALO.Relay":{"body":"{\"success\":false,\"error\":{\"code\":500}}"},
                    "TALO.Test":{"headers":{"x-request-error":"unauth"}}})");
    const Outcome outcome = Call();
    EXPECT_EQ(outcome.error, Number(RelayError::kRefused));
    EXPECT_EQ(outcome.answer, "");
    EXPECT_TRUE(Files().empty());
}

struct ContentRow {
    const char* name;
    std::string (*change)(const std::string& content);
};

std::string With(const std::string& content, const char* member, const Json::Value& value) {
    Json::Value record = support::Parse(content);
    record[member] = value;
    return Json::writeString(Json::StreamWriterBuilder(), record);
}

const ContentRow kContents[] = {
    {"Empty", [](const std::string&) { return std::string(); }},
    {"Half", [](const std::string& content) { return content.substr(0, content.size() / 2); }},
    {"NoObject", [](const std::string&) { return std::string("[1]"); }},
    {"Nul", [](const std::string& content) { return content + '\0'; }},
    {"Deep", [](const std::string&) { return std::string(10000, '['); }},
    {"Huge", [](const std::string& content) { return content + std::string(1 << 20, ' '); }},
    {"OtherUser", [](const std::string& content) { return With(content, "user", "bert"); }},
    {"OtherNode", [](const std::string& content) { return With(content, "node", 3); }},
    {"SessionOfTwoLines",
     [](const std::string& content) { return With(content, "sid", "x\r\nX-Evil: 1"); }},
    {"SessionOfTwoCookies",
     [](const std::string& content) { return With(content, "sid", "a; b=c"); }},
    {"SessionThatIsEmpty", [](const std::string& content) { return With(content, "sid", ""); }},
    {"SessionThatIsTooLong",
     [](const std::string& content) { return With(content, "sid", std::string(257, 'x')); }},
    {"SessionThatIsANumber", [](const std::string& content) { return With(content, "sid", 1); }},
};

TEST_F(KeptSession, IsOpenedAnewWhereItsFileIsDamaged) {
    size_t opened = 0;
    for (const ContentRow& row : kContents) {
        SCOPED_TRACE(row.name);
        fs::remove_all(TALO_RELAY_DIR);
        (void)Call();
        const std::string changed = row.change(Content());
        std::ofstream(File()) << changed;
        EXPECT_EQ(Call().error, 0);
        opened += 2;
        EXPECT_EQ(LastCookie(), "id=session-" + std::to_string(opened)) << changed;
        EXPECT_EQ(Call().error, 0);
        EXPECT_EQ(Opened(), opened);
    }
}

TEST_F(KeptSession, IsNotReadFromAFileThatOthersCouldRead) {
    (void)Call();
    ASSERT_EQ(chmod(File().c_str(), 0644), 0);
    EXPECT_EQ(Call().error, 0);
    EXPECT_EQ(Opened(), 2);
}

TEST_F(KeptSession, IsNotReadOverALinkNorFromAPipe) {
    (void)Call();
    const std::string file = File();
    const std::string elsewhere = certificates.Authority() + ".kept";
    fs::rename(file, elsewhere);
    fs::create_symlink(elsewhere, file);
    EXPECT_EQ(Call().error, 0);
    EXPECT_EQ(Opened(), 2);
    EXPECT_FALSE(fs::is_symlink(file));
    fs::remove(file);
    ASSERT_EQ(mkfifo(file.c_str(), 0600), 0);
    EXPECT_EQ(Call().error, 0);
    EXPECT_EQ(Opened(), 3);
    EXPECT_TRUE(fs::is_regular_file(file));
}

TEST_F(KeptSession, IsDoneWithoutWhereItCannotLie) {
    fs::create_directories(fs::path(TALO_RELAY_DIR).parent_path());
    std::ofstream(TALO_RELAY_DIR) << "no folder";
    EXPECT_EQ(Call().error, 0);
    EXPECT_EQ(Call().error, 0);
    EXPECT_EQ(Opened(), 2);
}

TEST_F(KeptSession, IsNotPutWhereOthersMayEnter) {
    fs::create_directories(TALO_RELAY_DIR);
    ASSERT_EQ(chmod(TALO_RELAY_DIR, 0755), 0);
    EXPECT_EQ(Call().error, 0);
    EXPECT_TRUE(Files().empty());
    EXPECT_TRUE(WasLogged("mode 0700"));
}

struct AnswerRow {
    const char* name;
    const char* body;
};

const AnswerRow kAnswers[] = {
    {"Refusal", R"({"success":false,"error":{"code":500}})"},
    {"RefusalWithSession", R"({"success":false,"data":{"sid":"x"}})"},
    {"NoJson", "<html></html>"},
    {"Nothing", ""},
    {"NoObject", "[]"},
    {"NoData", R"({"success":true})"},
    {"DataOfAnotherKind", R"({"success":true,"data":"sid"})"},
    {"SuccessOfAnotherKind", R"({"success":1,"data":{"sid":"x"}})"},
    {"SessionOfAnotherKind", R"({"success":true,"data":{"sid":1}})"},
    {"SessionOfTwoLines", R"({"success":true,"data":{"sid":"a\r\nX-Evil: 1"}})"},
    {"EmptySession", R"({"success":true,"data":{"sid":""}})"},
};

TEST_F(KeptSession, IsNoneWhereTheAnswerHoldsNone) {
    for (const AnswerRow& row : kAnswers) {
        SCOPED_TRACE(row.name);
        Json::Value plan(Json::objectValue);
        plan["TALO.Relay"]["body"] = row.body;
        target.Plan(Json::writeString(Json::StreamWriterBuilder(), plan));
        EXPECT_EQ(Call().error, Number(RelayError::kRefused));
    }
    EXPECT_EQ(Called(), 0);
    EXPECT_FALSE(fs::exists(TALO_RELAY_DIR));
}

}  // namespace
