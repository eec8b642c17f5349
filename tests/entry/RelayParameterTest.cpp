#include <json/json.h>

#include <string>
#include <vector>

#include "src/base/ErrorCode.h"
#include "tests/entry/RelayFixture.h"
#include "tests/support/Json.h"

using support::Parse;

// The two parameters of the relay: "relay_nd" and "relay_timeout".

namespace {

class RelayParameter : public RelayFixture {
  protected:
    // Ann's call with these values, as JSON texts; "" for a parameter left out.
    static Call With(const std::string& target, const std::string& timeout) {
        Json::Value params(Json::objectValue);
        params["relay_nd"] = Parse(target);
        if (!timeout.empty()) {
            params["relay_timeout"] = Parse(timeout);
        }
        return FarWith(params);
    }
};

TEST_F(RelayParameter, NamesAnApplianceByAnyInteger) {
    const struct {
        const char* what;
        const char* value;
        long long target;
    } rows[] = {
        {"number", "7", 7},
        {"zero", "0", 0},
        {"below zero", "-1", -1},
        {"above 32 bits", "4294967297", 4294967297LL},
        {"largest", "9223372036854775807", 9223372036854775807LL},
        {"smallest", "-9223372036854775808", -9223372036854775807LL - 1},
        {"text", R"("7")", 7},
        {"text below zero", R"("-7")", -7},
        {"largest as a text", R"("9223372036854775807")", 9223372036854775807LL},
        {"smallest as a text", R"("-9223372036854775808")", -9223372036854775807LL - 1},
        {"text with zeros in front", R"("007")", 7},
        {"whole number with a point", "7.0", 7},
        {"whole number with an exponent", "1e3", 1000},
        {"largest real number without a neighbour", "9007199254740991.0", 9007199254740991LL},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.what);
        (void)Forward(With(row.value, ""), [&row](const fake::RelayCall& call) {
            EXPECT_EQ(call.target, row.target);
            EXPECT_FALSE(call.params.isMember("relay_nd"));
        });
    }
}

TEST_F(RelayParameter, ThatNamesNoApplianceIsAnsweredWith101) {
    const struct {
        const char* what;
        const char* value;
    } rows[] = {
        {"fraction", "1.5"},
        {"true", "true"},
        {"false", "false"},
        {"null", "null"},
        {"empty array", "[]"},
        {"array of one", "[7]"},
        {"empty object", "{}"},
        {"object", R"({"id": 7})"},
        {"empty text", R"("")"},
        {"word", R"("abc")"},
        {"fraction as a text", R"("1.5")"},
        {"whole number with a point as a text", R"("7.0")"},
        {"exponent as a text", R"("1e3")"},
        {"hexadecimal text", R"("0x7")"},
        {"plus sign", R"("+7")"},
        {"two signs", R"("--7")"},
        {"sign alone", R"("-")"},
        {"blank in front", R"(" 7")"},
        {"blank behind", R"("7 ")"},
        {"line end behind", R"("7\n")"},
        {"NUL behind", R"("7\u0000")"},
        {"digits of another script", R"("\u0667")"},
        {"one above the largest", "9223372036854775808"},
        {"one below the smallest", "-9223372036854775809"},
        {"one above 64 bits", "18446744073709551616"},
        {"one above the largest as a text", R"("9223372036854775808")"},
        {"one below the smallest as a text", R"("-9223372036854775809")"},
        {"real number that may be its neighbour", "9007199254740992.0"},
        {"real number that may be its neighbour, below zero", "-9007199254740992.0"},
        {"far too large", "1e300"},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.what);
        RefuseAtOnce(With(row.value, ""), TALO::kErrorBadRequest);
    }
    RefuseAtOnce(ByAnn(GetMethod("echo", "&relay_nd=")), TALO::kErrorBadRequest);
    RefuseAtOnce(ByAnn(GetMethod("echo", "&relay_nd")), TALO::kErrorBadRequest);
}

TEST_F(RelayParameter, LimitsTheTimeOnlyAboveZero) {
    const struct {
        const char* what;
        const char* value;  // "" for none
        std::vector<long> timeouts;
    } rows[] = {
        {"absent", "", {}},
        {"zero", "0", {}},
        {"below zero", "-1", {}},
        {"smallest", "-2147483648", {}},
        {"one", "1", {1}},
        {"some", "30", {30}},
        {"largest", "2147483647", {2147483647}},
        {"above the largest", "2147483648", {}},
        {"above 32 bits", "4294967297", {}},
        {"text", R"("5")", {5}},
        {"zero as a text", R"("0")", {}},
        {"text below zero", R"("-5")", {}},
        {"fraction", "1.9", {1}},
        {"fraction below one", "0.9", {}},
        {"null", "null", {}},
        {"word", R"("abc")", {}},
        {"empty text", R"("")", {}},
        {"array", "[5]", {}},
        {"object", R"({"s": 5})", {}},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.what);
        (void)Forward(With("7", row.value), [&row](const fake::RelayCall& call) {
            EXPECT_EQ(call.timeouts, row.timeouts);
            EXPECT_FALSE(call.params.isMember("relay_timeout"));
            EXPECT_FALSE(call.params.isMember("relay_nd"));
        });
    }
}

TEST_F(RelayParameter, IsNotLookedAtBeforeTheSession) {
    RefuseAtOnce(With("1.5", "").Without("HTTP_COOKIE"), TALO::kErrorNoSession);
}

// Whether an appliance of that number is known is the platform's to say.
TEST_F(RelayParameter, IsAnsweredWith109WhereThePlatformKnowsNoSuchAppliance) {
    Peer().index = -1;
    for (const char* target : {"0", "-1", "7"}) {
        Refuse(With(target, ""), TALO::kErrorRelay, [](ProbeEntry&) {
            EXPECT_EQ(Peer().calls.size(), 1u);
            EXPECT_EQ(Uses("CredRequestMgr.Run"), 0);
        });
    }
}

}  // namespace
