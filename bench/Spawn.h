#ifndef BENCH_SPAWN_H
#define BENCH_SPAWN_H

#include <string>
#include <vector>

namespace bench {

// The entry of the private root.
extern const char kEntry[];

// Runs a process from its birth to its end with this environment, its output
// thrown away. Ends the benchmark when it fails.
void RunProcess(const std::string& program, std::vector<std::string> environment,
                std::vector<std::string> arguments = {});

// The same with its output kept.
std::string ReplyOf(const std::string& program, std::vector<std::string> environment);

// The CGI environment of a GET with that query, and of one under a session.
std::vector<std::string> Get(const std::string& query);
std::vector<std::string> Get(const std::string& query, const std::string& sessionId);

}  // namespace bench

#endif
