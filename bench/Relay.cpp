#include <curl/curl.h>

#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string>

#include "Groups.h"
#include "Harness.h"
#include "Spawn.h"
#include "TwoAppliances.h"

namespace bench {

namespace {

constexpr int kRounds = 101;
constexpr int kCallsPerRound = 3;

size_t Append(char* bytes, size_t one, size_t count, void* text) {
    static_cast<std::string*>(text)->append(bytes, one * count);
    return one * count;
}

[[noreturn]] void GiveUp(const std::string& what) {
    std::fprintf(stderr, "%s\n", what.c_str());
    std::exit(1);
}

// A client that knows nothing of a call before: a connection and a handshake each.
// Its own certificate store is small, since it would be read each time.
void Call(const std::string& authority, const Appliance& appliance, const std::string& form) {
    const std::unique_ptr<CURL, void (*)(CURL*)> call(curl_easy_init(), curl_easy_cleanup);
    const std::string cookie = "id=" + appliance.session;
    std::string answer;
    curl_easy_setopt(call.get(), CURLOPT_URL, appliance.url.c_str());
    curl_easy_setopt(call.get(), CURLOPT_PROXY, "");
    curl_easy_setopt(call.get(), CURLOPT_CAINFO, authority.c_str());
    curl_easy_setopt(call.get(), CURLOPT_CAPATH, nullptr);
    curl_easy_setopt(call.get(), CURLOPT_COOKIE, cookie.c_str());
    curl_easy_setopt(call.get(), CURLOPT_POSTFIELDS, form.c_str());
    curl_easy_setopt(call.get(), CURLOPT_WRITEFUNCTION, Append);
    curl_easy_setopt(call.get(), CURLOPT_WRITEDATA, &answer);
    const CURLcode result = curl_easy_perform(call.get());
    if (result != CURLE_OK) {
        GiveUp(std::string("no answer: ") + curl_easy_strerror(result));
    }
    if (answer.find("\"hostname\":") == std::string::npos) {
        GiveUp("not the reply that was expected: " + answer);
    }
}

// A client that has nothing loaded either, as the first appliance has not.
void RunCurl(const std::string& authority, const Appliance& appliance, const std::string& form) {
    RunProcess("/usr/bin/curl", {},
               {"-qfsS", "--noproxy", "*", "--cacert", authority, "-b", "id=" + appliance.session,
                "-d", form, appliance.url});
}

}  // namespace

// Both end at the same method of the same appliance. That one keeps the session of
// the relay, so that only the first call opens it.
void Relays() {
    const TwoAppliances appliances;
    if (!appliances.IsReady()) {
        GiveUp("two appliances could not be served");
    }
    const std::string info = "api=TALO.System&version=2&method=info";
    const std::string relayed = info + "&relay_nd=2";
    const std::string& authority = appliances.Authority();
    Compare("A call of another appliance, each with a TLS handshake of its own",
            {{"called directly", [&] { Call(authority, appliances.Second(), info); }},
             {"over the first appliance", [&] { Call(authority, appliances.First(), relayed); }}},
            kRounds, kCallsPerRound);
    Compare(
        "The same from the start of the program curl to its end",
        {{"called directly", [&] { RunCurl(authority, appliances.Second(), info); }},
         {"over the first appliance", [&] { RunCurl(authority, appliances.First(), relayed); }}},
        kRounds, kCallsPerRound);
}

}  // namespace bench
