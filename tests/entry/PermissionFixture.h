#ifndef TESTS_ENTRY_PERMISSIONFIXTURE_H
#define TESTS_ENTRY_PERMISSIONFIXTURE_H

#include <gtest/gtest.h>

#include <memory>
#include <string>

#include "tests/fake/FakePlatform.h"
#include "tests/support/Json.h"
#include "tests/support/LogCapture.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/WebEntry.h"

namespace rights {

using support::Parse;

// The entry with its request and response in sight.
class OpenEntry : public TALO::WebEntry {
  public:
    virtual ~OpenEntry() = default;
    using TALO::WebEntry::CheckPermission;
    using TALO::WebEntry::request;
    using TALO::WebEntry::response;
};

// An appliance in memory: the API "Test.Rights" and its kin, and the session
// "s1" of the user "ann". A test changes the world first and then asks for Entry().
class PermissionFixture : public ::testing::Test {
  protected:
    PermissionFixture();
    ~PermissionFixture() override;

    // A session of the fake platform, made when it is new.
    static fake::Session& Session(const std::string& id = "s1") {
        return fake::Now().sessions[id];
    }

    // Puts members into the description of an API; the text "(absent)" takes one
    // out.
    void Describe(const std::string& members, const std::string& api = "Test.Rights");

    // The entry of the test, made at first use.
    OpenEntry& Entry();

    // Forgets the entry: the next one is another request.
    void EndRequest() {
        entry_.reset();
    }

    // The entry's request becomes a call with this cookie header.
    OpenEntry& Call(const std::string& method = "who", const std::string& api = "Test.Rights",
                    const std::string& cookie = "id=s1");

    // The same, with the description loaded, as far as the permission hooks.
    OpenEntry& Asked(const std::string& method = "who", const std::string& api = "Test.Rights",
                     const std::string& cookie = "id=s1");

    // A request of its own with that API's description, as an element has it.
    std::unique_ptr<TALO::APIRequest> Element(const std::string& method = "who",
                                              const std::string& api = "Test.Rights");

    // The full check of the entry's own request.
    bool Permitted() {
        return Entry().CheckPermission(Entry().request, Entry().response);
    }

    // Runs the whole call and answers its code, 0 for a success.
    int Run();

    static Json::Value SessionOf(const TALO::APIRequest& request);
    static size_t Checks() {
        return fake::Now().authCalls.size();
    }

    support::LogCapture log;

  private:
    Json::Value descriptions_;
    std::unique_ptr<OpenEntry> entry_;
};

}  // namespace rights

#endif
