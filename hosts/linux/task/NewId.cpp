#include "hosts/linux/task/NewId.h"

#include <sys/random.h>

#include "hosts/linux/task/Records.h"
#include "hosts/linux/util/HostLog.h"

namespace host {

namespace {

constexpr char kSource[] = "NewId.cpp";

// The letter keeps a prefix of digits from making an id that reads as a number.
constexpr char kLetter = 't';
constexpr char kAlphabet[] = "0123456789abcdefghjkmnpqrstvwxyz";  // 32 of them
constexpr size_t kLetters = 16;                                   // 80 bits
constexpr int kAttempts = 4;

}  // namespace

TaloTaskAnswer MakeNewId(Connection* connection, const std::string& user, const std::string& prefix,
                         std::string* id) {
    for (int attempt = 0; attempt < kAttempts; ++attempt) {
        unsigned char random[kLetters];
        if (getrandom(random, sizeof random, 0) != static_cast<ssize_t>(sizeof random)) {
            HOST_LOG("no task can be named: %m");
            return kTaskFailed;
        }
        std::string made = prefix + kLetter;
        for (const unsigned char byte : random) {
            made += kAlphabet[byte % 32];
        }
        long long number = 0;
        const TaloTaskAnswer answer = FindRecord(connection, user, made, &number);
        if (answer == kTaskMissing) {
            id->swap(made);
            return kTaskDone;
        }
        if (answer == kTaskFailed) {
            return kTaskFailed;
        }
    }
    HOST_LOG("no task can be named: all names are taken");
    return kTaskFailed;
}

}  // namespace host
