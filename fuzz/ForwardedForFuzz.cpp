#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>

#include "hosts/linux/cgi/RemoteAddress.h"
#include "hosts/linux/util/Network.h"

// Three lines: the peer, the forwarded-for header, the trusted networks.

namespace {

void Require(bool condition) {
    if (!condition) {
        abort();
    }
}

std::string TakeLine(std::string* text) {
    const size_t end = text->find('\n');
    std::string line = text->substr(0, end);
    *text = end == std::string::npos ? "" : text->substr(end + 1);
    return line;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    std::string text(reinterpret_cast<const char*>(data), size);
    const std::string peer = TakeLine(&text);
    const std::string header = TakeLine(&text);
    const std::string client = host::ClientAddress(peer, header, text);
    // An address in its one spelling, or nothing when the peer is none.
    Require(client.empty() == host::CanonicalAddress(peer).empty());
    Require(client.empty() || host::CanonicalAddress(client) == client);
    // A stranger's word counts for nothing.
    const std::string alone = host::CanonicalAddress(peer);
    Require(host::ClientAddress(peer, header, "") == alone);
    Require(host::ClientAddress(peer, "", text) == alone);
    // What a client writes in front of what its proxy reports changes nothing
    // about who that proxy saw.
    if (!alone.empty() && alone != "203.0.113.5") {
        const std::string seen = header + ", 203.0.113.5";
        Require(host::ClientAddress(peer, seen, alone) == "203.0.113.5");
    }
    return 0;
}
