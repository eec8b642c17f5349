#ifndef TESTS_HOST_CGI_SESSIONFIXTURE_H
#define TESTS_HOST_CGI_SESSIONFIXTURE_H

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "hosts/linux/sdk/Sessions.h"

// A host without sessions, accounts and configuration, as long as it lives. The
// process has no CGI variables at first.
class Host {
  public:
    Host();
    ~Host();
    Host(const Host&) = delete;
    Host& operator=(const Host&) = delete;

    // A variable of the request's environment.
    void Say(const std::string& name, const std::string& value);
    void SayNothingOf(const std::string& name);

    // The host's configuration, as a whole.
    void Configure(const std::string& lines);

    // An account that no password opens.
    void AddAccount(const std::string& name);
    void AddAdministrator(const std::string& name);
};

// Sessions in memory: the fixed place leads to a folder of the test's own, since
// a disk would be asked to write each one down.
class SessionTest : public ::testing::Test {
  protected:
    SessionTest();
    ~SessionTest() override;

    // Begins a session and answers its id.
    std::string Open(const std::string& user = "normal");
    std::string Open(const talo::Session& session);

    // Where the session of that id is, and what is in the folder.
    std::string PathOf(const std::string& name) const;
    std::vector<std::string> Names() const;

    // Puts a file in the folder, under any name.
    void Write(const std::string& name, const std::string& content) const;
    std::string Read(const std::string& name) const;

    // Makes the last use, and any file's, that many seconds ago.
    void LeaveUnused(const std::string& name, long long seconds) const;

    static bool Exists(const std::string& id);

    Host host;

  private:
    std::string folder_;
};

// An id's form with a session behind none.
std::string UnusedId();

#endif
