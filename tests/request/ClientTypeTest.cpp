#include "src/request/ClientType.h"

#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "src/request/APIRequestPrivate.h"
#include "webapi/APIRequest.h"

namespace {

using TALO::APIRequest;
using TALO::ClientType;
using TALO::DetectClientType;

// A type as letters, so that a table of them can be read: M mobile, P iPhone
// class, A Android, I IE Mobile, D iPad, B PlayBook, 6 BlackBerry 6, K WebKit,
// S supports the web application.
std::string Letters(const ClientType& type) {
    std::string letters;
    letters += type.mobile ? "M" : "";
    letters += type.iPhone ? "P" : "";
    letters += type.android ? "A" : "";
    letters += type.ieMobile ? "I" : "";
    letters += type.iPad ? "D" : "";
    letters += type.playBook ? "B" : "";
    letters += type.blackBerry6 ? "6" : "";
    letters += type.webKit ? "K" : "";
    letters += type.supportsWebApp ? "S" : "";
    return letters;
}

struct AgentRow {
    const char* agent;
    const char* letters;
};

TEST(DetectClientType, TakesTheFirstDeviceClassThatMatches) {
    const AgentRow rows[] = {
        {"", ""},
        {"mozilla/5.0", ""},
        {"applewebkit/537", "KS"},
        {"iphone", "MP"},
        {"iphone applewebkit", "MPKS"},
        {"ipod applewebkit", "MPKS"},
        {"ipad applewebkit", "MPDK"},
        {"ipad", "MPD"},
        {"ipad iphone", "MPD"},
        {"iphone ipad applewebkit", "MPDK"},
        {"android ipad", "MPD"},
        {"android iphone", "MP"},
        {"android applewebkit", "MAKS"},
        {"android playbook", "MA"},
        {"playbook applewebkit", "MBKS"},
        {"blackberry playbook", "MB"},
        {"blackberry android", "MA"},
        {"blackberry applewebkit", "M6KS"},
        {"blackberry", ""},
    };
    for (const AgentRow& row : rows) {
        EXPECT_EQ(Letters(DetectClientType(row.agent, false, false)), row.letters) << row.agent;
    }
}

TEST(DetectClientType, AsksPatternAndHeadersForTheOthers) {
    EXPECT_EQ(Letters(DetectClientType("plain", true, false)), "M");
    EXPECT_EQ(Letters(DetectClientType("plain", false, true)), "M");
    EXPECT_EQ(Letters(DetectClientType("plain", false, false)), "");
}

TEST(DetectClientType, KnowsIEMobileAmongMobileClientsOnly) {
    EXPECT_EQ(Letters(DetectClientType("msie 6", true, false)), "MI");
    EXPECT_EQ(Letters(DetectClientType("iemobile", true, false)), "MI");
    EXPECT_EQ(Letters(DetectClientType("android iemobile", false, false)), "MAI");
    EXPECT_EQ(Letters(DetectClientType("msie 6", false, false)), "");
}

struct Getter {
    const char* name;
    bool (APIRequest::*ask)() const;
};

const Getter kGetters[] = {
    {"IsMobile", &APIRequest::IsMobile},
    {"IsIPhone", &APIRequest::IsIPhone},
    {"IsAndroid", &APIRequest::IsAndroid},
    {"IsIEMobile", &APIRequest::IsIEMobile},
    {"IsIPad", &APIRequest::IsIPad},
    {"IsPlayBook", &APIRequest::IsPlayBook},
    {"IsBlackBerry6", &APIRequest::IsBlackBerry6},
    {"IsWebKit", &APIRequest::IsWebKit},
    {"IsSupportWebApp", &APIRequest::IsSupportWebApp},
};

Json::Value Section(const APIRequest& request, const char* name) {
    TALO::APIRequestPrivate* d = nullptr;
    std::memcpy(&d, reinterpret_cast<const char*>(&request) + sizeof(void*), sizeof d);
    return d->GetData(name, "", Json::Value());
}

TEST(ClientFlags, StayFalseForEveryClient) {
    const char* const agents[] = {
        "Mozilla/5.0 (iPhone; CPU iPhone OS 4_0 like Mac OS X) AppleWebKit/532.9 Mobile",
        "Mozilla/5.0 (iPad; U) AppleWebKit/531.21",
        "Mozilla/5.0 (Linux; Android 2.2) AppleWebKit/533.1",
        "Mozilla/5.0 (PlayBook; U) AppleWebKit/534.8",
        "Mozilla/5.0 (BlackBerry; U; BlackBerry 9800) AppleWebKit/534.1",
        "BlackBerry9000/4.6",
        "Mozilla/4.0 (compatible; MSIE 7.0; Windows CE; IEMobile 7.11)",
        "Opera Mini",
        "",
    };
    for (const char* agent : agents) {
        Json::Value document(Json::objectValue);
        document["environ"]["HTTP_USER_AGENT"] = agent;
        document["environ"]["HTTP_UA_OS"] = "Windows CE";
        document["environ"]["HTTP_X_WAP_PROFILE"] = "http://phone/profile";
        const APIRequest request(document);
        for (const Getter& getter : kGetters) {
            EXPECT_FALSE((request.*getter.ask)()) << getter.name << " of " << agent;
        }
        EXPECT_EQ(Section(request, "userAgent"), Json::Value(Json::objectValue)) << agent;
        EXPECT_EQ(request.GetEnv("HTTP_USER_AGENT", Json::Value()), Json::Value(agent));
    }
}

TEST(ClientFlags, AreFalseWithoutAnAgent) {
    const APIRequest request{Json::Value()};
    for (const Getter& getter : kGetters) {
        EXPECT_FALSE((request.*getter.ask)()) << getter.name;
    }
}

// What is in the section is read back: the stores are refused, not the reading.
TEST(ClientFlags, ReadTheirOwnKey) {
    const char* const keys[] = {"uaMobile",      "uaIPhone", "uaAndroid",
                                "uaIEMobile",    "uaIPad",   "uaPlayBook",
                                "uaBlackBerry6", "uaWebKit", "uaSupportWebAPP"};
    for (size_t set = 0; set < 9; ++set) {
        const APIRequest request{Json::Value()};
        TALO::APIRequestPrivate* d = nullptr;
        std::memcpy(&d, reinterpret_cast<const char*>(&request) + sizeof(void*), sizeof d);
        ASSERT_TRUE(d->SetData("userAgent", keys[set], true, false));
        for (size_t asked = 0; asked < 9; ++asked) {
            EXPECT_EQ((request.*kGetters[asked].ask)(), asked == set)
                << kGetters[asked].name << " with " << keys[set];
        }
    }
}

}  // namespace
