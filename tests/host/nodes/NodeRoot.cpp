#include "tests/host/nodes/NodeRoot.h"

#include <stdarg.h>
#include <sys/stat.h>
#include <syslog.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iterator>

#include "platform/Paths.h"

namespace fs = std::filesystem;

namespace {

constexpr char kModule[] = TALO_MODULE_DIR "talo-digest.so";

std::vector<std::string>& Lines() {
    static std::vector<std::string> lines;
    return lines;
}

// With its lock, and what was not finished.
void Clear() {
    const fs::path file = TALO_NODES_FILE;
    fs::create_directories(file.parent_path());
    for (const auto& entry : fs::directory_iterator(file.parent_path())) {
        if (entry.path().stem() == file.filename()) {
            fs::remove_all(entry.path());
        }
    }
    Lines().clear();
}

}  // namespace

// Stands before the C library's: what the host logs comes here.
extern "C" void syslog(int, const char* format, ...) {
    char line[2048];
    va_list arguments;
    va_start(arguments, format);
    (void)vsnprintf(line, sizeof line, format, arguments);
    va_end(arguments);
    Lines().push_back(line);
}

const char kSesameHash[] = "d0c04f4b1951e4aeaaec8223ed2039e542f3aae805a6fa7f6d794e5afff5d272";

const std::vector<std::string>& Logged() {
    return Lines();
}

bool WasLogged(const std::string& part) {
    for (const std::string& line : Lines()) {
        if (line.find(part) != std::string::npos) {
            return true;
        }
    }
    return false;
}

NodeRoot::NodeRoot() {
    Clear();
    fs::create_directories(TALO_MODULE_DIR);
    fs::remove(kModule);
    fs::create_symlink(DIGEST_MODULE, kModule);
}

NodeRoot::~NodeRoot() {
    fs::remove(kModule);
    Clear();
}

void NodeRoot::WriteNodes(const std::string& content, unsigned mode) {
    fs::remove_all(TALO_NODES_FILE);
    std::ofstream(TALO_NODES_FILE, std::ios::binary) << content;
    ASSERT_EQ(0, chmod(TALO_NODES_FILE, mode));
}

std::string NodeRoot::ReadNodes() {
    if (!fs::is_regular_file(TALO_NODES_FILE)) {
        return std::string();
    }
    std::ifstream file(TALO_NODES_FILE, std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(file), {});
}

std::string NodeRoot::CalledLine(long long id, const std::string& more) {
    return "{\"id\":" + std::to_string(id) + more +
           ",\"secret\":\"shown\",\"self\":1,\"url\":\"https://nas" + std::to_string(id) +
           ".local/webapi/entry.cgi\"}\n";
}

std::string NodeRoot::CallingLine(long long id, const std::string& classes) {
    return "{\"accepts\":{\"classes\":[" + classes + "],\"secret_hash\":\"" + kSesameHash +
           "\"},\"id\":" + std::to_string(id) + "}\n";
}

talo::Node NodeRoot::Called(long long id) {
    talo::Node node;
    node.id = id;
    node.url = "https://nas" + std::to_string(id) + ".local/webapi/entry.cgi";
    node.self = 1;
    node.secret = "shown";
    return node;
}

talo::Node NodeRoot::Calling(long long id, const std::vector<std::string>& classes) {
    talo::Node node;
    node.id = id;
    node.secretHash = kSesameHash;
    node.classes = classes;
    return node;
}

void NodeRoot::Set(const talo::Node& node) {
    std::string problem;
    ASSERT_TRUE(talo::SetNode(node, &problem)) << problem;
}

bool NodeRoot::Knows(long long id) {
    talo::Node node;
    return talo::FindNode(id, &node) && node.id == id;
}

std::vector<long long> NodeRoot::Ids() {
    std::vector<talo::Node> nodes;
    std::vector<long long> ids;
    EXPECT_TRUE(talo::ListNodes(&nodes));
    for (const talo::Node& node : nodes) {
        ids.push_back(node.id);
    }
    return ids;
}
