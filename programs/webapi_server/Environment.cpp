#include "programs/webapi_server/Environment.h"

#include <unistd.h>

#include <algorithm>
#include <string_view>
#include <unordered_map>

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

}  // namespace

Environment::Environment() : before_(environ) {
    for (char** entry = environ; entry != nullptr && *entry != nullptr; ++entry) {
        const std::string_view variable = *entry;
        if (variable.find('=') != std::string_view::npos && !IsOfRequests(NameOf(variable))) {
            base_.emplace_back(variable);
        }
    }
}

Environment::~Environment() {
    environ = before_;
}

void Environment::Enter(const std::vector<std::string>& variables) {
    std::vector<std::string> next = variables;
    request_.swap(next);
    Show();
}

void Environment::Leave() {
    Enter({});
}

// An element of the result may be of the texts of before: `environ` follows at
// once, and the old texts go when nobody points to them.
void Environment::Show() {
    std::unordered_map<std::string_view, size_t> places;
    std::vector<char*> entries;
    entries.reserve(base_.size() + request_.size() + 1);
    const auto add = [&](std::string* variable) {
        const auto place = places.emplace(NameOf(*variable), entries.size());
        if (place.second) {
            entries.push_back(variable->data());
        } else {
            entries[place.first->second] = variable->data();
        }
    };
    for (std::string& variable : base_) {
        add(&variable);
    }
    for (std::string& variable : request_) {
        if (!IsAmong(kRefusedNames, NameOf(variable))) {
            add(&variable);
        }
    }
    entries.push_back(nullptr);
    entries_.swap(entries);
    environ = entries_.data();
}
