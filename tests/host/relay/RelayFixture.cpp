#include "tests/host/relay/RelayFixture.h"

#include <stdarg.h>
#include <stdlib.h>
#include <syslog.h>

#include <filesystem>
#include <fstream>

#include "hosts/linux/cgi/Caller.h"
#include "platform/Paths.h"

namespace fs = std::filesystem;

namespace {

std::string& Log() {
    static std::string lines;
    return lines;
}

// A new file, since the old one may be in use.
void PutModule() {
    const fs::path module = fs::path(TALO_MODULE_DIR) / "talo-relay.so";
    fs::create_directories(module.parent_path());
    fs::remove(module);
    fs::copy_file(RELAY_MODULE, module);
}

}  // namespace

// Stands before the C library's: what the host logs comes here.
extern "C" __attribute__((visibility("default"))) void syslog(int, const char* format, ...) {
    char line[2048];
    va_list arguments;
    va_start(arguments, format);
    (void)vsnprintf(line, sizeof line, format, arguments);
    va_end(arguments);
    Log() += std::string(line) + "\n";
}

bool WasLogged(const std::string& part) {
    return Log().find(part) != std::string::npos;
}

RelayTest::RelayTest() : target(certificates), context() {
    Clear();
    PutModule();
    Enter(NodeOf(target));
    LogIn("anna", "ger");
}

RelayTest::~RelayTest() {
    LogOut();
    Clear();
}

void RelayTest::Clear() {
    fs::remove_all(TALO_RELAY_DIR);
    fs::remove_all(TALO_NODES_FILE);
    fs::remove_all(TALO_HOST_CONF);
    (void)unsetenv("HTTP_X_RELAY_HOPS");
    Log().clear();
}

void RelayTest::Configure(const std::string& lines) {
    fs::create_directories(fs::path(TALO_HOST_CONF).parent_path());
    std::ofstream(TALO_HOST_CONF) << lines << "\n";
}

talo::Node RelayTest::NodeOf(const Target& called, long long id) const {
    talo::Node node;
    node.id = id;
    node.url = called.Url();
    node.authority = certificates.Authority();
    node.self = 1;
    node.secret = std::string(43, 'A');
    return node;
}

void RelayTest::Enter(const talo::Node& node) {
    std::string problem;
    fs::create_directories(fs::path(TALO_NODES_FILE).parent_path());
    EXPECT_TRUE(talo::SetNode(node, &problem)) << problem;
}

void RelayTest::LogIn(const std::string& user, const std::string& language) {
    talo::Session session;
    session.user = user;
    session.language = language;
    host::SetCaller(&context, session);
}

void RelayTest::LogOut() {
    host::ForgetCaller(&context);
}

RelayTest::Outcome RelayTest::Call(const Json::Value& params, long long id, long seconds) {
    TALO::CredRequestMgr manager;
    const int index = manager.AddWebAPIRequest(id, "TALO.Test", 3, "do", params);
    EXPECT_EQ(index, 0);
    manager.GetRequest(index)->SetResponseTimeout(seconds);
    const bool done = manager.Run();
    EXPECT_EQ(done, manager.GetError() == 0);
    return {manager.GetError(), manager.GetResponse(index)};
}

RelayTest::Outcome RelayTest::Upload(FILE* in, const Json::Value& size, FILE* out, long seconds) {
    Json::Value headers(Json::objectValue);
    headers["Content-Type"] = "multipart/form-data; boundary=xyz";
    headers["Content-Length"] = size;
    TALO::CredRequestMgr manager;
    const int index = manager.AddRelayRequest(2, "TALO.Test", 3, "do", headers, in, out);
    EXPECT_EQ(index, 0);
    manager.GetRequest(index)->SetResponseTimeout(seconds);
    const bool done = manager.Run();
    EXPECT_EQ(done, manager.GetError() == 0);
    return {manager.GetError(), manager.GetResponse(index)};
}

RelayTest::Outcome RelayTest::Upload(const std::string& body) {
    const Stream stream(body);
    return Upload(stream.Get(), std::to_string(body.size()));
}

Stream::Stream(const std::string& text) : file_(tmpfile()) {
    (void)fwrite(text.data(), 1, text.size(), file_);
    rewind(file_);
}

Stream::~Stream() {
    (void)fclose(file_);
}

std::string Stream::Rest() const {
    std::string text;
    for (int byte = 0; (byte = fgetc(file_)) != EOF;) {
        text += static_cast<char>(byte);
    }
    return text;
}
