// Test.Slow: "wait" says that it runs by making the file [started], and answers
// when the file [finish] is there, or after half a minute.
#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>
#include <string>

#include "webapi/APIExport.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APITable.h"

namespace {

constexpr int kTries = 600;
constexpr useconds_t kPause = 50 * 1000;

void Wait(TALO::APIRequest* request, TALO::APIResponse* response) {
    const std::string started = request->GetParam("started", "").asString();
    const std::string finish = request->GetParam("finish", "").asString();
    if (FILE* file = fopen(started.c_str(), "w")) {
        (void)fclose(file);
    }
    for (int index = 0; index < kTries; ++index) {
        struct stat facts = {};
        if (stat(finish.c_str(), &facts) == 0) {
            response->SetSuccess("waited");
            return;
        }
        (void)usleep(kPause);
    }
}

TALO::_tag_API_TABLE table[] = {
    {"Test.Slow", 1, "wait", Wait},
    {nullptr, 0, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}
