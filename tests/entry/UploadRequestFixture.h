#ifndef TESTS_ENTRY_UPLOADREQUESTFIXTURE_H
#define TESTS_ENTRY_UPLOADREQUESTFIXTURE_H

#include <cstdint>
#include <string>

#include "tests/entry/EntryTest.h"

// The entry on an appliance whose data volume takes every upload. What the body
// holds is scripted; its bytes only show whether anybody has read them.
class UploadRequestTest : public EntryTest {
  protected:
    UploadRequestTest() {
        fake::Now().volume = "/volume1";
        fake::Now().volumeFree = UINT64_MAX;
    }

    static fake::UploadScript& Script() {
        return fake::Now().upload;
    }

    static Call Upload(const std::string& query) {
        return Post("--x--\r\n")
            .With("CONTENT_TYPE", "multipart/form-data; boundary=x")
            .With("QUERY_STRING", query);
    }

    static Call UploadTo(const std::string& method) {
        return Upload("api=Test.Entry&version=1&method=" + method);
    }

    // Lets the body begin with the fields that name a method of the API, and go on
    // for `rest` bytes.
    static void NameInBody(const std::string& method, unsigned long long rest = 40) {
        Script().firstFields = {{"api", "Test.Entry"}, {"version", "1"}, {"method", method}};
        Script().counters = {60 + rest, 60};
    }

    // How often an operation was used by this process.
    static int Uses(const std::string& operation) {
        const auto found = fake::Now().calls.find(operation);
        return found == fake::Now().calls.end() ? 0 : found->second;
    }
};

#endif
