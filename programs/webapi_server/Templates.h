#ifndef TALO_PROGRAMS_WEBAPI_SERVER_TEMPLATES_H
#define TALO_PROGRAMS_WEBAPI_SERVER_TEMPLATES_H

#include <sys/types.h>

#include <array>
#include <vector>

#include "programs/webapi_server/Listen.h"
#include "programs/webapi_server/Message.h"
#include "programs/webapi_server/Poller.h"
#include "programs/webapi_server/Template.h"

// What the templates tell.
class TemplateEvents {
  public:
    virtual ~TemplateEvents() = default;
    virtual void OnReady(int generation) = 0;
    virtual void OnStarted(const TemplateReport& report, int process) = 0;
    virtual void OnFailed(const TemplateReport& report) = 0;
    virtual void OnEnded(const TemplateReport& report) = 0;

    // Orders of this generation that it did not carry out will not be any more.
    virtual void OnLost(int generation) = 0;
};

// What a template gets of the master.
struct Inherited {
    const Listener& listener;
    SlotTable& slots;
    const Settings& settings;
    const OriginalProcess& original;
};

// The master's side of the templates: the one that workers come from, the one that
// is being prepared to take its place, and those that finish their orders. A reload
// goes on while requests are served; a template that cannot be made leaves the one
// before at work, and is tried again after a while, without its libraries loaded.
class Templates {
  public:
    Templates(const Poller& poller, const Inherited& inherited, TemplateEvents& events);
    ~Templates();
    Templates(const Templates&) = delete;
    Templates& operator=(const Templates&) = delete;

    // Makes a new one as soon as possible.
    void Reload(const char* reason, long long now);

    // Of the one that workers come from; 0 when there is none.
    int Generation() const;

    // Orders a worker. The descriptor is its end of the control socket.
    bool Order(const StartOrder& order, int workerControl);

    void OnMessage(const Event& event, long long now);
    void Tick(long long now);

    // A child of this process has ended, and was waited for.
    void OnChildEnded(pid_t pid);

    // Ends all of them, and waits until they are gone.
    void EndAll();

  private:
    enum class State { kNone, kPreparing, kCurrent, kRetiring };
    struct Handle {
        State state = State::kNone;
        pid_t pid = 0;
        int control = -1;
        int generation = 0;
        int pending = 0;             // orders
        long long pendingSince = 0;  // one was carried out, or the first came
        long long since = 0;
        unsigned serial = 0;
        bool loadsLibraries = true;
    };

    Handle* Find(State state);
    void Launch(long long now);
    void OnReport(Handle& handle, const TemplateReport& report, int descriptor, long long now);
    void BecomeCurrent(Handle& handle, long long now);
    void Retire(Handle& handle);
    void End(Handle& handle, long long now);
    void Drop(Handle& handle);
    bool HaveLeft();

    const Poller& poller_;
    const Inherited inherited_;
    TemplateEvents& events_;
    std::array<Handle, 8> all_;
    std::vector<pid_t> leaving_;  // dropped, but not gone yet
    int generation_ = 0;
    unsigned serial_ = 0;
    bool isWanted_ = false;  // a new one
    long long notBefore_ = 0;
    int failures_ = 0;  // in a row
    bool libraryFailed_ = false;
};

#endif
