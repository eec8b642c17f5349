#ifndef TESTS_HOST_RELAY_TARGET_H
#define TESTS_HOST_RELAY_TARGET_H

#include <json/json.h>
#include <sys/types.h>

#include <string>
#include <vector>

#include "tests/support/TempFolder.h"

// Authorities and certificates of short life, made by the openssl program.
class Certificates {
  public:
    Certificates();

    std::string Authority() const {
        return folder_.Path("ca.pem");
    }
    std::string OtherAuthority() const;  // which has signed nothing here

    // A certificate of the authority for the loopback address, or for other names,
    // such as "DNS:nas9.example".
    std::string Make(const std::string& name, const std::string& names = "IP:127.0.0.1") const;
    std::string KeyOf(const std::string& certificate) const;

    // "sha256//..." of the certificate's public key.
    std::string PinOf(const std::string& certificate) const;

  private:
    support::TempFolder folder_;
};

// An appliance that is called: a process of its own that does what its plan says
// (target.py) and notes what came.
class Target {
  public:
    Target(const Certificates& certificates, const std::string& names = "IP:127.0.0.1");
    ~Target();
    Target(const Target&) = delete;
    Target& operator=(const Target&) = delete;

    std::string Url() const;
    const std::string& Certificate() const {
        return certificate_;
    }

    // What it does from now on, as JSON.
    void Plan(const std::string& plan);

    // What came so far: all of it, or the calls of one API.
    std::vector<Json::Value> Requests() const;
    std::vector<Json::Value> Requests(const std::string& api) const;

    // No longer there.
    void Stop();

  private:
    support::TempFolder folder_;
    std::string certificate_;
    pid_t process_ = -1;
    int port_ = 0;
};

// A header of such a request; "none" without it.
std::string HeaderOf(const Json::Value& request, const std::string& name);

#endif
