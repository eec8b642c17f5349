#ifndef WEBAPI_APIPOLLING_H
#define WEBAPI_APIPOLLING_H

#include <json/json.h>

#include <string>

#include "webapi/APIExport.h"

namespace TALO {

class APIPollingPrivate;
class APIRequest;
class APIResponse;

/// Background tasks: work that outlasts its request. Start answers the client at
/// once with the task's id, and a detached child goes on; later requests ask for
/// its status, stop it, or list tasks. A method makes one on its stack; it keeps
/// the request, which must outlive it.
///
///     void Index(APIRequest* request, APIResponse* response, void* folder);
///
///     void StartIndex(APIRequest* request, APIResponse* response) {
///         APIPolling polling(request);
///         polling.SetPrefixAttr("index-");
///         static Folder folder = FolderOf(request);
///         polling.Start(response, Index, &folder);
///     }
///
/// A task belongs to a task user: the login user, "@administrators" when it is
/// shared with the administrators, "@users" when it is shared with everyone. Its
/// full id, which clients see, is task user, "/" and task id.
///
/// A failing operation answers false, logs why, and leaves a polling error code
/// (a scale of its own, not the response's):
///
/// | code | meaning |
/// |---|---|
/// | 500 | none recorded |
/// | 501 | the task could not be marked finished |
/// | 502 | bad parameters, no request, bad share group; Stop: malformed full task id |
/// | 503 | invalid or foreign task id; List: unknown group |
/// | 504 | the task, or the task manager, could not be had |
/// | 505 | not permitted: the administrators' group, asked by somebody else |
/// | 506 | the task's process could not be sent SIGTERM |
/// | 508 | no such task |
class WEBAPI_EXPORT APIPolling {
  public:
    /// What runs in the background. It reports through the response, as a method
    /// does: the first report lets the waiting client go, the last one stays. It
    /// gets SIGTERM when the task is stopped.
    typedef void (*Work)(APIRequest* request, APIResponse* response, void* argument);

    explicit APIPolling(APIRequest* request);
    APIPolling();
    ~APIPolling();
    APIPolling(const APIPolling&) = delete;
    APIPolling& operator=(const APIPolling&) = delete;

    /// Sets the request of one that was made without.
    void SetRequest(APIRequest* request);

    /// What the task's id begins with: letters, digits, "_", "-" and ".", at most
    /// 64. List selects by it.
    bool SetPrefixAttr(const std::string& prefix);

    /// Whether the task manager may drop the finished record early. True by default.
    bool SetRemoveAttr(bool remove);

    /// Who shares the task: "" nobody, "admin" the administrators, "everyone" all
    /// users. False with 502 for another name, with 505 for "admin" by a caller
    /// who is no administrator.
    bool SetGroupAttr(const std::string& group);

    /// Starts the work in a detached child and sets the response's success with
    /// "task_id", as soon as the work has reported its first result or 60 seconds
    /// have passed. The request's parameters are kept in the task's record, but
    /// for "_sid", "passwd" and those that the API's description lists under
    /// "secret". The response has to be the one of this object's request: the
    /// work's reports go into the record of the response's own request.
    ///
    /// False with 502 when the request, the response or the work is null; false
    /// with an error on the response: 105 not permitted to share with the
    /// administrators, 114 bad share group, 117 no task could be had (bad prefix,
    /// or nobody is logged in), 110 no process could be made. False with neither
    /// when the record could not be stored.
    ///
    /// The child never returns into the caller: it ends when the work returns or
    /// throws, without output and without running any of the request's clean-up.
    /// Files of an upload go with the parent: move them first.
    bool Start(APIResponse* response, Work work, void* argument);

    /// The state of a task: "finish", "auto_remove", "info" (api, version, method,
    /// param, group, prefix) and, once there is one, its result ("success" with
    /// "data" or "error"). `out` is replaced. False with 502 for an empty id, 503,
    /// 504 or 508.
    bool Status(const std::string& fullTaskId, Json::Value& out);
    bool Status(const char* fullTaskId, Json::Value& out);

    /// The states of several: an object with a member per full task id. A task
    /// that is not there has an empty one; an id that is malformed or not the
    /// caller's to see has none. False with 502 when the ids are no array.
    bool Status(const Json::Value& fullTaskIds, Json::Value& out);

    /// How far a task has come, as its APITaskProgress has told: "percent" (null
    /// until told), "text", "log" (the last lines), "log_first" (the number of
    /// lines before them) and "time" (of the last writing, null when there was
    /// none); and "finish". `out` is replaced. The same checks and codes as Status.
    bool Progress(const std::string& fullTaskId, Json::Value& out);

    /// Sends SIGTERM to the task's process and marks the task finished; with
    /// `remove` its record may go early. A process that has gone is no failure.
    /// False with 501, 502, 503, 504, 506 or 508.
    bool Stop(const std::string& fullTaskId, bool remove);

    /// For each of the groups "user", "admin" and "everyone" a member of `out`
    /// with an array of full task ids, null when there are none; an empty prefix
    /// selects all. False with 502, 503 (unknown group), 504 or 505; what came
    /// before the failing group stays in `out`.
    bool List(const std::string& prefix, const Json::Value& groups, Json::Value& out);

    /// The polling error code.
    void SetError(int code);
    int GetError() const;

  private:
    APIPollingPrivate* d;
};

}  // namespace TALO

#endif
