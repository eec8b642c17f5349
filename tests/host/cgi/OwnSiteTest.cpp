#include "hosts/linux/cgi/CrossSite.h"
#include "tests/host/cgi/SessionFixture.h"

namespace {

TEST(OwnSite, IsToldByOriginAndFetchSite) {
    const struct {
        const char* what;
        host::RequestOrigin request;
        bool own;
    } rows[] = {
        {"a client that is no browser", {"", "", "nas.local"}, true},
        {"and knows no host either", {"", "", ""}, true},
        {"its own page", {"http://nas.local", "same-origin", "nas.local"}, true},
        {"its own page with a port", {"https://nas.local:5001", "", "nas.local:5001"}, true},
        {"by address", {"http://192.0.2.1:5000", "", "192.0.2.1:5000"}, true},
        {"by IPv6 address", {"http://[2001:db8::1]:5000", "", "[2001:db8::1]:5000"}, true},
        {"in other letters", {"HTTPS://NAS.local", "", "nas.LOCAL"}, true},
        {"typed into the browser", {"", "none", "nas.local"}, true},
        {"a browser that says no origin", {"", "same-origin", "nas.local"}, true},
        {"another host", {"https://evil.example", "", "nas.local"}, false},
        {"another host that admits it", {"https://evil.example", "cross-site", "nas.local"}, false},
        {"a lie about the origin", {"http://nas.local", "cross-site", "nas.local"}, false},
        {"a lie about the site", {"https://evil.example", "same-origin", "nas.local"}, false},
        {"only the site", {"", "cross-site", "nas.local"}, false},
        {"another host of the domain", {"https://b.local", "same-site", "nas.local"}, false},
        {"same-site alone", {"", "same-site", "nas.local"}, false},
        {"a site word of the future", {"", "same-planet", "nas.local"}, false},
        {"another port", {"http://nas.local:8080", "", "nas.local:5000"}, false},
        {"a port more", {"http://nas.local:8080", "", "nas.local"}, false},
        {"a port less", {"http://nas.local", "", "nas.local:5000"}, false},
        {"a host that begins alike", {"http://nas.local.evil.example", "", "nas.local"}, false},
        {"a host that ends alike", {"http://evil-nas.local", "", "nas.local"}, false},
        {"the host as a user", {"http://nas.local@evil.example", "", "nas.local"}, false},
        {"the host as a path", {"http://evil.example/nas.local", "", "nas.local"}, false},
        {"the host behind another scheme",
         {"http://evil.example://nas.local", "", "nas.local"},
         false},
        {"a page without an origin", {"null", "", "nas.local"}, false},
        {"that host is called null", {"null", "", "null"}, false},
        {"no scheme", {"nas.local", "", "nas.local"}, false},
        {"nothing behind the scheme", {"http://", "", "nas.local"}, false},
        {"nothing behind it, and no host", {"http://", "", ""}, false},
        {"an origin and no host", {"http://nas.local", "", ""}, false},
        {"two origins", {"http://nas.local http://nas.local", "", "nas.local"}, false},
        {"a blank behind", {"http://nas.local ", "", "nas.local"}, false},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(host::IsOwnSite(row.request), row.own) << row.what;
    }
}

TEST(OwnSite, IsToldOutOfTheEnvironment) {
    Host host;
    EXPECT_TRUE(talo::ComesFromOwnSite());
    host.Say("HTTP_HOST", "nas.local");
    host.Say("HTTP_ORIGIN", "http://nas.local");
    host.Say("HTTP_SEC_FETCH_SITE", "same-origin");
    EXPECT_TRUE(talo::ComesFromOwnSite());
    host.Say("HTTP_SEC_FETCH_SITE", "cross-site");
    EXPECT_FALSE(talo::ComesFromOwnSite());
    host.SayNothingOf("HTTP_SEC_FETCH_SITE");
    host.Say("HTTP_ORIGIN", "http://evil.example");
    EXPECT_FALSE(talo::ComesFromOwnSite());
}

}  // namespace
