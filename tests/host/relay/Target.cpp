#include "tests/host/relay/Target.h"

#include <signal.h>
#include <strings.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <stdexcept>

#include "tests/support/Json.h"

namespace {

std::string OutputOf(const std::string& command) {
    FILE* pipe = popen(command.c_str(), "re");
    std::string text;
    char block[512];
    while (pipe != nullptr && fgets(block, sizeof block, pipe) != nullptr) {
        text += block;
    }
    if (pipe == nullptr || pclose(pipe) != 0) {
        throw std::runtime_error(command);
    }
    return text;
}

std::string NewKey() {
    return "openssl req -x509 -newkey ec -pkeyopt ec_paramgen_curve:P-256 -nodes -days 2 ";
}

std::string Quiet() {
    return " 2>/dev/null";
}

void MakeAuthority(const std::string& certificate) {
    (void)OutputOf(NewKey() + "-subj /CN=authority -keyout " + certificate + ".key -out " +
                   certificate + Quiet());
}

}  // namespace

Certificates::Certificates() {
    MakeAuthority(Authority());
}

std::string Certificates::OtherAuthority() const {
    const std::string other = folder_.Path("other-ca.pem");
    MakeAuthority(other);
    return other;
}

std::string Certificates::Make(const std::string& name, const std::string& names) const {
    const std::string certificate = folder_.Path(name + ".pem");
    (void)OutputOf(NewKey() + "-subj /CN=target -addext subjectAltName=" + names +
                   " -addext basicConstraints=critical,CA:FALSE -CA " + Authority() + " -CAkey " +
                   Authority() + ".key -keyout " + KeyOf(certificate) + " -out " + certificate +
                   Quiet());
    return certificate;
}

std::string Certificates::KeyOf(const std::string& certificate) const {
    return certificate + ".key";
}

std::string Certificates::PinOf(const std::string& certificate) const {
    std::string text = OutputOf("openssl pkey -in " + KeyOf(certificate) +
                                " -pubout -outform der | openssl dgst -sha256 -binary | base64");
    text.erase(text.find('\n'));
    return "sha256//" + text;
}

Target::Target(const Certificates& certificates, const std::string& names) {
    static int number = 0;
    certificate_ = certificates.Make("target" + std::to_string(++number), names);
    Plan("{}");
    int ends[2];
    if (pipe(ends) != 0) {
        throw std::runtime_error("pipe");
    }
    const std::string key = certificates.KeyOf(certificate_);
    const std::string plan = folder_.Path("plan");
    const std::string log = folder_.Path("log");
    process_ = fork();
    if (process_ == 0) {
        (void)dup2(ends[1], STDOUT_FILENO);
        (void)close(ends[0]);
        (void)close(ends[1]);
        (void)execlp("python3", "python3", "-IS", RELAY_TARGET, certificate_.c_str(), key.c_str(),
                     plan.c_str(), log.c_str(), nullptr);
        _exit(127);
    }
    (void)close(ends[1]);
    FILE* out = fdopen(ends[0], "r");
    char line[32] = "";
    if (out != nullptr && fgets(line, sizeof line, out) != nullptr) {
        port_ = static_cast<int>(strtol(line, nullptr, 10));
    }
    (void)fclose(out);
    if (port_ == 0) {
        throw std::runtime_error("the target did not start");
    }
}

Target::~Target() {
    Stop();
}

void Target::Stop() {
    if (process_ > 0) {
        (void)kill(process_, SIGKILL);
        (void)waitpid(process_, nullptr, 0);
        process_ = -1;
    }
}

std::string Target::Url() const {
    return "https://127.0.0.1:" + std::to_string(port_) + "/webapi/entry.cgi";
}

// At once: it may be read meanwhile.
void Target::Plan(const std::string& plan) {
    const std::string written = folder_.Write("plan.new", plan);
    if (rename(written.c_str(), folder_.Path("plan").c_str()) != 0) {
        throw std::runtime_error("rename");
    }
}

std::vector<Json::Value> Target::Requests() const {
    std::vector<Json::Value> requests;
    std::ifstream log(folder_.Path("log"));
    for (std::string line; std::getline(log, line);) {
        requests.push_back(support::Parse(line));
    }
    return requests;
}

std::vector<Json::Value> Target::Requests(const std::string& api) const {
    std::vector<Json::Value> requests;
    for (const Json::Value& request : Requests()) {
        if (request["api"].asString() == api) {
            requests.push_back(request);
        }
    }
    return requests;
}

std::string HeaderOf(const Json::Value& request, const std::string& name) {
    for (const Json::Value& header : request["headers"]) {
        if (strcasecmp(header[0].asCString(), name.c_str()) == 0) {
            return header[1].asString();
        }
    }
    return "none";
}
