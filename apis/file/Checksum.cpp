#include "Checksum.h"

#include <unistd.h>

#include <algorithm>
#include <chrono>

#include "File.h"
#include "Parameters.h"
#include "StopSignal.h"
#include "Target.h"
#include "webapi/APIPolling.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APITaskProgress.h"

using TALO::APIRequest;
using TALO::APIResponse;

namespace {

constexpr int kNotPermitted = 105;  // the framework's own code
constexpr int kPollingNotPermitted = 505;
constexpr size_t kMaxPrefixBytes = 64;
const char kDefaultPrefix[] = "checksum-";

struct Job {
    Target target;
    talo::FileFacts facts;
};

// Bytes per second since it was made.
class Rate {
  public:
    double Seconds() const {
        return std::chrono::duration<double>(std::chrono::steady_clock::now() - began_).count();
    }
    Json::UInt64 Of(unsigned long long bytes) const {
        return static_cast<Json::UInt64>(static_cast<double>(bytes) / std::max(Seconds(), 1e-3));
    }

  private:
    std::chrono::steady_clock::time_point began_ = std::chrono::steady_clock::now();
};

Json::Value DataOf(const char* state, const Job& job, const Sums& sums, const Rate& rate) {
    Json::Value data(Json::objectValue);
    data["state"] = state;
    data["path"] = job.target.path;
    data["files"] = static_cast<Json::UInt64>(sums.files);
    data["bytes"] = static_cast<Json::UInt64>(sums.bytes);
    data["rate"] = rate.Of(sums.bytes);
    return data;
}

// Names that JSON cannot carry count in the folder's sum, and are not listed.
bool IsPresentable(const std::string& path) {
    talo::VirtualPath ignored;
    return talo::ParseVirtualPath("/" + path, &ignored);
}

Json::Value ResultOf(const Job& job, const Sums& sums, const Rate& rate) {
    Json::Value data = DataOf("done", job, sums, rate);
    data["sha256"] = sums.sha256;
    if (job.facts.type == talo::FileType::kFolder) {
        Json::Value& list = data["checksums"] = Json::Value(Json::arrayValue);
        for (const FileSum& sum : sums.listed) {
            if (IsPresentable(sum.path)) {
                Json::Value& item = list.append(Json::Value(Json::objectValue));
                item["path"] = sum.path;
                item["sha256"] = sum.sha256;
                item["size"] = static_cast<Json::UInt64>(sum.size);
            }
        }
    }
    return data;
}

void TellProgress(unsigned long long done, unsigned long long total, const Rate& rate,
                  TALO::APITaskProgress* progress) {
    if (total > 0) {
        progress->SetPercent(100.0 * static_cast<double>(done) / static_cast<double>(total));
    }
    progress->SetText(std::to_string(done) + " of " + std::to_string(total) + " bytes, " +
                      std::to_string(rate.Of(done)) + " bytes/s");
}

// In the background. The first report lets the waiting client go.
void Compute(APIRequest* request, APIResponse* response, void* argument) {
    const Job& job = *static_cast<const Job*>(argument);
    NoticeStop();
    Sums sums;
    const Rate rate;
    response->SetSuccess(DataOf("running", job, sums, rate));
    TALO::APITaskProgress progress(request);
    unsigned long long total = 0;
    talo::FileError result = CountBytes(
        job.target.place, job.facts, [] { return !IsStopAsked(); }, &total);
    if (result == talo::FileError::kNone) {
        const auto tell = [&](unsigned long long bytes) {
            TellProgress(bytes, total, rate, &progress);
            return !IsStopAsked();
        };
        result = ComputeSums(job.target.place, job.facts, tell, &sums);
    }
    if (result == talo::FileError::kStopped) {
        response->SetError(kStopped, DataOf("stopped", job, sums, rate));
    } else if (!AnswerError(response, result, job.target.path)) {
        progress.SetPercent(100);
        response->SetSuccess(ResultOf(job, sums, rate));
    }
}

bool IsPrefix(const std::string& text) {
    return text.size() <= kMaxPrefixBytes &&
           text.find_first_not_of(
               "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ"
               "0123456789_-.") == std::string::npos;
}

// Whether the caller's wishes about the task can be met; else with an error.
bool Prepare(const APIRequest& request, APIResponse* response, TALO::APIPolling* polling) {
    const auto prefix = request.GetAndCheckString("prefix", APIRequest::OPTIONAL, nullptr);
    const auto group = request.GetAndCheckString("group", APIRequest::OPTIONAL, nullptr);
    bool autoRemove = true;
    if (prefix.IsInvalid() || !IsPrefix(prefix.Get(kDefaultPrefix))) {
        response->SetError(kBadParameter, "prefix");
        return false;
    }
    if (!ReadFlag(request, "auto_remove", &autoRemove)) {
        response->SetError(kBadParameter, "auto_remove");
        return false;
    }
    if (group.IsInvalid() || !polling->SetGroupAttr(group.Get(""))) {
        if (!group.IsInvalid() && polling->GetError() == kPollingNotPermitted) {
            response->SetError(kNotPermitted, Json::Value());
        } else {
            response->SetError(kBadParameter, "group");
        }
        return false;
    }
    (void)polling->SetPrefixAttr(prefix.Get(kDefaultPrefix));
    (void)polling->SetRemoveAttr(autoRemove);
    return true;
}

// Whether there is something to read; else with an error.
bool IsReadable(Job* job, APIResponse* response) {
    if (AnswerError(response, job->target.place.Stat(&job->facts), job->target.path)) {
        return false;
    }
    int opened = -1;
    const talo::FileError result = job->facts.type == talo::FileType::kFolder
                                       ? job->target.place.OpenFolder(&opened)
                                       : job->target.place.OpenFile(&opened);
    if (AnswerError(response, result, job->target.path)) {
        return false;
    }
    (void)close(opened);
    return true;
}

}  // namespace

void StartChecksum(APIRequest* request, APIResponse* response) {
    TALO::APIPolling polling(request);
    Job job;
    if (!Prepare(*request, response, &polling) ||
        !OpenTarget(*request, response, "path", Access::kRead, &job.target) ||
        !IsReadable(&job, response)) {
        return;
    }
    const HeldStop held;
    (void)polling.Start(response, Compute, &job);
}
