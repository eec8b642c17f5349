#ifndef TESTS_CONTRACT_SESSIONWORLD_H
#define TESTS_CONTRACT_SESSIONWORLD_H

#include <gtest/gtest.h>

#include <memory>
#include <string>

// Who logs in, and what the session then says.
struct Login {
    std::string user = "normal";
    bool administrator = false;
    bool exempt = false;  // not bound to the address
    std::string language;
    std::string application;
    std::string privilege;
    int timeout = 0;  // minutes, 0 for the appliance's default
};

// An appliance that people log in to, at first without sessions and accounts.
// Each side builds its own. Everything goes with it again.
class SessionWorld {
  public:
    virtual ~SessionWorld() {}

    // Makes the account where it is missing, and answers the session's id.
    virtual std::string LogIn(const Login& login) = 0;

    // What happens to a session, or to whom it belongs.
    virtual void TimeOut(const std::string& id) = 0;
    virtual void LogOut(const std::string& id) = 0;
    virtual void RemoveAccount(const std::string& id) = 0;

    // From where the request that asks about the session comes.
    virtual void AskFromAnotherAddress(const std::string& id) = 0;
    virtual void AskFromAnotherSite(const std::string& id) = 0;
    virtual void ComeFrom(const std::string& address) = 0;

    // A privilege, of a user who is logged in.
    virtual void Grant(const std::string& user, const std::string& privilege) = 0;

    virtual int UidOf(const std::string& user) = 0;
    virtual std::string FileOf(const std::string& id) = 0;
};

// Of this executable's side.
std::unique_ptr<SessionWorld> MakeSessionWorld();

#endif
