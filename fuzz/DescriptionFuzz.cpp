#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>

#include "platform/Paths.h"
#include "platform/WebAPIUtil.h"
#include "src/base/Log.h"
#include "tests/fake/FakePlatform.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APIRunner.h"

// A description file, read and asked about as a request asks.

namespace {

constexpr char kFile[] = "Fuzz.API.lib";
constexpr char kDefaults[] =
    R"({"authLevel": 1, "allowUser": [], "priority": 0, "methods": {"allowUpload": false}})";

void Require(bool condition) {
    if (!condition) {
        abort();
    }
}

void Quiet(int, const char*) {}

// What dispatch relies on once a description was accepted.
void CheckDescription(TALO::APIRunner& runner, Json::Value description) {
    if (!runner.CheckLibDescription(description)) {
        return;
    }
    Require(description["lib"].isString());
    Require(description["minVersion"].isInt() && description["maxVersion"].isInt());
    Require(description["methods"].isObject());
    Json::Value& applied = runner.ApplyLibDef(description);
    for (const char* name : {"authLevel", "allowUser", "requestFormat", "priority"}) {
        Require(applied.isMember(name));
    }
    Require(runner.CheckLibDescription(applied));
}

void Ask(const std::string& api, int version, const std::string& method) {
    TALO::APIRunner runner;
    Json::Value document;
    document["getParam"]["api"] = api;
    document["getParam"]["version"] = version;
    document["getParam"]["method"] = method;
    TALO::APIRequest request(document);
    TALO::APIResponse response(&request);
    const bool passed = runner.CheckRequestParam(&request, &response) != 0;
    Require(passed == (response.GetError() == 0));
    Require(!passed || runner.AddAPIInfo(&request) != 0);
    (void)runner.GetMethod(api, version, method);
    for (const char* attribute : {"allowUpload", "allowDownload", "allowDemo", "deferUpload"}) {
        (void)runner.GetMethodAttr(&request, attribute);
    }
}

// The first method that the file itself names for a version, else "list".
std::string NamedMethod(const Json::Value& description, const char* version) {
    if (!description.isObject() || !description["methods"].isObject()) {
        return "list";
    }
    const Json::Value& entries = description["methods"][version];
    const Json::Value first = entries.isArray() && !entries.empty() ? entries[0u] : Json::Value();
    if (first.isObject() && !first.empty()) {
        return first.begin().name();
    }
    return first.isString() ? first.asString() : "list";
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    TALO::SetLogSink(Quiet);
    fake::Reset();
    fake::Now().files[kFile] = std::string(reinterpret_cast<const char*>(data), size);
    fake::Now().files[TALO_LIB_DEF] = kDefaults;
    Json::Value content;
    if (TALO::WebAPIUtil::ReadJsonFile(content, kFile) && content.isObject()) {
        TALO::APIRunner runner;
        for (auto member = content.begin(); member != content.end(); ++member) {
            CheckDescription(runner, *member);
        }
    }
    Json::Value own = content.isObject() ? content["Fuzz.API"] : Json::Value();
    Ask("Fuzz.API", 1, NamedMethod(own, "1"));
    Ask("Fuzz.API", 2, NamedMethod(own, "2"));
    Ask("Fuzz.API.More", 1, "list");
    return 0;
}
