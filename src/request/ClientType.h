#ifndef TALO_SRC_REQUEST_CLIENTTYPE_H
#define TALO_SRC_REQUEST_CLIENTTYPE_H

#include <string>

namespace TALO {

// What an agent text says about its client.
struct ClientType {
    bool mobile = false;
    bool iPhone = false;  // the class of iPhone, iPod and iPad
    bool android = false;
    bool ieMobile = false;
    bool iPad = false;
    bool playBook = false;
    bool blackBerry6 = false;
    bool webKit = false;
    bool supportsWebApp = false;
};

// Works it out. `agent` is in lower case; `mobilePattern` says whether the text
// matches the pattern of mobile browsers; `mobileHeaders`, whether the client
// sent a header that only mobile ones send.
ClientType DetectClientType(const std::string& agent, bool mobilePattern, bool mobileHeaders);

}  // namespace TALO

#endif
