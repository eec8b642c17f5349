#include <errno.h>
#include <stdlib.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <filesystem>

#include "platform/Paths.h"
#include "tests/fake/FakePlatform.h"
#include "tests/runner/RunnerFixture.h"
#include "tests/runner/SystemProbe.h"

namespace {

using runner::Error;
using runner::ErrorCode;
using runner::Parse;
using TALO::APIRunner;

const char kUser[] = "TALO_WEBAPI_USERNAME";

std::string Variable(const char* name) {
    const char* value = getenv(name);
    return value != nullptr ? value : "(unset)";
}

class Exec : public runner::Fixture {
  protected:
    void SetUp() override {
        std::filesystem::create_directories(TALO_WEBAPI_DIR);
        Install("Test.Basic");
    }

    Json::Value Call(const char* method, const Json::Value& params = Json::Value(),
                     const char* user = "ada") {
        Json::Value out;
        APIRunner::Exec(out, "Test.Basic", 1, method, params, user);
        return out;
    }

    // Runs in a process without the two user variables, in the root folder.
    void InCleanChild(const std::function<void()>& body) {
        runner::InChild([&] {
            ASSERT_EQ(unsetenv("USERNAME"), 0);
            ASSERT_EQ(unsetenv(kUser), 0);
            ASSERT_EQ(chdir("/"), 0);
            body();
        });
    }
};

TEST_F(Exec, AnswersTheResultDocumentWithTheRestartFlag) {
    InCleanChild([this] {
        EXPECT_EQ(Call("ok"), Parse(R"({"success": true, "httpd_restart": false})"));
        EXPECT_EQ(Call("restart"), Parse(R"({"success": true, "httpd_restart": true})"));
        EXPECT_EQ(Call("fail"),
                  Parse(R"({"success": false, "error": {"code": 400}, "httpd_restart": false})"));
        EXPECT_EQ(Call("none"),
                  Parse(R"({"success": false, "error": {"code": 103}, "httpd_restart": false})"));
    });
}

TEST_F(Exec, ReplacesWhatTheResultHeld) {
    InCleanChild([] {
        Json::Value out = Parse(R"({"stale": 1, "data": 2})");
        APIRunner::Exec(out, "Test.Basic", 1, "ok", Json::Value(), "ada");
        EXPECT_EQ(out, Parse(R"({"success": true, "httpd_restart": false})"));
    });
}

TEST_F(Exec, PostsACopyOfTheParametersUnderItsOwnIdentity) {
    InCleanChild([this] {
        const Json::Value params =
            Parse(R"({"text": "x", "list": [1], "api": "Other", "version": 9, "method": "none"})");
        const Json::Value before = params;
        EXPECT_EQ(Call("echo", params)["data"],
                  Parse(R"({"text": "x", "list": [1], "api": "Test.Basic", "version": 1,
                            "method": "echo"})"));
        EXPECT_EQ(params, before);
        EXPECT_EQ(Call("echo", Json::Value())["data"]["method"], Json::Value("echo"));
    });
}

TEST_F(Exec, TellsTheMethodWhoCalls) {
    InCleanChild([this] {
        fake::Now().administrators = {"root-user"};
        const Json::Value plain = Call("caller")["data"];
        EXPECT_EQ(plain["user"], Json::Value("ada"));
        EXPECT_EQ(plain["admin"], Json::Value(false));
        EXPECT_EQ(plain["timeout"], Json::Value(false));
        EXPECT_EQ(plain["authorized"], Json::Value(true));
        EXPECT_EQ(plain["requestMethod"], Json::Value(2));
        EXPECT_EQ(plain["environment"]["REQUEST_METHOD"], Json::Value("POST"));
        EXPECT_EQ(plain["attributes"], Json::Value(Json::objectValue));
        EXPECT_EQ(Call("caller", Json::Value(), "root-user")["data"]["admin"], Json::Value(true));
        fake::Now().FailCall("TLIBGroupIsAdminGroupMem", 1);
        EXPECT_EQ(Call("caller", Json::Value(), "root-user")["data"]["admin"], Json::Value(false));
    });
}

TEST_F(Exec, HandsOverTheAttributes) {
    InCleanChild([] {
        const std::pair<const char*, const char*> rows[] = {
            {R"({"mark": [1]})", R"({"mark": [1]})"}, {"null", "{}"}, {"[1]", "{}"}, {"5", "{}"}};
        for (const auto& [given, seen] : rows) {
            Json::Value out;
            APIRunner::Exec(out, "Test.Basic", 1, "caller", Json::Value(), Parse(given), "ada");
            EXPECT_EQ(out["data"]["attributes"], Parse(seen)) << given;
        }
    });
}

TEST_F(Exec, RunsInTheWebAPIDirectoryAndComesBack) {
    InCleanChild([this] {
        ASSERT_EQ(chdir("/usr"), 0);
        const std::string folder = Call("process")["data"]["folder"].asString() + "/";
        EXPECT_TRUE(std::filesystem::equivalent(folder, TALO_WEBAPI_DIR)) << folder;
        EXPECT_EQ(std::filesystem::current_path(), "/usr");
    });
}

TEST_F(Exec, ComesBackWhenTheCallFails) {
    InCleanChild([this] {
        for (const char* method : {"throwException", "throwNumber", "none"}) {
            (void)Call(method);
            EXPECT_EQ(std::filesystem::current_path(), "/") << method;
        }
        EXPECT_EQ(Call("ok", Parse("[1]"))["error"]["code"], Json::Value(101));
        EXPECT_EQ(std::filesystem::current_path(), "/");
    });
}

TEST_F(Exec, RunsWhereItIsWithoutTheWebAPIDirectory) {
    InCleanChild([this] {
        probe::RefuseSystemCall(SYS_chdir, ENOENT);
        EXPECT_EQ(Call("process")["data"]["folder"], Json::Value("/"));
        EXPECT_EQ(std::filesystem::current_path(), "/");
    });
}

TEST_F(Exec, KeepsTheUserInBothVariablesWhenNoneWasThere) {
    InCleanChild([this] {
        const Json::Value seen = Call("process")["data"];
        EXPECT_EQ(seen["USERNAME"], Json::Value("ada"));
        EXPECT_EQ(seen[kUser], Json::Value("ada"));
        EXPECT_EQ(Variable("USERNAME"), "ada");
        EXPECT_EQ(Variable(kUser), "ada");
    });
}

TEST_F(Exec, PutsTheFormerUserBackIntoBothVariables) {
    InCleanChild([this] {
        ASSERT_EQ(setenv(kUser, "former", 1), 0);
        ASSERT_EQ(setenv("USERNAME", "somebody", 1), 0);
        const Json::Value seen = Call("process")["data"];
        EXPECT_EQ(seen["USERNAME"], Json::Value("ada"));
        EXPECT_EQ(seen[kUser], Json::Value("ada"));
        EXPECT_EQ(Variable("USERNAME"), "former");
        EXPECT_EQ(Variable(kUser), "former");
    });
}

TEST_F(Exec, PutsAFormerEmptyUserBack) {
    InCleanChild([this] {
        ASSERT_EQ(setenv(kUser, "", 1), 0);
        (void)Call("ok");
        EXPECT_EQ(Variable("USERNAME"), "");
        EXPECT_EQ(Variable(kUser), "");
    });
}

TEST_F(Exec, ForgetsAFormerUsernameWhenThereWasNoWebAPIUser) {
    InCleanChild([this] {
        ASSERT_EQ(setenv("USERNAME", "somebody", 1), 0);
        (void)Call("ok");
        EXPECT_EQ(Variable("USERNAME"), "ada");
    });
}

TEST_F(Exec, RefusesAMissingNameMethodOrUserAndTouchesNothing) {
    InCleanChild([] {
        const char* const arguments[][3] = {
            {nullptr, "ok", "ada"}, {"Test.Basic", nullptr, "ada"}, {"Test.Basic", "ok", nullptr}};
        for (const auto& row : arguments) {
            Json::Value out;
            APIRunner::Exec(out, row[0], 1, row[1], Json::Value(), Json::Value(), row[2]);
            EXPECT_EQ(out, Error(101));
            EXPECT_EQ(std::filesystem::current_path(), "/");
            EXPECT_EQ(Variable("USERNAME"), "(unset)");
            EXPECT_EQ(Variable(kUser), "(unset)");
        }
        EXPECT_EQ(fake::Now().calls["TLIBGroupIsAdminGroupMem"], 0);
    });
}

TEST_F(Exec, NeverThrows) {
    InCleanChild([] {
        for (const char* params : {"[1]", "5", "\"text\"", "true"}) {
            for (const char* before : {"null", "[]", "5", "\"text\"", R"({"error": 5})"}) {
                Json::Value out = Parse(before);
                EXPECT_NO_THROW(APIRunner::Exec(out, "Test.Basic", 1, "ok", Parse(params), "ada"));
                EXPECT_EQ(ErrorCode(out), 101) << params << " " << before;
                EXPECT_NO_THROW(APIRunner::Exec(out, nullptr, 1, "ok", Json::Value(), "ada"));
                EXPECT_EQ(ErrorCode(out), 101);
            }
        }
    });
}

TEST_F(Exec, MakesNoPermissionCheckAndChecksTheRest) {
    InCleanChild([this] {
        EXPECT_EQ(ErrorCode(Call("ok", Json::Value(), "")), 0);
        Json::Value out;
        APIRunner::Exec(out, "Test.Basic", 0, "ok", Json::Value(), "ada");
        EXPECT_EQ(ErrorCode(out), 101);
        APIRunner::Exec(out, "Test.Basic", 4, "ok", Json::Value(), "ada");
        EXPECT_EQ(ErrorCode(out), 104);
        APIRunner::Exec(out, "../x", 1, "ok", Json::Value(), "ada");
        EXPECT_EQ(ErrorCode(out), 102);
        APIRunner::Exec(out, "", 1, "ok", Json::Value(), "ada");
        EXPECT_EQ(ErrorCode(out), 101);
        EXPECT_EQ(ErrorCode(Call("ok", Parse(R"({"relay_nd": "1"})"))), 101);
    });
}

}  // namespace
