#ifndef TALO_PLATFORM_CREDREQUEST_H
#define TALO_PLATFORM_CREDREQUEST_H

#include <json/json.h>

#include <cstdio>
#include <memory>
#include <string>

#include "platform/Platform.h"

// Calls to other appliances under stored credentials, and the parameter cipher
// that both sides of a token share. Nothing throws.
//
// A call is made for the user of the session that the process accepted last, by
// whatever the two appliances have agreed on; nothing of the client's own goes
// with it but what the calls below are given.
namespace TALO {

// One queued call; owned by its manager and gone with it.
class TALO_PLATFORM CredRequest {
  public:
    virtual ~CredRequest();
    // Seconds to wait for the whole answer. Without it, or with 0 or less, the wait
    // is without limit. The framework gives 1 or more, before Run.
    virtual void SetResponseTimeout(long seconds) = 0;
};

// Calls other appliances for the user whose session TaloCgiIsAuthorizedEx accepted
// last in this process, and in his language: how a target is reached and why it
// lets this appliance act for him are the port's affair. What only this appliance
// is concerned with, the client's cookies and headers, does not go there.
//
// The framework makes one for each request that it relays: it queues one call, may
// limit its time, runs, fetches the answer or the error, and destroys the manager.
class TALO_PLATFORM CredRequestMgr {
  public:
    CredRequestMgr();
    ~CredRequestMgr();
    CredRequestMgr(const CredRequestMgr&) = delete;
    CredRequestMgr& operator=(const CredRequestMgr&) = delete;

    // Queues a plain call of the appliance `target`, any 64-bit number: one that is
    // not known may be refused here or fail later. `params` is an object of every
    // parameter of the request but those of the relay: "api", "version" and
    // "method" may be among them, and then the arguments count, and "_sid", which is
    // not sent: the target has sessions of its own. Values arrive there with their
    // JSON types. An index, 0 or more, or negative; nothing is sent yet.
    int AddWebAPIRequest(long long target, const std::string& api, int version,
                         const std::string& method, const Json::Value& params);

    // Queues a call whose body is read from `in` while Run sends it, and never held
    // whole; the API's identity is in the arguments alone. `headers` has the two
    // members "Content-Type" and "Content-Length", texts as the client sent them or
    // null, which may be refused. The answer goes to `out`, or is kept when that is
    // null. Both files stay the caller's. The results are those of the plain call.
    int AddRelayRequest(long long target, const std::string& api, int version,
                        const std::string& method, const Json::Value& headers, FILE* in, FILE* out);

    // The queued call, null for an index that is none.
    CredRequest* GetRequest(int index);

    // Performs the queued calls and waits for all of them. True when each brought a
    // whole answer, whatever that says: an API's error is an answer too.
    bool Run();

    // The body of the answer, byte for byte, without the target's header; "" for a
    // call that has none, that failed, or whose answer went to a file.
    std::string GetResponse(int index) const;

    // After a Run that failed: the port's number for what was wrong, which the
    // framework only logs. 0 for nothing.
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
