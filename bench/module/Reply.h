#ifndef BENCH_MODULE_REPLY_H
#define BENCH_MODULE_REPLY_H

namespace TALO {
class APIRequest;
class APIResponse;
}  // namespace TALO

// Answers "count" rows, each of which takes 1,000 bytes of the reply.
void Rows(TALO::APIRequest* request, TALO::APIResponse* response);

#endif
