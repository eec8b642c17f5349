#ifndef TALO_HOSTS_LINUX_RELAY_TRANSFER_H
#define TALO_HOSTS_LINUX_RELAY_TRANSFER_H

#include <curl/curl.h>

#include <chrono>
#include <memory>
#include <optional>

#include "hosts/linux/relay/BodySource.h"
#include "hosts/linux/relay/ChunkedText.h"
#include "hosts/linux/relay/RelayModule.h"
#include "hosts/linux/sdk/Nodes.h"

namespace host {

// One call on its way, and its repetitions. Lives in the module: nothing throws.
class Transfer {
  public:
    explicit Transfer(TaloRelayCall* call);
    ~Transfer();
    Transfer(const Transfer&) = delete;
    Transfer& operator=(const Transfer&) = delete;

    // Sends the call on its way with the others. False, and it is over, when it
    // cannot be.
    bool Begin(CURLM* others);

    // Takes it back and says what came of it. True when it is to be made again.
    bool End(CURLM* others, CURLcode result);

    // The answer was whole before the body was: what is left of it changes nothing.
    bool IsAnsweredEarly() const;

    // The descriptor that the body waits for, or -1; and that it has something now.
    int WaitsFor() const;
    void GoOn();

    CURL* Handle() const {
        return easy_.get();
    }

  private:
    typedef std::chrono::steady_clock Clock;
    template <typename Type, void (*Free)(Type*)>
    struct Freed {
        void operator()(Type* object) const {
            Free(object);
        }
    };

    static CURLcode OnReached(CURL* easy, void* tls, void* self);
    static int OnRequest(void* self, char* to, char* from, int toPort, int fromPort);
    static size_t OnBody(char* bytes, size_t one, size_t size, void* self);
    static size_t OnHeader(char* bytes, size_t one, size_t size, void* self);
    static size_t OnRead(char* to, size_t one, size_t size, void* self);

    void Reset();
    bool AddHeaders();
    bool SetLimits();
    bool SetUp();
    void ReadHeader(const char* line, size_t size);
    void ReadRequestError(const char* value, const char* end);
    bool TakeChunks(const char* bytes, size_t size);
    bool Take(const char* bytes, size_t size);
    bool IsAnswerWhole() const;
    long long LengthOfAnswer() const;
    long Status() const;
    bool WasReached() const;
    talo::RelayError ErrorOf(CURLcode result) const;

    TaloRelayCall* const call_;
    const Clock::time_point start_;
    std::unique_ptr<CURL, Freed<CURL, curl_easy_cleanup>> easy_;
    std::unique_ptr<curl_slist, Freed<curl_slist, curl_slist_free_all>> headers_;
    std::optional<BodySource> body_;
    std::optional<ChunkedText> chunks_;  // of the answer to a body
    bool added_ = false;
    bool requested_ = false;
    bool reached_ = false;      // over a new connection
    bool waits_ = false;        // for more of the body
    bool headersDone_ = false;  // of the answer
    bool bodyCut_ = false;
    bool tooLong_ = false;
    bool notTaken_ = false;
    long long headerBytes_ = 0;
    long long received_ = 0;
};

}  // namespace host

#endif
