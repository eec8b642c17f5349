#ifndef TALO_PLATFORM_CREDREQUEST_H
#define TALO_PLATFORM_CREDREQUEST_H

#include <json/json.h>

#include <cstdio>
#include <memory>
#include <string>

#include "platform/Platform.h"

// Calls to other appliances under stored credentials, and the parameter cipher
// that both sides of a token share. Nothing throws.
namespace TALO {

// One queued call; owned by its manager.
class TALO_PLATFORM CredRequest {
  public:
    virtual ~CredRequest();
    // Seconds to wait for the answer; none or a negative number waits without limit.
    virtual void SetResponseTimeout(long seconds) = 0;
};

class TALO_PLATFORM CredRequestMgr {
  public:
    CredRequestMgr();
    ~CredRequestMgr();
    CredRequestMgr(const CredRequestMgr&) = delete;
    CredRequestMgr& operator=(const CredRequestMgr&) = delete;

    // Queues a plain call of the appliance `target`. An index, or negative.
    int AddWebAPIRequest(long long target, const std::string& api, int version,
                         const std::string& method, const Json::Value& params);

    // Queues a call whose body is streamed from `in` with the given headers; the
    // answer goes to `out`, or is kept when that is null. An index, or negative.
    int AddRelayRequest(long long target, const std::string& api, int version,
                        const std::string& method, const Json::Value& headers, FILE* in, FILE* out);

    // The queued call, null for an index that is none.
    CredRequest* GetRequest(int index);

    // Performs the queued calls. False on failure, GetError tells which.
    bool Run();
    std::string GetResponse(int index) const;
    int GetError() const;

  private:
    struct State;
    std::unique_ptr<State> state;
};

class TALO_PLATFORM CredRequestUtil {
  public:
    // Deciphers a text with the key that TALONdtokenGenerateToken derived. False
    // when the text was not made with that key, was altered or cut, when the key
    // is none, or the cipher cannot be had. `out` is then untouched.
    static bool GetDecryptAESString(const std::string& key, const std::string& text,
                                    std::string& out);
};

}  // namespace TALO

#endif
