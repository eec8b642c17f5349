#include "programs/webapi_server/Environment.h"

#include <unistd.h>

#include <algorithm>
#include <string_view>

namespace {

// What a request's variables are called: a server that was started by hand within
// a CGI program, or by systemd, has some of its own.
constexpr std::string_view kRequestPrefixes[] = {
    "AUTH_",   "CONTENT_", "HTTP_",   "LISTEN_", "PATH_", "REDIRECT_",
    "REMOTE_", "REQUEST_", "SCRIPT_", "SERVER_", "SSL_",  "WATCHDOG_",
};
constexpr std::string_view kRequestNames[] = {
    "DOCUMENT_ROOT", "DOCUMENT_URI", "GATEWAY_INTERFACE",    "HTTPS",
    "NOTIFY_SOCKET", "QUERY_STRING", "TALO_WEBAPI_USERNAME", "USERNAME",
};

// Of a request's variables these are not passed on. Some libraries take a proxy
// from HTTP_PROXY, which any client sets with a header "Proxy"; three mark the
// child that runs a background task; and a method need not know how the request
// came.
constexpr std::string_view kRefusedNames[] = {
    "HTTP_PROXY", "SCGI", "full_task_id", "task_id", "task_user",
};

// What the process answers as, also behind a web server that says nothing of it.
constexpr char kInterface[] = "GATEWAY_INTERFACE=CGI/1.1";

std::string_view NameOf(std::string_view variable) {
    return variable.substr(0, variable.find('='));
}

template <typename Names>
bool IsAmong(const Names& names, std::string_view name) {
    return std::find(std::begin(names), std::end(names), name) != std::end(names);
}

bool IsOfRequests(std::string_view name) {
    return IsAmong(kRequestNames, name) || IsAmong(kRefusedNames, name) ||
           std::any_of(
               std::begin(kRequestPrefixes), std::end(kRequestPrefixes),
               [&](std::string_view prefix) { return name.substr(0, prefix.size()) == prefix; });
}

struct Named {
    std::string_view name;
    char* entry;

    bool operator<(const Named& other) const {
        return name < other.name;
    }
};

}  // namespace

Environment::Environment() : before_(environ) {
    for (char** entry = environ; entry != nullptr && *entry != nullptr; ++entry) {
        const std::string_view variable = *entry;
        if (variable.find('=') != std::string_view::npos && !IsOfRequests(NameOf(variable))) {
            base_.emplace_back(variable);
        }
    }
    baseEntries_ = Merge();
}

Environment::~Environment() {
    environ = before_;
}

void Environment::Enter(std::vector<std::string> variables) {
    variables.insert(variables.begin(), kInterface);
    request_.swap(variables);
    Merge().swap(entries_);
    environ = entries_.data();
}

// The texts of the request go when nobody points to them.
void Environment::Leave() {
    environ = baseEntries_.data();
    entries_.clear();
    request_.clear();
}

std::vector<char*> Environment::Merge() {
    std::vector<Named> named;
    named.reserve(base_.size() + request_.size());
    for (std::vector<std::string>* variables : {&base_, &request_}) {
        for (std::string& variable : *variables) {
            named.push_back({NameOf(variable), variable.data()});
        }
    }
    // The last of a name is behind the others of it.
    std::stable_sort(named.begin(), named.end());
    std::vector<char*> entries;
    entries.reserve(named.size() + 1);
    for (size_t index = 0; index < named.size(); ++index) {
        const bool isLast = index + 1 == named.size() || named[index].name != named[index + 1].name;
        if (isLast && !IsAmong(kRefusedNames, named[index].name)) {
            entries.push_back(named[index].entry);
        }
    }
    entries.push_back(nullptr);
    return entries;
}
