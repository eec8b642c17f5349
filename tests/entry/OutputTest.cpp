#include <unistd.h>

#include <string>

#include "src/response/APIResponsePrivate.h"
#include "tests/entry/EntryTest.h"
#include "tests/support/Json.h"
#include "tests/support/PrivateMember.h"

namespace support {

struct ResponsePrivate {
    typedef TALO::APIResponsePrivate* TALO::APIResponse::*Type;
    friend Type Find(ResponsePrivate);
};
template struct PrivateMember<ResponsePrivate, &TALO::APIResponse::d>;

struct StoreOfBase {
    typedef Json::Value TALO::APIBase::*Type;
    friend Type Find(StoreOfBase);
};
template struct PrivateMember<StoreOfBase, &TALO::APIBase::store>;

}  // namespace support

using support::Parse;

namespace {

const char kContentType[] = "Content-type: text/html; charset=\"UTF-8\"\r\n";
const char kEnd[] =
    "Cache-Control: max-age=0, no-cache, no-store, must-revalidate\r\n"
    "Pragma: no-cache\r\n"
    "Expires: 0\r\n"
    "\r\n";

Json::Value& StoreOf(TALO::APIResponse& response) {
    TALO::APIResponsePrivate* d = response.*Find(support::ResponsePrivate());
    return d->*Find(support::StoreOfBase());
}

class Output : public EntryTest {};

TEST_F(Output, IsExactlyTheHeaderBlockAndTheBody) {
    EXPECT_EQ(Serve(GetMethod("printing")).output,
              std::string(kContentType) + kEnd + R"({"success":true})");
}

TEST_F(Output, OrdersHeadersByTheirBytes) {
    EXPECT_EQ(Serve(GetMethod("notFound")).output, std::string(kContentType) +
                                                       "Status: 404\r\nx-request-error: lost\r\n" +
                                                       kEnd + R"({"success":true})");
    const std::string output = Inside({}, [](ProbeEntry& entry) {
        for (const char* name : {"b", "A", "a", "X-2", "X-10", "Z"}) {
            entry.response->SetHeader(name, name);
        }
        entry.OutputHeader();
    });
    EXPECT_EQ(output, std::string("A: A\r\n") + kContentType +
                          "X-10: X-10\r\nX-2: X-2\r\nZ: Z\r\na: a\r\nb: b\r\n" + kEnd);
}

TEST_F(Output, SkipsHeadersThatAreNoText) {
    const std::string output = Inside({}, [](ProbeEntry& entry) {
        StoreOf(*entry.response)["headers"] =
            Parse(R"({"N": 1, "O": {}, "Y": "yes", "Z": null, "E": ""})");
        entry.OutputHeader();
    });
    EXPECT_EQ(output, std::string("E: \r\nY: yes\r\n") + kEnd);
}

// The stored text begins with the cookie's own name; no header name goes before it.
TEST_F(Output, WritesCookiesAsTheyStandBehindTheHeaders) {
    const std::string output = Inside({}, [](ProbeEntry& entry) {
        entry.response->SetHeader("x-last", "1");
        StoreOf(*entry.response)["setCookie"] =
            Parse(R"(["id=B; path=/", 7, null, "a=1", {"no": 1}, "id=B; path=/"])");
        entry.OutputHeader();
    });
    EXPECT_EQ(output, std::string(kContentType) + "x-last: 1\r\n" +
                          "id=B; path=/\r\na=1\r\nid=B; path=/\r\n" + kEnd);
}

TEST_F(Output, EndsTheBlockAlsoWithoutAnyHeader) {
    const std::string output = Inside({}, [](ProbeEntry& entry) {
        StoreOf(*entry.response)["headers"] = Json::Value(Json::objectValue);
        entry.OutputHeader();
    });
    EXPECT_EQ(output, kEnd);
}

TEST_F(Output, WritesTheBodyInOneLineWithoutALineEnd) {
    const std::string output = Inside({}, [](ProbeEntry& entry) {
        entry.response->SetSuccess(Parse(R"({"b": [1, "x\n", 1.5], "a": "</script>"})"));
        entry.OutputBody();
    });
    EXPECT_EQ(output, R"({"data":{"a":"\u003c/script\u003e","b":[1,"x\n",1.5]},"success":true})");
}

TEST_F(Output, WritesAnEmptyObjectWhenNothingWasSet) {
    const std::string output = Inside({}, [](ProbeEntry& entry) { entry.OutputBody(); });
    EXPECT_EQ(output, "{}");
}

TEST_F(Output, LeavesNothingInTheBufferBehindTheBody) {
    const support::ChildResult result = support::InChild([]() -> int {
        ProbeEntry entry;
        entry.OutputHeader();
        entry.OutputBody();
        _exit(0);
    });
    EXPECT_EQ(result.output, std::string(kContentType) + kEnd + "{}");
}

TEST_F(Output, CarriesALargeBodyWhole) {
    const std::string value(3u << 20, 'v');
    const Reply reply = Serve(Post("api=Test.Entry&version=1&method=echo&big=" + value));
    ASSERT_EQ(reply.Code(), 0);
    EXPECT_EQ(reply.Param("big").asString(), value);
}

}  // namespace
