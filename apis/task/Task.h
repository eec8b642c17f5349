#ifndef APIS_TASK_TASK_H
#define APIS_TASK_TASK_H

namespace TALO {
class APIRequest;
class APIResponse;
}  // namespace TALO

// Codes of TALO.Task: the polling error codes as they are.
enum TaskError {
    kUnknownFailure = 500,
    kNotFinished = 501,
    kBadParameter = 502,  // "errors" names the parameter, if it is one
    kInvalidTask = 503,   // malformed, or another user's
    kNoTaskManager = 504,
    kNotPermitted = 505,
    kNotSignalled = 506,
    kNoSuchTask = 508,
};

// The state and the result of one task, "task_id", or of several, an array.
void Status(TALO::APIRequest* request, TALO::APIResponse* response);

// How far the task "task_id" has come, with the lines of its log from "offset" on.
void Progress(TALO::APIRequest* request, TALO::APIResponse* response);

// Ends the task "task_id"; with "remove" its record may go early.
void Stop(TALO::APIRequest* request, TALO::APIResponse* response);

// The ids of the tasks of the "groups" whose ids begin with "prefix".
void List(TALO::APIRequest* request, TALO::APIResponse* response);

#endif
