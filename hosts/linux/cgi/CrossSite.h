#ifndef TALO_HOSTS_LINUX_CGI_CROSSSITE_H
#define TALO_HOSTS_LINUX_CGI_CROSSSITE_H

#include <string>

namespace host {

// What a browser says about the page that a request comes from.
struct RequestOrigin {
    std::string origin;     // the header Origin, "" when absent
    std::string fetchSite;  // the header Sec-Fetch-Site, "" when absent
    std::string host;       // the header Host
};

// Whether the request comes from the appliance's own pages, or from a client
// that is no browser and sends neither header. A page of another host must not
// act with the cookies of this one.
bool IsOwnSite(const RequestOrigin& request);

// The same out of the environment.
bool IsOwnSite();

}  // namespace host

#endif
