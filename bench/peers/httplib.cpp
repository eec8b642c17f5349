// What a server of one program does for the measured call: a stranger's HTTP
// library, a thread for each connection, the same session file, the same description,
// the same reply. Accounts, rights and much else it does not look after.
#include <httplib.h>
#include <json/json.h>
#include <sys/socket.h>
#include <sys/sysinfo.h>
#include <sys/utsname.h>

#include <cstdio>
#include <cstdlib>
#include <string>

#include "JsonFile.h"
#include "Session.h"

namespace {

struct Options {
    std::string address;
    int port = 0;
    std::string sessions;     // folder of the session files
    std::string description;  // file
    bool keep = false;        // parse the description once instead of for each request
};

constexpr size_t kThreads = 32;

std::string CookieId(const httplib::Request& request) {
    const std::string cookies = request.get_header_value("Cookie");
    const size_t begin = cookies.find("id=");
    return begin == std::string::npos ? std::string()
                                      : cookies.substr(begin + 3, cookies.find(';') - begin - 3);
}

bool Lists(const Json::Value& description, const httplib::Request& request) {
    const Json::Value& api = description[request.get_param_value("api")];
    const std::string method = request.get_param_value("method");
    const std::string version = request.get_param_value("version");
    const int number = std::atoi(version.c_str());
    if (!api.isObject() || number < api["minVersion"].asInt() ||
        number > api["maxVersion"].asInt()) {
        return false;
    }
    for (const Json::Value& entry : api["methods"][version]) {
        if (entry == method) {
            return true;
        }
    }
    return false;
}

Json::Value Info() {
    struct utsname host = {};
    struct sysinfo facts = {};
    (void)uname(&host);
    (void)sysinfo(&facts);
    Json::Value data(Json::objectValue);
    data["hostname"] = host.nodename;
    data["kernel"] = host.release;
    data["machine"] = host.machine;
    data["uptime"] = static_cast<Json::Int64>(facts.uptime);
    for (const unsigned long load : facts.loads) {
        data["load"].append(static_cast<double>(load) / (1 << SI_LOAD_SHIFT));
    }
    data["memory"]["total"] = static_cast<Json::UInt64>(facts.totalram) * facts.mem_unit;
    data["memory"]["free"] = static_cast<Json::UInt64>(facts.freeram) * facts.mem_unit;
    return data;
}

Json::Value Answer(const Options& options, const Json::Value& kept,
                   const httplib::Request& request) {
    Json::Value reply(Json::objectValue);
    reply["success"] = false;
    Json::Value read;
    if (!CheckSession(options.sessions, CookieId(request),
                      request.get_header_value("X-Forwarded-For"))) {
        reply["error"]["code"] = 105;
    } else if (!options.keep && !ReadJson(options.description, &read)) {
        reply["error"]["code"] = 102;
    } else if (!Lists(options.keep ? kept : read, request)) {
        reply["error"]["code"] = 103;
    } else {
        reply["data"] = Info();
        reply["success"] = true;
    }
    return reply;
}

bool Read(int argc, char** argv, Options* options) {
    if (argc != 5 && argc != 6) {
        return false;
    }
    options->address = argv[1];
    options->port = std::atoi(argv[2]);
    options->sessions = argv[3];
    options->description = argv[4];
    options->keep = argc == 6;
    return argc == 5 || std::string(argv[5]) == "keep";
}

// The library lets five connections wait, fewer than the load generator has; the next
// one would wait for a second.
bool Listen(httplib::Server* server, const Options& options) {
    constexpr int kBacklog = 511;
    int socket = -1;
    server->set_socket_options([&](int made) { socket = made; });
    return server->bind_to_port(options.address, options.port) && listen(socket, kBacklog) == 0 &&
           server->listen_after_bind();
}

}  // namespace

int main(int argc, char** argv) {
    Options options;
    Json::Value kept;
    if (!Read(argc, argv, &options)) {
        std::fprintf(stderr, "usage: bench-httplib ADDRESS PORT SESSIONS DESCRIPTION [keep]\n");
        return 2;
    }
    if (!ReadJson(options.description, &kept)) {
        std::perror(options.description.c_str());
        return 1;
    }
    Json::StreamWriterBuilder writer;
    writer["indentation"] = "";
    httplib::Server server;
    // A connection that is kept holds a thread: as many as there are clients, and more.
    server.new_task_queue = [] { return new httplib::ThreadPool(kThreads); };
    server.set_keep_alive_max_count(1000000);
    server.set_tcp_nodelay(true);
    server.Get("/webapi/entry.cgi", [&](const httplib::Request& request, httplib::Response& reply) {
        reply.set_content(Json::writeString(writer, Answer(options, kept, request)),
                          "application/json; charset=utf-8");
    });
    return Listen(&server, options) ? 0 : 1;
}
