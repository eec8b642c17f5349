#include <string>

#include "src/base/ErrorCode.h"
#include "tests/entry/EntryTest.h"

namespace {

class RequestIdentity : public EntryTest {};

// What a version may be; `code` is the whole outcome.
const struct {
    const char* version;
    int code;
} kVersions[] = {
    {"1", TALO::kErrorNone},
    {"%221%22", TALO::kErrorNone},  // the text "1"
    {"1.0", TALO::kErrorNone},      // a real number that is a whole one
    {"0", TALO::kErrorBadRequest},
    {"-1", TALO::kErrorBadRequest},
    {"null", TALO::kErrorBadRequest},
    {"abc", TALO::kErrorBadRequest},
    {"", TALO::kErrorBadRequest},
    {"1x", TALO::kErrorBadRequest},
    {"1.5", TALO::kErrorBadRequest},
    {"2147483647", TALO::kErrorVersion},
    {"2147483648", TALO::kErrorBadRequest},
    {"-2147483649", TALO::kErrorBadRequest},
    {"99999999999999999999", TALO::kErrorBadRequest},
    {"1e300", TALO::kErrorBadRequest},
    {"[]", TALO::kErrorBadRequest},
    {"[1]", TALO::kErrorBadRequest},
    {"{}", TALO::kErrorBadRequest},
};

TEST_F(RequestIdentity, AnswersEveryVersionWithAProperReply) {
    for (const auto& row : kVersions) {
        const std::string line = "api=Test.Entry&method=echo&version=" + std::string(row.version);
        for (const Call& call : {Get(line), Post(line)}) {
            const Reply reply = Serve(call);
            EXPECT_EQ(reply.status, 0) << row.version;
            EXPECT_EQ(reply.Code(), row.code) << row.version << ": " << reply.output;
        }
    }
}

TEST_F(RequestIdentity, AnswersAnIdentityOfTheWrongTypeWith101) {
    for (const char* line :
         {"api=[]&version=1&method=echo", "api={}&version=1&method=echo",
          "api=Test.Entry&version=1&method=[]", "api=Test.Entry&version=1&method={%22a%22:1}"}) {
        const Reply reply = Serve(Get(line));
        EXPECT_EQ(reply.status, 0) << line;
        EXPECT_EQ(reply.bodyText, R"({"error":{"code":101},"success":false})") << line;
    }
}

TEST_F(RequestIdentity, NeverLooksForAFileOfAnImpossibleName) {
    const std::string names[] = {"../../etc/x", "..%2F..%2Fetc%2Fx",           "/etc/x", ".hidden",
                                 "A/B",         std::string(70000, 'a') + "/", "A%00B",  "A%0AB"};
    for (const std::string& name : names) {
        Inside(Get("version=1&method=echo&api=" + name), [&name](ProbeEntry& entry) {
            (void)entry.Run(Json::Value());
            EXPECT_EQ(entry.response->GetError(), TALO::kErrorNoSuchAPI) << name.substr(0, 20);
            EXPECT_EQ(fake::Now().calls["TLIBCFileExist"], 0) << name.substr(0, 20);
        });
    }
    const Reply reply = Serve(Get("version=1&method=echo&api=" + std::string(70000, 'a')));
    EXPECT_EQ(reply.Code(), TALO::kErrorNoSuchAPI);
}

}  // namespace
