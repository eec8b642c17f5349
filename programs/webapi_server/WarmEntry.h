#ifndef TALO_PROGRAMS_WEBAPI_SERVER_WARMENTRY_H
#define TALO_PROGRAMS_WEBAPI_SERVER_WARMENTRY_H

#include "programs/webapi_server/Slot.h"
#include "webapi/WebEntry.h"

// The entry of one request in a worker. It answers as any entry does, and tells
// meanwhile in the worker's slot what is called and how long that may take.
class WarmEntry : public TALO::WebEntry {
  public:
    // `deadlineSeconds` is for an API whose description has no "deadline".
    WarmEntry(Slot* slot, int deadlineSeconds);

    int Initialize(const Json::Value& args) override;
    bool NeedPermission(TALO::APIRequest* request) override;

    // After Run: whether every library that the request has opened is of APIs that
    // leave nothing behind in their process, by their descriptions.
    bool LeavesNothingBehind() const;

  private:
    bool IsOfWorkers(const std::string& library) const;
    void Announce(TALO::APIRequest* request, bool transfers);
    void Allow(int seconds);

    Slot* slot_;
    int deadlineSeconds_;
};

#endif
