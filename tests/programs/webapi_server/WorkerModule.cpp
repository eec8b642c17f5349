#include <fcntl.h>
#include <signal.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <iostream>
#include <memory>
#include <string>
#include <vector>

#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APITable.h"

// Methods that behave, and methods that leave something behind.

namespace {

using TALO::APIRequest;
using TALO::APIResponse;

std::string Text(APIRequest* request, const char* name) {
    return request->GetAndCheckString(name, APIRequest::OPTIONAL, nullptr).Get("");
}

void Echo(APIRequest* request, APIResponse* response) {
    Json::Value data;
    data["text"] = Text(request, "text");
    data["pid"] = static_cast<int>(getpid());
    response->SetSuccess(data);
}

void Variable(APIRequest* request, APIResponse* response) {
    const char* value = getenv(Text(request, "name").c_str());
    response->SetSuccess(value != nullptr ? Json::Value(value) : Json::Value());
}

// Frees as much as it allocates, but for the last little piece: below it the heap
// does not shrink by itself.
void LeaveHoles() {
    constexpr size_t kSize = 4096;
    std::vector<std::unique_ptr<char[]>> pieces(size_t{10} * 1024);
    for (auto& piece : pieces) {
        piece.reset(new char[kSize]);
        memset(piece.get(), 'x', kSize);
    }
    auto* const last = static_cast<volatile char*>(malloc(kSize));
    last[0] = 'x';
}

void Leave(APIRequest* request, APIResponse* response) {
    const std::string what = Text(request, "what");
    if (what == "folder") {
        (void)!chdir("/");
    } else if (what == "descriptor") {
        (void)!open("/dev/null", O_RDONLY);
    } else if (what == "mask") {
        (void)umask(0);
    } else if (what == "variable") {
        (void)setenv("LEFT_BEHIND", "yes", 1);
    } else if (what == "memory") {
        constexpr size_t kSize = 4U << 20;
        auto* left = static_cast<volatile char*>(malloc(kSize));
        for (size_t at = 0; at < kSize; at += 1024) {
            left[at] = 'x';
        }
    } else if (what == "holes") {
        LeaveHoles();
    }
    response->SetSuccess(what);
}

// Answers the id of a child that stays, detached, for as long as nobody ends it.
void Child(APIRequest*, APIResponse* response) {
    const pid_t child = fork();
    if (child == 0) {
        (void)setsid();
        (void)pause();
        _exit(0);
    }
    response->SetSuccess(static_cast<int>(child));
}

void Wait(APIRequest*, APIResponse*) {
    for (;;) {
        (void)pause();
    }
}

void Crash(APIRequest*, APIResponse*) {
    (void)signal(SIGUSR1, SIG_DFL);
    abort();
}

// Answers what is left of the input, up to its end.
void Input(APIRequest*, APIResponse* response) {
    std::string text;
    char block[256];
    for (ssize_t got = 0; (got = read(STDIN_FILENO, block, sizeof block)) > 0;) {
        text.append(block, static_cast<size_t>(got));
    }
    response->SetSuccess(text);
}

void Raw(APIRequest*, APIResponse* response) {
    response->SetEnableOutput(false);
    std::cout << "Content-Type: text/plain\r\n\r\nraw";
}

TALO::_tag_API_TABLE table[] = {
    {"Test.Lives", 1, "echo", Echo},   {"Test.Lives", 1, "variable", Variable},
    {"Test.Lives", 1, "leave", Leave}, {"Test.Lives", 1, "child", Child},
    {"Test.Lives", 1, "wait", Wait},   {"Test.Lives", 1, "crash", Crash},
    {"Test.Lives", 1, "raw", Raw},     {"Test.Lives", 1, "input", Input},
    {"Test.Ends", 1, "echo", Echo},    {nullptr, 0, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}
