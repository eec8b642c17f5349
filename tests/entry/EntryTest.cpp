#include "tests/entry/EntryTest.h"

#include <stdlib.h>
#include <unistd.h>

#include <algorithm>
#include <fstream>
#include <iterator>

#include "platform/Paths.h"
#include "tests/support/Json.h"
#include "tests/support/LogCapture.h"

using support::Parse;

namespace {

const char kDescription[] = R"({"Test.Entry": {
    "lib": "", "minVersion": 1, "maxVersion": 3,
    "methods": {
        "1": ["echo", "silent", "throwing", "printing", "notFound", "later", "ownOutput",
              "restart", "restartOnly",
              {"upload": {"allowUpload": true}},
              {"trust": {"allowUpload": true}},
              {"deferred": {"allowUpload": true, "deferUpload": true}},
              {"reading": {"allowUpload": true, "deferUpload": true}},
              {"download": {"allowDownload": true}}],
        "2": ["echo"],
        "3": ["unknown"]}}})";

void Adopt(const Call& call) {
    (void)clearenv();
    for (const auto& variable : call.environment) {
        (void)setenv(variable.first.c_str(), variable.second.c_str(), 1);
    }
}

Reply Understand(const support::ChildResult& result) {
    Reply reply;
    reply.status = result.status;
    reply.output = result.output;
    const size_t end = result.output.find("\r\n\r\n");
    if (end == std::string::npos) {
        return reply;
    }
    reply.headers = result.output.substr(0, end + 2);
    reply.bodyText = result.output.substr(end + 4);
    try {
        reply.body = Parse(reply.bodyText);
        reply.wellFormed = reply.body.isObject();
    } catch (const std::exception&) {
        reply.wellFormed = false;
    }
    return reply;
}

}  // namespace

Call Call::With(const std::string& name, const std::string& value) const {
    Call changed = *this;
    changed.environment[name] = value;
    return changed;
}

Call Call::Without(const std::string& name) const {
    Call changed = *this;
    changed.environment.erase(name);
    return changed;
}

Call Get(const std::string& query) {
    return {{{"REQUEST_METHOD", "GET"}, {"QUERY_STRING", query}}, ""};
}

Call Post(const std::string& body) {
    return {{{"REQUEST_METHOD", "POST"},
             {"CONTENT_TYPE", "application/x-www-form-urlencoded"},
             {"CONTENT_LENGTH", std::to_string(body.size())}},
            body};
}

Call GetMethod(const std::string& method, const std::string& more) {
    return Get("api=Test.Entry&version=1&method=" + method + more);
}

int Reply::Code() const {
    if (!wellFormed || !body["success"].isBool()) {
        return -1;
    }
    return body["success"].asBool() ? 0 : body["error"]["code"].asInt();
}

const Json::Value& Reply::Param(const std::string& name) const {
    return body["data"]["params"][name];
}

void ProbeEntry::TakeEnvironment() {
    Json::Value variables(Json::objectValue);
    ASSERT_TRUE(APIRunner::InitEnv(variables));
    request->InitEnv(variables);
}

EntryTest::EntryTest() {
    char name[] = "/tmp/entry-test-XXXXXX";
    folder_ = mkdtemp(name);
    trace_ = folder_ + "/trace";
    fake::Reset();
    Json::Value description = Parse(kDescription);
    description["Test.Entry"]["lib"] = ENTRY_TEST_MODULE;
    fake::Now().WriteJson("Test.Entry.lib", description);
    fake::Now().WriteJson(TALO_LIB_DEF, Parse(R"({"authLevel": 0, "priority": 0,
                                                  "methods": {"allowDemo": true}})"));
}

EntryTest::~EntryTest() {
    (void)unlink(trace_.c_str());
    (void)rmdir(folder_.c_str());
    fake::Reset();
}

Reply EntryTest::Serve(const Call& call) {
    return Understand(support::InChild(
        [&call] {
            const support::LogCapture quiet;
            Adopt(call);
            ProbeEntry entry;
            (void)entry.Run(Json::Value());
            return 0;
        },
        call.body));
}

std::string EntryTest::Inside(const Call& call, const std::function<void(ProbeEntry&)>& steps) {
    const support::ChildResult result = support::InChild(
        [&call, &steps] {
            const support::LogCapture quiet;
            Adopt(call);
            ProbeEntry entry;
            steps(entry);
            return 0;
        },
        call.body);
    EXPECT_EQ(result.status, 0) << result.output;
    return result.output;
}

std::string EntryTest::WaitForTrace(size_t lines) const {
    constexpr int kMaxTries = 1000;
    std::string text;
    for (int tries = 0; tries < kMaxTries; ++tries) {
        std::ifstream file(trace_);
        text.assign(std::istreambuf_iterator<char>(file), {});
        if (static_cast<size_t>(std::count(text.begin(), text.end(), '\n')) >= lines) {
            break;
        }
        (void)usleep(20000);
    }
    return text;
}

Call EntryTest::Traced(const Call& call) const {
    return call.With("ENTRY_TRACE", trace_);
}
