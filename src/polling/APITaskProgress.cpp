#include "webapi/APITaskProgress.h"

#include <signal.h>
#include <time.h>

#include <chrono>
#include <cmath>
#include <condition_variable>
#include <deque>
#include <mutex>
#include <system_error>
#include <thread>

#include "platform/Task.h"
#include "src/base/JsonConvert.h"
#include "src/base/Log.h"
#include "webapi/APIRequest.h"

namespace TALO {

namespace {

constexpr char kSource[] = "APITaskProgress.cpp";

typedef std::chrono::steady_clock Clock;
constexpr std::chrono::milliseconds kBetweenWritings(100);
constexpr std::chrono::milliseconds kAfterFailure(1000);

// Cut where a character begins.
std::string Shortened(const std::string& text) {
    size_t size = text.size();
    if (size > static_cast<size_t>(APITaskProgress::kMaxTextBytes)) {
        size = APITaskProgress::kMaxTextBytes;
        while (size > 0 && (static_cast<unsigned char>(text[size]) & 0xC0) == 0x80) {
            --size;
        }
    }
    return text.substr(0, size);
}

// A thread that gets no signals: they are the work function's.
template <typename Body>
std::thread QuietThread(Body body) {
    sigset_t all;
    sigset_t before;
    (void)sigfillset(&all);
    (void)pthread_sigmask(SIG_SETMASK, &all, &before);
    std::thread thread;
    try {
        thread = std::thread(body);
    } catch (const std::system_error&) {
        // Without it the last writing waits for the next one, or for the end.
        LOG_ERROR("progress is written late: no thread could be made");
    }
    (void)pthread_sigmask(SIG_SETMASK, &before, nullptr);
    return thread;
}

}  // namespace

// What is told within a tenth of a second after a writing is held back, and so is
// what could not be written. A thread, made when that first happens, writes it
// when the time has come, so that watchers see the last state also while the work
// is silent.
class APITaskProgressPrivate {
  public:
    explicit APITaskProgressPrivate(const APIRequest& request)
        : task_(ToText(request.GetEnv("task_user", "")).c_str(),
                ToText(request.GetEnv("task_id", "")).c_str()) {}

    ~APITaskProgressPrivate() {
        {
            const std::lock_guard<std::mutex> lock(mutex_);
            ending_ = true;
        }
        changed_.notify_one();
        if (writer_.joinable()) {
            writer_.join();
        }
        if (pending_) {
            Write();
        }
    }

    template <typename Change>
    void Update(Change change) {
        const std::lock_guard<std::mutex> lock(mutex_);
        change();
        pending_ = true;
        if (Clock::now() >= next_) {
            Write();
        }
        if (!pending_) {
            return;
        }
        if (!threadTried_) {
            threadTried_ = true;
            writer_ = QuietThread([this]() { WriteLater(); });
        }
        changed_.notify_one();
    }

    Json::Value percent;
    std::string text;
    std::deque<std::string> log;
    long long logFirst = 0;

  private:
    void Write() {
        Json::Value progress(Json::objectValue);
        progress["percent"] = percent;
        progress["text"] = text;
        progress["log"] = Json::Value(Json::arrayValue);
        for (const std::string& line : log) {
            progress["log"].append(line);
        }
        progress["log_first"] = static_cast<Json::Int64>(logFirst);
        progress["time"] = static_cast<Json::Int64>(time(nullptr));
        task_.beginUpdate();
        (void)task_.setProperty("progress", progress);
        pending_ = !task_.endUpdate();
        next_ = Clock::now() + (pending_ ? kAfterFailure : kBetweenWritings);
    }

    void WriteLater() {
        std::unique_lock<std::mutex> lock(mutex_);
        while (!ending_) {
            if (!pending_) {
                changed_.wait(lock);
            } else if (Clock::now() < next_) {
                (void)changed_.wait_until(lock, next_);
            } else {
                Write();
            }
        }
    }

    ORB::Task task_;
    std::mutex mutex_;
    std::condition_variable changed_;
    std::thread writer_;
    Clock::time_point next_ = Clock::now();
    bool pending_ = false;
    bool ending_ = false;
    bool threadTried_ = false;
};

APITaskProgress::APITaskProgress(APIRequest* request)
    : d(request != nullptr && request->IsPollingTask() ? new APITaskProgressPrivate(*request)
                                                       : nullptr) {}

APITaskProgress::~APITaskProgress() {
    delete d;
}

void APITaskProgress::SetPercent(double percent) {
    if (d != nullptr && !std::isnan(percent)) {
        d->Update([&]() { d->percent = std::fmin(std::fmax(percent, 0.0), 100.0); });
    }
}

void APITaskProgress::SetText(const std::string& text) {
    if (d != nullptr) {
        d->Update([&]() { d->text = Shortened(text); });
    }
}

void APITaskProgress::AddLog(const std::string& line) {
    if (d == nullptr) {
        return;
    }
    d->Update([&]() {
        d->log.push_back(Shortened(line));
        if (d->log.size() > static_cast<size_t>(kMaxLogLines)) {
            d->log.pop_front();
            ++d->logFirst;
        }
    });
}

}  // namespace TALO
