#include "programs/webapi_server/WarmEntry.h"

#include <algorithm>
#include <cstring>

#include "programs/webapi_server/Clock.h"
#include "webapi/APIRequest.h"

WarmEntry::WarmEntry(Slot* slot, int deadlineSeconds)
    : slot_(slot), deadlineSeconds_(deadlineSeconds) {}

// What another appliance answers may be as long as a download.
int WarmEntry::Initialize(const Json::Value& args) {
    const int result = WebEntry::Initialize(args);
    Announce(request, request->IsUploadRequest() || request->HasParam("relay_nd"));
    return result;
}

// The first hook behind the description, for each element of a compound request,
// too.
bool WarmEntry::NeedPermission(TALO::APIRequest* request) {
    Announce(request, request->IsUploadRequest() || GetMethodAttr(request, "allowDownload"));
    const Json::Value deadline = request->GetAPIInfo("deadline", Json::Value());
    const bool given = deadline.isInt() && deadline.asInt() >= 0;
    Allow(given ? deadline.asInt() : deadlineSeconds_);
    return WebEntry::NeedPermission(request);
}

// The name is the client's, and the master logs it.
void WarmEntry::Announce(TALO::APIRequest* request, bool transfers) {
    const std::string api = request->GetAPIClass();
    const size_t size = std::min(api.size(), sizeof slot_->api - 1);
    std::memset(slot_->api, 0, sizeof slot_->api);
    std::transform(api.begin(), api.begin() + static_cast<std::ptrdiff_t>(size), slot_->api,
                   [](char byte) { return byte > 0x20 && byte < 0x7f ? byte : '?'; });
    slot_->transfers = transfers ? 1 : 0;
}

// Each call gets its own time, however long those before it in the same request
// took.
void WarmEntry::Allow(int seconds) {
    slot_->allowedMs = seconds > 0 ? MillisecondsNow() - slot_->began + seconds * 1000LL : 0;
}

bool WarmEntry::LeavesNothingBehind() const {
    return std::all_of(libHandles.begin(), libHandles.end(),
                       [this](const auto& library) { return IsOfWorkers(library.first); });
}

// One API that says nothing speaks for its library.
bool WarmEntry::IsOfWorkers(const std::string& library) const {
    bool described = false;
    for (const Json::Value& description : libDesc) {
        if (!description.isObject() || description["lib"] != Json::Value(library)) {
            continue;
        }
        if (description["isolation"] != Json::Value("worker")) {
            return false;
        }
        described = true;
    }
    return described;
}
