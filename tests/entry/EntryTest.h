#ifndef TESTS_ENTRY_ENTRYTEST_H
#define TESTS_ENTRY_ENTRYTEST_H

#include <gtest/gtest.h>
#include <json/json.h>

#include <functional>
#include <map>
#include <string>

#include "tests/fake/FakePlatform.h"
#include "tests/support/Child.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/WebEntry.h"

// What a web server hands to the entry: the whole environment, and the body on
// standard input.
struct Call {
    std::map<std::string, std::string> environment;
    std::string body;

    Call With(const std::string& name, const std::string& value) const;
    Call Without(const std::string& name) const;
};

// A GET of a query string; a POST of a body with its right CONTENT_LENGTH.
Call Get(const std::string& query);
Call Post(const std::string& body);

// A GET of one method of the API "Test.Entry", with more parameters or none.
Call GetMethod(const std::string& method, const std::string& more = "");

struct Reply {
    int status = -1;      // of the process, or 1000 + signal
    std::string output;   // everything it wrote
    std::string headers;  // up to and with the line end of the last header
    std::string bodyText;
    Json::Value body;
    bool wellFormed = false;  // header block, empty line, one JSON object

    // The error code, 0 for a success, -1 for neither.
    int Code() const;
    // What the method "echo" was given.
    const Json::Value& Param(const std::string& name) const;
};

// The entry with its request and response in sight.
class ProbeEntry final : public TALO::WebEntry {
  public:
    using TALO::WebEntry::request;
    using TALO::WebEntry::response;

    // The first two steps of Initialize, for operations called on their own.
    void TakeEnvironment();
};

// An appliance in memory with one API, "Test.Entry". Each request is served in a
// process of its own, as in life.
class EntryTest : public ::testing::Test {
  protected:
    EntryTest();
    ~EntryTest() override;

    static Reply Serve(const Call& call);

    // Drives an entry by hand in a process that was given this call; failures in
    // there are failures of the test. Answers what the process wrote.
    static std::string Inside(const Call& call, const std::function<void(ProbeEntry&)>& steps);

    // The traces of callbacks, once there are `lines` of them (or time is up).
    std::string WaitForTrace(size_t lines) const;
    const std::string& TracePath() const {
        return trace_;
    }
    Call Traced(const Call& call) const;

  private:
    std::string folder_;
    std::string trace_;
};

#endif
