#include <fcntl.h>
#include <stdio_ext.h>
#include <unistd.h>

#include <cstdio>
#include <cstring>
#include <fstream>
#include <iostream>
#include <string>
#include <vector>

#include <json/json.h>

#include "hosts/linux/sdk/Process.h"
#include "platform/Paths.h"
#include "webapi/WebEntry.h"

// Serves many requests with one process, each with an environment, an input and an
// output of its own. Standard input is a JSON array of them: {"environ": {...},
// "body": PATH, "output": PATH, "times": N}. Answers with one JSON object: how much
// private memory and how many descriptors there were at the end of each.

namespace {

// As a server makes it: what setenv leaves of an older one is its affair.
class Environment {
  public:
    explicit Environment(const Json::Value& variables) {
        for (auto variable = variables.begin(); variable != variables.end(); ++variable) {
            lines_.push_back(variable.name() + "=" + variable->asString());
        }
        for (std::string& line : lines_) {
            pointers_.push_back(line.data());
        }
        pointers_.push_back(nullptr);
        environ = pointers_.data();
    }
    ~Environment() {
        environ = nullptr;
    }
    Environment(const Environment&) = delete;
    Environment& operator=(const Environment&) = delete;

  private:
    std::vector<std::string> lines_;
    std::vector<char*> pointers_;
};

bool Connect(const std::string& path, int flags, int descriptor) {
    const int file = open(path.c_str(), flags | O_CLOEXEC, 0600);
    if (file < 0 || dup2(file, descriptor) < 0) {
        perror(path.c_str());
        return false;
    }
    (void)close(file);
    return true;
}

bool Serve(const Json::Value& request, int argc, char** argv) {
    if (!Connect(request["body"].asString(), O_RDONLY, STDIN_FILENO) ||
        !Connect(request["output"].asString(), O_WRONLY | O_CREAT | O_TRUNC, STDOUT_FILENO)) {
        return false;
    }
    __fpurge(stdin);
    std::clearerr(stdin);
    std::cin.clear();
    const Environment environment(request["environ"]);
    {
        TALO::WebEntry entry;
        entry.SetArgs(argc, argv);
        (void)entry.Run(Json::Value());
    }
    (void)std::fflush(stdout);
    talo::ForgetRequest();
    return true;
}

long long PrivateKiB() {
    std::ifstream file("/proc/self/smaps_rollup");
    long long total = 0;
    for (std::string line; std::getline(file, line);) {
        if (line.compare(0, 14, "Private_Dirty:") == 0) {
            total += std::stoll(line.substr(14));
        }
    }
    return total;
}

int FirstFree() {
    const int file = open("/dev/null", O_RDONLY | O_CLOEXEC);
    (void)close(file);
    return file;
}

}  // namespace

int main(int argc, char** argv) {
    Json::Value requests;
    std::cin >> requests;
    const int answers = fcntl(STDOUT_FILENO, F_DUPFD_CLOEXEC, 3);
    if (chdir(TALO_WEBAPI_DIR) != 0) {
        perror(TALO_WEBAPI_DIR);
        return 1;
    }
    Json::Value result(Json::objectValue);
    for (const Json::Value& request : requests) {
        for (int times = request.get("times", 1).asInt(); times > 0; --times) {
            if (!Serve(request, argc, argv)) {
                return 1;
            }
        }
        result["memory"].append(Json::Int64(PrivateKiB()));
        result["descriptors"].append(FirstFree());
        result["name"].append(argv[0]);
    }
    const std::string text = result.toStyledString();
    return dprintf(answers, "%s", text.c_str()) > 0 ? 0 : 1;
}
