#ifndef TESTS_HOST_RELAY_RELAYFIXTURE_H
#define TESTS_HOST_RELAY_RELAYFIXTURE_H

#include <gtest/gtest.h>
#include <json/json.h>

#include <memory>
#include <string>

#include "hosts/linux/sdk/Nodes.h"
#include "platform/Cgi.h"
#include "platform/CredRequest.h"
#include "tests/host/relay/Target.h"

// Numbers of what went wrong, as CredRequestMgr::GetError tells them.
constexpr int Number(talo::RelayError error) {
    return static_cast<int>(error);
}

// An appliance that knows another one, number 2, by which it is known as number 1.
// A session of the user "anna", who reads German, was accepted.
class RelayTest : public ::testing::Test {
  protected:
    RelayTest();
    ~RelayTest() override;

    // Without sessions elsewhere, appliances, configuration and CGI variables.
    static void Clear();
    static void Configure(const std::string& lines);

    // Enters an appliance under a number; by default as `target` wants to be called.
    talo::Node NodeOf(const Target& called, long long id = 2) const;
    static void Enter(const talo::Node& node);

    void LogIn(const std::string& user, const std::string& language);
    void LogOut();

    // One plain call, with a limit so that no test hangs.
    struct Outcome {
        int error;
        std::string answer;
    };
    static Outcome Call(const Json::Value& params = Json::Value(Json::objectValue),
                        long long id = 2, long seconds = 60);

    // One upload of what is in the stream.
    static Outcome Upload(FILE* in, const Json::Value& size, FILE* out = nullptr,
                          long seconds = 60);
    static Outcome Upload(const std::string& body);

    Certificates certificates;
    Target target;
    TALOCGI context;
};

// What went to the system log of this process since the test began.
bool WasLogged(const std::string& part);

// A stream that holds a text.
class Stream {
  public:
    explicit Stream(const std::string& text);
    ~Stream();
    Stream(const Stream&) = delete;
    Stream& operator=(const Stream&) = delete;
    FILE* Get() const {
        return file_;
    }
    std::string Rest() const;

  private:
    FILE* file_;
};

#endif
