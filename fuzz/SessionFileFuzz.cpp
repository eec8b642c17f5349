#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>

#include "hosts/linux/cgi/SessionRecord.h"
#include "hosts/linux/cgi/SessionStore.h"

// The content of a session's file.

namespace {

void Require(bool condition) {
    if (!condition) {
        abort();
    }
}

bool IsSame(const talo::Session& left, const talo::Session& right) {
    return left.user == right.user && left.address == right.address &&
           left.language == right.language && left.application == right.application &&
           left.privilege == right.privilege && left.timeout == right.timeout &&
           left.skipAddress == right.skipAddress && left.handle == right.handle &&
           left.created == right.created && left.node == right.node;
}

// The writer mends a text that is no UTF-8, so what was read once may change
// once, and then stays.
talo::Session WrittenAndRead(const talo::Session& session) {
    talo::Session again;
    Require(host::ParseSessionRecord(host::FormatSessionRecord(session), &again));
    return again;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string content(reinterpret_cast<const char*>(data), size);
    talo::Session session;
    session.user = "untouched";
    if (!host::ParseSessionRecord(content, &session)) {
        Require(session.user == "untouched" && session.handle.empty());
        return 0;
    }
    Require(!session.user.empty() && !session.handle.empty());
    Require(session.timeout >= 0 && session.timeout <= 366 * 24 * 60);
    Require(session.node >= 0);
    const talo::Session once = WrittenAndRead(session);
    Require(once.timeout == session.timeout && once.skipAddress == session.skipAddress &&
            once.created == session.created && once.node == session.node);
    Require(IsSame(WrittenAndRead(once), once));
    session.lastUse = 1700000000;
    Require(!host::HasTimedOut(session, 30, session.lastUse));
    return 0;
}
