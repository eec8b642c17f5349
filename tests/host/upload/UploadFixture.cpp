#include "tests/host/upload/UploadFixture.h"

#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>

#include "platform/Paths.h"
#include "tests/support/Child.h"

namespace fs = std::filesystem;

Body& Body::Field(const std::string& name, const std::string& text) {
    return Raw("--B\r\nContent-Disposition: form-data; name=\"" + name + "\"\r\n\r\n" + text +
               "\r\n");
}

Body& Body::File(const std::string& name, const std::string& fileName, const std::string& content) {
    return Raw("--B\r\nContent-Disposition: form-data; name=\"" + name + "\"; filename=\"" +
               fileName + "\"\r\nContent-Type: application/octet-stream\r\n\r\n" + content +
               "\r\n");
}

Body& Body::Raw(const std::string& bytes) {
    text_ += bytes;
    return *this;
}

std::string Body::Whole() const {
    return text_ + "--B--\r\n";
}

UploadTest::UploadTest() {
    fs::create_directory(Dir());
    Configure("");
}

UploadTest::~UploadTest() {
    fs::remove(TALO_HOST_CONF);
}

void UploadTest::Configure(const std::string& lines) {
    fs::create_directories(fs::path(TALO_HOST_CONF).parent_path());
    std::ofstream(TALO_HOST_CONF) << lines;
}

namespace {

[[noreturn]] void FeedAndExit(const std::string& body, size_t piece, int to) {
    (void)signal(SIGPIPE, SIG_IGN);
    for (size_t at = 0; at < body.size();) {
        const ssize_t put = write(to, body.data() + at, std::min(piece, body.size() - at));
        if (put <= 0) {
            break;
        }
        at += static_cast<size_t>(put);
    }
    _exit(0);
}

// Puts a pipe on standard input and a process at its other end.
pid_t FeedInput(const std::string& body, size_t piece) {
    int ends[2];
    if (pipe(ends) != 0) {
        abort();
    }
    const pid_t feeder = fork();
    if (feeder == 0) {
        (void)close(ends[0]);
        FeedAndExit(body, piece, ends[1]);
    }
    (void)dup2(ends[0], STDIN_FILENO);
    (void)close(ends[0]);
    (void)close(ends[1]);
    return feeder;
}

}  // namespace

void UploadTest::Serve(const std::string& body, const std::function<void()>& steps, size_t piece) {
    const auto serve = [&] {
        (void)setenv("CONTENT_TYPE", type_.c_str(), 1);
        (void)setenv("CONTENT_LENGTH",
                     (length_.empty() ? std::to_string(body.size()) : length_).c_str(), 1);
        const pid_t feeder = FeedInput(body, piece);
        steps();
        (void)close(STDIN_FILENO);
        (void)waitpid(feeder, nullptr, 0);
        return 0;
    };
    EXPECT_EQ(support::InChild(serve).status, 0);
}

std::vector<std::string> UploadTest::Left() const {
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(Dir())) {
        const std::string name = entry.path().filename();
        if (name != ".webapi-upload-sweep") {
            names.push_back(name);
        }
    }
    return names;
}

Texts Entries(const TALOSZHASH* hash) {
    Texts entries;
    size_t position = 0;
    const char* key = nullptr;
    const char* value = nullptr;
    while (hash != nullptr && TLIBCSzHashNext(hash, &position, &key, &value) != 0) {
        entries[key] = value;
    }
    return entries;
}

std::string Content(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    return file ? std::string(std::istreambuf_iterator<char>(file), {}) : "no such file";
}

All LoadAll(const std::string& dir) {
    TALOSZHASH* params = TLIBCSzHashAlloc(256);
    TALOSZHASH* files = TLIBCSzHashAlloc(256);
    All all;
    all.result = TaloCgiLoadUploadAll(&params, &files, dir.c_str(), 0);
    all.params = Entries(params);
    all.files = Entries(files);
    TLIBCSzHashFree(params);
    TLIBCSzHashFree(files);
    return all;
}

PartReader::PartReader() {
    EXPECT_EQ(TaloCgiInit("", &ctx_), 0);
}

PartReader::~PartReader() {
    TaloCgiFree(&ctx_);
}

int PartReader::Params() {
    return TaloCgiLoadUploadParams(&ctx_, progress, &upload, fileName, sizeof fileName, fieldName,
                                   sizeof fieldName, fieldValue, sizeof fieldValue);
}

int PartReader::File(const std::string& dir) {
    return TaloCgiLoadUploadFileToDir(&ctx_, dir.c_str(), progress, &upload, fileName, fieldName,
                                      fieldValue);
}

First LoadFirst(int count) {
    TALOSZHASH* params = TLIBCSzHashAlloc(256);
    TALOCGIUPLOADCOUNTERS counters = {};
    char name[256] = "untouched";
    First first;
    first.result = TaloCgiLoadUploadNumParams(&params, count, 0, &counters, name, sizeof name);
    first.fields = Entries(params);
    first.total = counters.total;
    first.consumed = counters.consumed;
    first.name = name;
    TLIBCSzHashFree(params);
    return first;
}
