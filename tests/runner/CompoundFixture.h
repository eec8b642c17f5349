#ifndef TESTS_RUNNER_COMPOUNDFIXTURE_H
#define TESTS_RUNNER_COMPOUNDFIXTURE_H

#include "tests/runner/RunnerFixture.h"

namespace runner {

// Compound requests over the test modules.
class CompoundFixture : public Fixture {
  protected:
    void SetUp() override {
        Install("Test.Basic");
        Json::Value content(Json::objectValue);
        content["TALO.Entry.Request"] = Description(R"({"1": ["request", "other"]})");
        Describe("TALO.Entry.Request.lib", content);
    }

    static Json::Value Element(const std::string& method, const std::string& more = "{}") {
        Json::Value element = Parse(more);
        element["api"] = "Test.Basic";
        element["version"] = 1;
        element["method"] = method;
        return element;
    }

    static Json::Value List(const std::vector<Json::Value>& elements) {
        Json::Value list(Json::arrayValue);
        for (const Json::Value& element : elements) {
            list.append(element);
        }
        return list;
    }

    static Json::Value Nested(const Json::Value& list) {
        Json::Value element(Json::objectValue);
        element["api"] = "TALO.Entry.Request";
        element["version"] = 1;
        element["method"] = "request";
        element["compound"] = list;
        return element;
    }

    // The document of a whole compound request.
    static Json::Value Document(const Json::Value& list) {
        Json::Value params(Json::objectValue);
        params["compound"] = list;
        return Post("TALO.Entry.Request", 1, "request", params);
    }

    static Json::Value Stopping(const Json::Value& list, const Json::Value& stop) {
        Json::Value document = Document(list);
        document["postParam"]["stop_when_error"] = stop;
        return document;
    }

    // Runs it in Runner() and answers the data of its success.
    Json::Value Data(const Json::Value& document) {
        (void)Runner().Run(document);
        const Json::Value body = Runner().response->GetBody();
        EXPECT_EQ(body["success"], Json::Value(true)) << body;
        return body["data"];
    }

    // The codes of the elements in order, 0 for success.
    static std::vector<int> Codes(const Json::Value& data) {
        std::vector<int> codes;
        for (const Json::Value& entry : data["result"]) {
            codes.push_back(ErrorCode(entry));
        }
        return codes;
    }

    // An entry without its echo of the identity.
    static Json::Value Bare(Json::Value entry) {
        for (const char* name : {"api", "version", "method"}) {
            entry.removeMember(name);
        }
        return entry;
    }
};

typedef std::vector<int> CodeList;

}  // namespace runner

#endif
