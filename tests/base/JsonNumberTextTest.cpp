#include <gtest/gtest.h>

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <random>
#include <string>

#include "src/base/JsonText.h"

namespace {

typedef std::numeric_limits<double> Limits;

struct Row {
    const char* name;
    double number;
    const char* json;
};

const Row kRows[] = {
    {"zero", 0.0, "0.0"},
    {"minus zero", -0.0, "-0.0"},
    {"one", 1.0, "1.0"},
    {"minus one", -1.0, "-1.0"},
    {"a tenth", 0.1, "0.1"},
    {"sum of tenths", 0.1 + 0.2, "0.30000000000000004"},
    {"a third", 1.0 / 3, "0.3333333333333333"},
    {"a half", 0.5, "0.5"},
    {"hundred", 100.0, "100.0"},
    {"largest with exact neighbours", 9007199254740992.0, "9007199254740992.0"},
    {"large", 1e22, "1e+22"},
    {"larger", 1e23, "1e+23"},
    {"huge", 1e300, "1e+300"},
    {"tiny", 1e-7, "1e-07"},
    {"largest", Limits::max(), "1.7976931348623157e+308"},
    {"lowest", Limits::lowest(), "-1.7976931348623157e+308"},
    {"smallest normal", Limits::min(), "2.2250738585072014e-308"},
    {"smallest", Limits::denorm_min(), "5e-324"},
    {"minus smallest", -Limits::denorm_min(), "-5e-324"},
    {"epsilon", Limits::epsilon(), "2.220446049250313e-16"},
    {"no number", Limits::quiet_NaN(), "null"},
    {"infinity", Limits::infinity(), "null"},
    {"minus infinity", -Limits::infinity(), "null"},
};

TEST(ToString, WritesDoublesShortest) {
    for (const Row& row : kRows) {
        SCOPED_TRACE(row.name);
        EXPECT_EQ(TALO::toString(Json::Value(row.number)), row.json);
    }
}

// Every bit pattern is as likely as any other, so that exponents and denormals
// all have their turn.
double RandomDouble(std::mt19937_64& random, bool denormal) {
    for (;;) {
        unsigned long long bits = random();
        if (denormal) {
            bits &= 0x800FFFFFFFFFFFFFull;
        }
        double number = 0;
        std::memcpy(&number, &bits, sizeof number);
        if (std::isfinite(number)) {
            return number;
        }
    }
}

bool SameBits(double one, double other) {
    return std::memcmp(&one, &other, sizeof one) == 0;
}

bool ReadsAsReal(const std::string& json) {
    return json.find_first_not_of("0123456789+-.e") == std::string::npos &&
           json.find_first_of(".e") != std::string::npos;
}

TEST(ToString, WritesDoublesThatReadBackTheSame) {
    std::mt19937_64 random(20250101);
    for (int round = 0; round < 100000; ++round) {
        const double number = RandomDouble(random, round % 10 == 0);
        const std::string json = TALO::toString(Json::Value(number));
        ASSERT_TRUE(SameBits(std::strtod(json.c_str(), nullptr), number)) << json;
        ASSERT_TRUE(ReadsAsReal(json)) << json;
    }
}

TEST(ToString, WritesNoMoreDigitsThanADoubleNeeds) {
    std::mt19937_64 random(20250102);
    int looked = 0;
    for (int round = 0; round < 20000; ++round) {
        const double number = RandomDouble(random, round % 10 == 0);
        const std::string json = TALO::toString(Json::Value(number));
        const std::string mantissa = json.substr(0, json.find('e'));
        const long digits = static_cast<long>(mantissa.size()) - (mantissa[0] == '-') -
                            (mantissa.find('.') != std::string::npos);
        if (mantissa == json || digits < 2) {
            continue;
        }
        ++looked;
        char shorter[64];
        (void)std::snprintf(shorter, sizeof shorter, "%.*e", static_cast<int>(digits) - 2, number);
        ASSERT_FALSE(SameBits(std::strtod(shorter, nullptr), number)) << json << " " << shorter;
    }
    EXPECT_GT(looked, 10000);
}

}  // namespace
