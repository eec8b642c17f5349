#include <sys/random.h>
#include <sys/types.h>

#include "hosts/linux/account/Password.h"
#include "hosts/linux/cipher/Base64Url.h"
#include "hosts/linux/file/Guard.h"
#include "hosts/linux/relay/NodeLine.h"
#include "hosts/linux/sdk/Digest.h"
#include "hosts/linux/sdk/Nodes.h"
#include "hosts/linux/util/HostLog.h"

namespace {

constexpr char kSource[] = "NodeSecret.cpp";
constexpr size_t kSecretBytes = 32;

bool Hash(const std::string& secret, std::string* hash) {
    talo::Sha256 digest;
    return digest.Update(secret.data(), secret.size()) && digest.Final(hash);
}

}  // namespace

namespace talo {

bool NewNodeSecret(std::string* secret, std::string* hash) {
    return host::Guarded(false, [&] {
        std::string bytes(kSecretBytes, '\0');
        if (getrandom(&bytes[0], bytes.size(), 0) != static_cast<ssize_t>(bytes.size())) {
            HOST_LOG("no random bytes: %m");
            return false;
        }
        const std::string made = host::ToBase64Url(bytes);
        std::string madeHash;
        if (!Hash(made, &madeHash)) {
            return false;
        }
        *secret = made;
        *hash = madeHash;
        return true;
    });
}

// A secret has so many bits that its plain hash stands for it. It is made also for
// an appliance that is not known.
bool ProvesNode(long long id, const std::string& secret) {
    return host::Guarded(false, [&] {
        Node node;
        std::string shown;
        return host::IsNodeSecret(secret) && Hash(secret, &shown) && FindNode(id, &node) &&
               !node.secretHash.empty() && host::EqualInConstantTime(shown, node.secretHash);
    });
}

}  // namespace talo
