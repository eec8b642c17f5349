#include "tests/entry/PermissionFixture.h"

#include <stdlib.h>

#include <cstring>

#include "platform/Paths.h"
#include "src/request/APIRequestPrivate.h"

namespace rights {

namespace {

const char kMethods[] = R"({"1": ["who", {"tolerant": {"allowTimeout": true}},
                                  {"passive": {"passive": true}},
                                  {"tolerantPassive": {"allowTimeout": true, "passive": true}}]})";

const char kKin[] = R"({
    "Test.Rights": {"authLevel": 1, "allowUser": ["admin.local", "normal.local"]},
    "Test.Rights.Admin": {"authLevel": 1, "allowUser": ["admin.local"]},
    "Test.Rights.Open": {"authLevel": 0},
    "Test.Rights.Optional": {"authLevel": 2, "allowUser": ["normal.local"]},
    "Test.Rights.Photo": {"authLevel": 1, "allowUser": ["normal.local"], "appPriv": "Photos"}})";

Json::Value Identity(const std::string& api, const std::string& method) {
    Json::Value params(Json::objectValue);
    params["api"] = api;
    params["version"] = 1;
    params["method"] = method;
    return params;
}

}  // namespace

PermissionFixture::PermissionFixture() : descriptions_(Parse(kKin)) {
    fake::Reset();
    (void)unsetenv("TALO_WEBAPI_USERNAME");
    for (const std::string& api : descriptions_.getMemberNames()) {
        Json::Value& description = descriptions_[api];
        description["lib"] = RIGHTS_TEST_MODULE;
        description["minVersion"] = 1;
        description["maxVersion"] = 1;
        description["methods"] = Parse(kMethods);
    }
    Describe("{}");
    // A site without defaults: nothing but a description opens an API.
    fake::Now().WriteJson(TALO_LIB_DEF, Parse("{}"));
    fake::Now().WriteJson("TALO.Entry.Request.lib", Parse(R"({"TALO.Entry.Request": {
        "lib": "", "minVersion": 1, "maxVersion": 1, "methods": {"1": ["request"]}}})"));
    Session().user = "ann";
}

PermissionFixture::~PermissionFixture() {
    entry_.reset();
    (void)unsetenv("TALO_WEBAPI_USERNAME");
    fake::Reset();
}

void PermissionFixture::Describe(const std::string& members, const std::string& api) {
    const Json::Value changes = Parse(members);
    for (const std::string& name : changes.getMemberNames()) {
        descriptions_[api][name] = changes[name];
        if (changes[name] == Json::Value("(absent)")) {
            descriptions_[api].removeMember(name);
        }
    }
    fake::Now().WriteJson("Test.Rights.lib", descriptions_);
}

OpenEntry& PermissionFixture::Entry() {
    if (entry_ == nullptr) {
        entry_ = std::make_unique<OpenEntry>();
    }
    return *entry_;
}

OpenEntry& PermissionFixture::Call(const std::string& method, const std::string& api,
                                   const std::string& cookie) {
    Json::Value environ(Json::objectValue);
    environ["REQUEST_METHOD"] = "POST";
    environ["HTTP_COOKIE"] = cookie;
    Entry().request->InitEnv(environ);
    Json::Value document(Json::objectValue);
    document["postParam"] = Identity(api, method);
    Entry().request->InitParam(document, false);
    return Entry();
}

OpenEntry& PermissionFixture::Asked(const std::string& method, const std::string& api,
                                    const std::string& cookie) {
    OpenEntry& entry = Call(method, api, cookie);
    EXPECT_TRUE(entry.CheckRequestParam(entry.request, entry.response));
    EXPECT_TRUE(entry.AddAPIInfo(entry.request));
    return entry;
}

std::unique_ptr<TALO::APIRequest> PermissionFixture::Element(const std::string& method,
                                                             const std::string& api) {
    Json::Value document(Json::objectValue);
    document["postParam"] = Identity(api, method);
    auto element = std::make_unique<TALO::APIRequest>(document);
    TALO::APIResponse response(element.get());
    EXPECT_TRUE(Entry().CheckRequestParam(element.get(), &response));
    EXPECT_TRUE(Entry().AddAPIInfo(element.get()));
    return element;
}

int PermissionFixture::Run() {
    (void)Entry().Process(Entry().request, Entry().response);
    return Entry().response->GetError();
}

Json::Value PermissionFixture::SessionOf(const TALO::APIRequest& request) {
    TALO::APIRequestPrivate* d = nullptr;
    std::memcpy(&d, reinterpret_cast<const char*>(&request) + sizeof(void*), sizeof d);
    return d->GetData("session", "", Json::Value());
}

}  // namespace rights
