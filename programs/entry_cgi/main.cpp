#include <fcntl.h>
#include <signal.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>

#include "platform/Paths.h"
#include "programs/common/CrashReply.h"
#include "programs/common/DiscardInput.h"
#include "webapi/WebEntry.h"

namespace {

// A reply that fits leaves in one write.
char outputBuffer[64 * 1024];

volatile sig_atomic_t replyBegun = 0;

// What the web server handed over: descriptors 0, 1 and 2, each one open, and
// nothing else. Some servers leak theirs.
void TidyDescriptors() {
    for (int descriptor = 0; descriptor <= 2; ++descriptor) {
        if (fcntl(descriptor, F_GETFD) < 0) {
            (void)open("/dev/null", O_RDWR);
        }
    }
    (void)close_range(3, ~0U, 0);
}

// These mark the child that runs a background task. A web server's environment
// must not make a request pose as one.
void ForgetTaskIdentity() {
    for (const char* name : {"task_id", "task_user", "full_task_id"}) {
        (void)unsetenv(name);
    }
}

}  // namespace

int main(int argc, char** argv) {
    TidyDescriptors();
    (void)signal(SIGPIPE, SIG_IGN);
    ForgetTaskIdentity();
    (void)setvbuf(stdout, outputBuffer, _IOFBF, sizeof outputBuffer);
    if (chdir(TALO_WEBAPI_DIR) != 0) {
        perror("entry.cgi: " TALO_WEBAPI_DIR);
    }
    TALO::WebEntry::WatchAnswer(&replyBegun);
    BeginCrashReply(&replyBegun);
    TALO::WebEntry entry;
    entry.SetArgs(argc, argv);
    (void)entry.Run(Json::Value());
    EndCrashReply();
    DiscardInput();
    return 0;
}
