#include <string>

#include "src/base/ErrorCode.h"
#include "tests/entry/UploadRequestFixture.h"
#include "tests/support/Json.h"

using support::Parse;

namespace {

const char kPath[] = "/volume1/@tmp/x";

// Forms whose fields carry enciphered parameters.
class EncipheredUpload : public UploadRequestTest {
  protected:
    static void ExpectParams(const Call& call, const char* expected) {
        const Reply reply = Serve(call);
        ASSERT_EQ(reply.Code(), TALO::kErrorNone) << reply.output;
        Json::Value params = reply.body["data"]["params"];
        for (const char* identity : {"api", "version", "method"}) {
            params.removeMember(identity);
        }
        EXPECT_EQ(params, Parse(expected));
    }
};

TEST_F(EncipheredUpload, HasOrdinaryParameters) {
    Script().params = {{"__cIpHeRtExT", "sealed:a=1&text=new"}, {"text", "old"}};
    Script().files = {{"file", kPath}};
    ExpectParams(UploadTo("upload"), R"({"a": 1, "text": "new", "file": "/volume1/@tmp/x"})");
    Script().params = {{"__tXeTrEhPiC", "under t:a=1"}, {"__nEkOtReHpIc", "t"}};
    ExpectParams(UploadTo("upload"), R"({"a": 1, "file": "/volume1/@tmp/x"})");
}

TEST_F(EncipheredUpload, LacksWhatCannotBeRead) {
    Script().params = {{"__cIpHeRtExT", "x"}, {"text", "old"}};
    ExpectParams(UploadTo("upload"), R"({"text": "old"})");
    Script().params = {{"__tXeTrEhPiC", "x"}, {"__nEkOtReHpIc", "t"}, {"text", "old"}};
    ExpectParams(UploadTo("upload"), R"({"text": "old"})");
}

TEST_F(EncipheredUpload, IsCalledByACarrierOfTheQuery) {
    Script().files = {{"file", kPath}};
    ExpectParams(
        Upload("__tXeTrEhPiC=under+t:api=Test.Entry%26version=1%26method=upload&__nEkOtReHpIc=t"),
        R"({"file": "/volume1/@tmp/x"})");
}

// A path that comes out of a carrier takes the place of the real one in the
// parameters, and is told from it all the same.
TEST_F(EncipheredUpload, HasNoUploadedFileOutOfACarrier) {
    Script().params = {{"__cIpHeRtExT", "sealed:file=/etc/passwd"}};
    Script().files = {{"file", kPath}, {"other", "/volume1/@tmp/y"}};
    const Reply reply = Serve(UploadTo("trust"));
    ASSERT_EQ(reply.Code(), TALO::kErrorNone) << reply.output;
    EXPECT_EQ(reply.body["data"]["file"], false);
    EXPECT_EQ(reply.body["data"]["other"], true);
}

TEST_F(EncipheredUpload, RunsTheMethodThatWasCheckedWhateverACarrierNames) {
    Script().params = {{"__cIpHeRtExT", "sealed:method=silent&a=1"}};
    const Reply reply = Serve(UploadTo("upload"));
    ASSERT_EQ(reply.Code(), TALO::kErrorNone) << reply.output;
    EXPECT_EQ(reply.Param("a"), 1);
}

}  // namespace
