#ifndef TESTS_RUNNER_RUNNERFIXTURE_H
#define TESTS_RUNNER_RUNNERFIXTURE_H

#include <gtest/gtest.h>
#include <syslog.h>

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "tests/support/Json.h"
#include "tests/support/LogCapture.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APIRunner.h"

namespace runner {

using support::Parse;

// A runner that shows its fields and whose hooks a test writes. `trace` notes
// which hook was asked, in order.
class OpenRunner final : public TALO::APIRunner {
  public:
    using TALO::APIRunner::compoundDepth;
    using TALO::APIRunner::d;
    using TALO::APIRunner::libDef;
    using TALO::APIRunner::libDesc;
    using TALO::APIRunner::libHandles;
    using TALO::APIRunner::request;
    using TALO::APIRunner::response;

    int Initialize(const Json::Value& document) override;
    bool NeedPermission(TALO::APIRequest* request) override;
    bool CheckPermission(TALO::APIRequest* request, TALO::APIResponse* response) override;
    bool HandleUpload(TALO::APIRequest* request, TALO::APIResponse* response) override;
    bool SkipPermission(TALO::APIRequest* request) override;

    std::vector<std::string> trace;
    std::function<int(const Json::Value&)> initialize;
    std::function<bool(TALO::APIRequest*)> need;
    std::function<bool(TALO::APIRequest*, TALO::APIResponse*)> check;
    std::function<bool(TALO::APIRequest*, TALO::APIResponse*)> upload;
    std::function<bool(TALO::APIRequest*)> skip;
};

// An empty machine, its log, and the verbs to fill it.
class Fixture : public ::testing::Test {
  protected:
    Fixture();
    ~Fixture() override;

    // Writes the defaults file. Before the first use of Runner().
    void Defaults(const std::string& json);
    // Writes a description file.
    void Describe(const std::string& file, const std::string& json);
    void Describe(const std::string& file, const Json::Value& content);
    // Puts a test module with its description on the machine.
    void Install(const std::string& api);
    // The runner, made at the first use.
    OpenRunner& Runner();

    // A document with posted parameters, and one that is an upload.
    static Json::Value Post(const std::string& api, const Json::Value& version,
                            const std::string& method,
                            const Json::Value& params = Json::Value(Json::objectValue));
    static Json::Value Upload(const std::string& api, const Json::Value& version,
                              const std::string& method);

    // Runs the base flow with a runner of its own and answers the result document.
    Json::Value Run(const Json::Value& document);
    Json::Value Call(const std::string& api, int version, const std::string& method,
                     const Json::Value& params = Json::Value(Json::objectValue));
    // The code of the same call, 0 for success.
    int Code(const std::string& api, int version, const std::string& method);

    // Whether the log has exactly this message of the runner's.
    bool Logged(const std::string& message) const;
    bool LogMentions(const std::string& text) const;

    support::LogCapture log;

  private:
    std::unique_ptr<OpenRunner> made;
};

// The whole description of an API whose library no test opens.
Json::Value Description(const std::string& methods = R"({"1": ["ok"]})");

// Where a test module lies.
std::string ModulePath(const std::string& name);

// A document {"success": false, "error": {"code": code}}, and the code of one:
// 0 for a success, -1 for what is neither.
Json::Value Error(int code);
int ErrorCode(const Json::Value& document);

// Runs the body in a child and expects that it ends well.
void InChild(const std::function<void()>& body);

}  // namespace runner

#endif
