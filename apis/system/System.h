#ifndef APIS_SYSTEM_SYSTEM_H
#define APIS_SYSTEM_SYSTEM_H

namespace TALO {
class APIRequest;
class APIResponse;
}  // namespace TALO

// Codes of TALO.System.
enum SystemError { kBadParameter = 400 };

// Answers whether the way from the client to an API library works: the optional
// "text" (string) and "count" (integer) come back as they were understood.
void Ping(TALO::APIRequest* request, TALO::APIResponse* response);

// Host name, kernel, uptime in seconds, load averages, memory in bytes.
void Info(TALO::APIRequest* request, TALO::APIResponse* response);

#endif
