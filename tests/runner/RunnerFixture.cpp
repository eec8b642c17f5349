#include "tests/runner/RunnerFixture.h"

#include <fstream>
#include <iterator>

#include "platform/Paths.h"
#include "tests/fake/FakePlatform.h"
#include "tests/support/Child.h"

namespace runner {

namespace {

std::string ReplaceAll(std::string text, const std::string& from, const std::string& to) {
    for (size_t at = 0; (at = text.find(from, at)) != std::string::npos; at += to.size()) {
        text.replace(at, from.size(), to);
    }
    return text;
}

}  // namespace

int OpenRunner::Initialize(const Json::Value& document) {
    trace.push_back("initialize");
    return initialize ? initialize(document) : APIRunner::Initialize(document);
}

bool OpenRunner::NeedPermission(TALO::APIRequest* asked) {
    trace.push_back("need");
    return need ? need(asked) : APIRunner::NeedPermission(asked);
}

bool OpenRunner::CheckPermission(TALO::APIRequest* asked, TALO::APIResponse* answer) {
    trace.push_back("check");
    return check ? check(asked, answer) : APIRunner::CheckPermission(asked, answer);
}

bool OpenRunner::HandleUpload(TALO::APIRequest* asked, TALO::APIResponse* answer) {
    trace.push_back("upload");
    return upload ? upload(asked, answer) : APIRunner::HandleUpload(asked, answer);
}

bool OpenRunner::SkipPermission(TALO::APIRequest* asked) {
    trace.push_back("skip");
    return skip ? skip(asked) : APIRunner::SkipPermission(asked);
}

Fixture::Fixture() {
    fake::Reset();
    Defaults(R"({"authLevel": 1, "allowUser": ["admin.local"], "priority": 0,
                 "methods": {"allowUpload": false, "allowDownload": false}})");
}

Fixture::~Fixture() {
    made.reset();
    fake::Reset();
}

void Fixture::Defaults(const std::string& json) {
    fake::Now().files[TALO_LIB_DEF] = json;
}

void Fixture::Describe(const std::string& file, const std::string& json) {
    fake::Now().files[file] = json;
}

void Fixture::Describe(const std::string& file, const Json::Value& content) {
    fake::Now().WriteJson(file, content);
}

void Fixture::Install(const std::string& api) {
    std::ifstream file(std::string(TEST_DESCRIPTION_DIR) + "/" + api + ".lib");
    ASSERT_TRUE(file.good()) << api;
    const std::string text(std::istreambuf_iterator<char>(file), {});
    Describe(api + ".lib", ReplaceAll(text, "\"lib/", "\"" TEST_MODULE_DIR "/"));
}

OpenRunner& Fixture::Runner() {
    if (made == nullptr) {
        made = std::make_unique<OpenRunner>();
    }
    return *made;
}

Json::Value Fixture::Post(const std::string& api, const Json::Value& version,
                          const std::string& method, const Json::Value& params) {
    Json::Value document(Json::objectValue);
    document["environ"]["REQUEST_METHOD"] = "POST";
    Json::Value& post = document["postParam"] = params;
    post["api"] = api;
    post["version"] = version;
    post["method"] = method;
    return document;
}

Json::Value Fixture::Upload(const std::string& api, const Json::Value& version,
                            const std::string& method) {
    Json::Value document = Post(api, version, method);
    document["environ"]["CONTENT_TYPE"] = "multipart/form-data; boundary=x";
    return document;
}

Json::Value Fixture::Run(const Json::Value& document) {
    OpenRunner runner;
    (void)runner.Run(document);
    Json::Value body = runner.GetResponse();
    body.removeMember("httpd_restart");
    return body;
}

Json::Value Fixture::Call(const std::string& api, int version, const std::string& method,
                          const Json::Value& params) {
    return Run(Post(api, version, method, params));
}

int Fixture::Code(const std::string& api, int version, const std::string& method) {
    return ErrorCode(Call(api, version, method));
}

bool Fixture::Logged(const std::string& message) const {
    return log.Has("APIRunner.cpp", message);
}

bool Fixture::LogMentions(const std::string& text) const {
    for (const support::LogLine& line : log.Lines()) {
        if (line.text.find(text) != std::string::npos) {
            return true;
        }
    }
    return false;
}

Json::Value Description(const std::string& methods) {
    Json::Value description(Json::objectValue);
    description["lib"] = "lib/None.so";
    description["minVersion"] = 1;
    description["maxVersion"] = 3;
    description["methods"] = Parse(methods);
    return description;
}

std::string ModulePath(const std::string& name) {
    return std::string(TEST_MODULE_DIR) + "/" + name + ".so";
}

Json::Value Error(int code) {
    Json::Value document(Json::objectValue);
    document["success"] = false;
    document["error"]["code"] = code;
    return document;
}

int ErrorCode(const Json::Value& document) {
    const Json::Value success = document.isObject() ? document["success"] : Json::Value();
    if (!success.isBool()) {
        return -1;
    }
    if (success.asBool()) {
        return 0;
    }
    const Json::Value code = document["error"]["code"];
    return code.isInt() ? code.asInt() : -1;
}

void InChild(const std::function<void()>& body) {
    const support::ChildResult result = support::InChild([&body] {
        body();
        return 0;
    });
    EXPECT_EQ(result.status, 0) << result.output;
}

}  // namespace runner
