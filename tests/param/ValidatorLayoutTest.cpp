#include <gtest/gtest.h>

#include <cstring>
#include <type_traits>

#include "src/param/APIValidatorPrivate.h"
#include "webapi/APIValidator.h"

using TALO::APIParameter;
using TALO::APIValidator;
using TALO::APIValidatorPrivate;

// API libraries built against an earlier release carry these in their code.

namespace {

TEST(ValidatorLayout, IsOnePointer) {
    EXPECT_EQ(sizeof(APIValidator), sizeof(void*));
    EXPECT_FALSE(std::is_polymorphic<APIValidator>::value);
}

TEST(ValidatorLayout, HoldsTheCacheFromTheStart) {
    const APIValidatorPrivate* cache = nullptr;
    std::memcpy(&cache, static_cast<const void*>(APIValidator::GetInstance()), sizeof cache);
    ASSERT_NE(cache, nullptr);
    static const char pattern[] = "^cached$";
    EXPECT_EQ(cache->regexCache.count(pattern), 0u);
    EXPECT_TRUE(APIValidator::CheckRegex("cached", pattern));
    EXPECT_EQ(cache->regexCache.count(pattern), 1u);
}

TEST(ValidatorLayout, CacheIsAMapOfPatternsByAddress) {
    const bool isMap = std::is_same<decltype(APIValidatorPrivate::regexCache),
                                    std::map<const char*, regex_t*>>::value;
    EXPECT_TRUE(isMap);
    EXPECT_EQ(sizeof(APIValidatorPrivate), sizeof(std::map<const char*, regex_t*>));
    EXPECT_FALSE(std::is_polymorphic<APIValidatorPrivate>::value);
}

TEST(ValidatorLayout, OffersStaticTests) {
    typedef bool (*TextTest)(const std::string&);
    for (const TextTest test :
         {APIValidator::IsIPv4, APIValidator::IsIPv6, APIValidator::IsIP, APIValidator::IsDomain,
          APIValidator::IsHostname, APIValidator::IsReachNetId, APIValidator::IsDigit,
          APIValidator::IsWorkGroup, APIValidator::IsNetbios, APIValidator::IsEMail}) {
        EXPECT_FALSE(test(""));
    }
    const APIParameter<int>::Validator portTest = APIValidator::IsPort;
    EXPECT_TRUE(portTest(1));
    const APIParameter<std::string>::Validator textTest = APIValidator::IsDigit;
    EXPECT_TRUE(textTest("1"));
    bool (*const bound)(const APIParameter<int>&, int) = APIValidator::IsLess;
    EXPECT_TRUE(bound(APIParameter<int>(), 1));
    bool (*const belong)(const APIParameter<std::string>&, const Json::Value&) =
        APIValidator::IsBelong;
    EXPECT_FALSE(belong(APIParameter<std::string>(), Json::Value()));
}

}  // namespace
