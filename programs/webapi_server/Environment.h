#ifndef TALO_PROGRAMS_WEBAPI_SERVER_ENVIRONMENT_H
#define TALO_PROGRAMS_WEBAPI_SERVER_ENVIRONMENT_H

#include <string>
#include <vector>

// The process's environment while it serves: what the server was started with,
// less whatever looks like a request's, and the variables of one request. The
// vector behind `environ` and its texts are this object's own, so that a long
// life of requests leaves nothing behind. With it goes what a request has set.
class Environment {
  public:
    // Takes what `environ` has now, and leaves it until Enter.
    Environment();

    // `environ` is again what it was before: others still look at it while the
    // process ends.
    ~Environment();
    Environment(const Environment&) = delete;
    Environment& operator=(const Environment&) = delete;

    // Each is "NAME=value"; of a repeated name the last counts. GATEWAY_INTERFACE is
    // there even if it is not among them.
    void Enter(std::vector<std::string> variables);

    // Back to what the server was started with, whatever the request has set.
    void Leave();

  private:
    // What `environ` is to point to; ends with a null.
    std::vector<char*> Merge();

    char** const before_;
    std::vector<std::string> base_;
    std::vector<char*> baseEntries_;
    std::vector<std::string> request_;
    std::vector<char*> entries_;
};

#endif
