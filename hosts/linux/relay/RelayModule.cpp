#include "hosts/linux/relay/RelayModule.h"

#include <curl/curl.h>
#include <signal.h>
#include <time.h>

#include <algorithm>
#include <exception>
#include <memory>
#include <vector>

#include "hosts/linux/relay/Transfer.h"
#include "hosts/linux/sdk/Nodes.h"
#include "platform/Platform.h"

namespace {

using host::Transfer;

constexpr size_t kMostAtOnce = 8;
constexpr int kPollMilliseconds = 1000;

// A connection that the other side closed must not end the process, whatever it
// has settled for the signal.
class WithoutPipeSignal {
  public:
    WithoutPipeSignal() : pipe_(), before_(), pending_(IsPending()) {
        (void)sigemptyset(&pipe_);
        (void)sigaddset(&pipe_, SIGPIPE);
        (void)pthread_sigmask(SIG_BLOCK, &pipe_, &before_);
    }
    ~WithoutPipeSignal() {
        const struct timespec now = {0, 0};
        if (!pending_ && IsPending()) {
            (void)sigtimedwait(&pipe_, nullptr, &now);
        }
        (void)pthread_sigmask(SIG_SETMASK, &before_, nullptr);
    }
    WithoutPipeSignal(const WithoutPipeSignal&) = delete;
    WithoutPipeSignal& operator=(const WithoutPipeSignal&) = delete;

  private:
    static bool IsPending() {
        sigset_t pending;
        (void)sigemptyset(&pending);
        return sigpending(&pending) == 0 && sigismember(&pending, SIGPIPE) == 1;
    }

    sigset_t pipe_;
    sigset_t before_;
    const bool pending_;
};

bool IsLibraryReady() {
    static const bool ready = curl_global_init(CURL_GLOBAL_DEFAULT) == CURLE_OK;
    return ready;
}

// The calls of one perform. Their connections live as long as it does.
class Exchange {
  public:
    Exchange(TaloRelayCall* const* calls, size_t count)
        : others_(curl_multi_init()), waiting_(calls, calls + count) {
        std::reverse(waiting_.begin(), waiting_.end());
        running_.reserve(kMostAtOnce);
    }
    ~Exchange() {
        // What is left was given up: no memory.
        running_.clear();
        (void)curl_multi_cleanup(others_);
    }
    Exchange(const Exchange&) = delete;
    Exchange& operator=(const Exchange&) = delete;

    bool IsUsable() const {
        return others_ != nullptr;
    }

    void Run() {
        Fill();
        while (!running_.empty()) {
            int number = 0;
            if (curl_multi_perform(others_, &number) != CURLM_OK) {
                GiveUp();
                return;
            }
            if (!Collect()) {
                Wait();
            }
            Fill();
        }
    }

  private:
    typedef std::unique_ptr<Transfer> Running;

    void Fill() {
        while (running_.size() < kMostAtOnce && !waiting_.empty()) {
            running_.push_back(std::make_unique<Transfer>(waiting_.back()));
            waiting_.pop_back();
            if (!running_.back()->Begin(others_)) {
                Finish(running_.back().get(), CURLE_FAILED_INIT);
            }
        }
    }

    // Whether something ended.
    bool Collect() {
        bool ended = false;
        int left = 0;
        while (const CURLMsg* message = curl_multi_info_read(others_, &left)) {
            Transfer* transfer = nullptr;
            (void)curl_easy_getinfo(message->easy_handle, CURLINFO_PRIVATE, &transfer);
            Finish(transfer, message->data.result);
            ended = true;
        }
        for (size_t at = running_.size(); at-- > 0;) {
            if (running_[at]->IsAnsweredEarly()) {
                Finish(running_[at].get(), CURLE_OK);
                ended = true;
            }
        }
        return ended;
    }

    void Finish(Transfer* transfer, CURLcode result) {
        while (transfer->End(others_, result)) {
            if (transfer->Begin(others_)) {
                return;
            }
        }
        running_.erase(
            std::find_if(running_.begin(), running_.end(),
                         [transfer](const Running& running) { return running.get() == transfer; }));
    }

    void GiveUp() {
        while (!running_.empty()) {
            (void)running_.back()->End(others_, CURLE_OUT_OF_MEMORY);
            running_.pop_back();
        }
    }

    // Until a connection has something to do, or a body goes on.
    void Wait() {
        struct curl_waitfd bodies[kMostAtOnce];
        Transfer* owners[kMostAtOnce];
        unsigned count = 0;
        for (const Running& running : running_) {
            if (running->WaitsFor() >= 0) {
                owners[count] = running.get();
                bodies[count++] = {running->WaitsFor(), CURL_WAIT_POLLIN, 0};
            }
        }
        (void)curl_multi_poll(others_, bodies, count, kPollMilliseconds, nullptr);
        for (unsigned at = 0; at < count; ++at) {
            if (bodies[at].revents != 0) {
                owners[at]->GoOn();
            }
        }
    }

    CURLM* const others_;
    std::vector<TaloRelayCall*> waiting_;  // the next one last
    std::vector<Running> running_;
};

void Perform(TaloRelayCall* const* calls, size_t count) {
    for (size_t at = 0; at < count; ++at) {
        calls[at]->error = static_cast<int>(talo::RelayError::kUnavailable);
    }
    try {
        const WithoutPipeSignal quiet;
        if (!IsLibraryReady()) {
            return;
        }
        Exchange exchange(calls, count);
        if (exchange.IsUsable()) {
            exchange.Run();
        }
    } catch (const std::exception&) {
        // The calls that are not over say so.
    }
}

}  // namespace

extern "C" {
extern TALO_PLATFORM const TaloRelayModule taloRelayModule;
const TaloRelayModule taloRelayModule = {Perform};
}
