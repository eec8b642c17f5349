#ifndef TESTS_POLLING_POLLINGFIXTURE_H
#define TESTS_POLLING_POLLINGFIXTURE_H

#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "src/polling/APIPollingPrivate.h"
#include "tests/fake/FakePlatform.h"
#include "tests/fake/FakeTask.h"
#include "tests/support/Json.h"
#include "tests/support/LogCapture.h"
#include "webapi/APIPolling.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

namespace polling {

using support::Parse;

// The private half of a polling object.
TALO::APIPollingPrivate* PrivateOf(const TALO::APIPolling& polling);

// An empty task manager, and the call of a user "ann" who is no administrator:
// Acme.Index, version 2, method "start", with a folder and a depth.
class Fixture : public ::testing::Test {
  protected:
    Fixture();
    // Waits for the children that were started.
    ~Fixture() override;

    // The caller is somebody else.
    void LogIn(const std::string& user, bool isAdmin);

    // Starts work of the task's own. It runs in a child: what it is to tell goes
    // into the record.
    typedef std::function<void(TALO::APIRequest*, TALO::APIResponse*)> Work;
    bool Start(const Work& work);

    // Starts work that succeeds with {"n": 1} at once, waits for its end, and
    // answers the full task id, "" when it did not start.
    std::string RunTask();

    // Waits until all children have ended; answers their wait statuses.
    std::vector<int> AwaitChildren();

    // The record of a full task id.
    static Json::Value Record(const std::string& fullTaskId);
    // What its child has reported with SetSuccess.
    static Json::Value Reported(const std::string& fullTaskId);

    // The full task id that the response tells.
    std::string StartedId() const;

    // The lines that were logged, without their places.
    std::vector<std::string> Messages() const;
    bool Logged(const std::string& message) const {
        return log.Has("APIPolling.cpp", message);
    }

    // The operations of this process, or of its children, without the details.
    static std::vector<std::string> Operations(bool ofChildren);
    // The detail of the last call of an operation, "never called" without one.
    static std::string LastDetail(const std::string& operation);

    support::LogCapture log;
    TALO::APIRequest request;
    TALO::APIResponse response;
    TALO::APIPolling polling;
};

}  // namespace polling

#endif
