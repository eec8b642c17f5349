#include <syslog.h>
#include <unistd.h>

#include <string>
#include <vector>

#include "src/base/ErrorCode.h"
#include "tests/entry/RelayFixture.h"
#include "tests/support/Json.h"
#include "tests/support/LogCapture.h"

using support::Parse;

// An upload for another appliance: its body goes there as it comes.

namespace {

class RelayUpload : public RelayFixture {
  protected:
    static Call Take(const std::string& more = "") {
        return ByAnn(Upload("api=Test.Far&version=1&method=take&relay_nd=7" + more));
    }

    // An upload that has its identity in the body. Only there is anything read here.
    static Call TakeByBody(const std::string& query) {
        Script().firstFields = {{"api", "Test.Far"}, {"version", "1"}, {"method", "take"}};
        Script().counters = {100, 60};
        return ByAnn(Upload(query));
    }
};

TEST_F(RelayUpload, StreamsTheBodyWithItsTwoHeaders) {
    Call call = Take("&text=hello");
    call.body = std::string("--x\r\n\0binary\xff\r\n--x--\r\n", 22);
    call = call.With("CONTENT_LENGTH", std::to_string(call.body.size()))
               .With("HTTP_X_OTHER", "1")
               .With("HTTP_CONTENT_TYPE", "text/plain");
    const std::string output = Forward(call, [&call](const fake::RelayCall& forwarded) {
        EXPECT_TRUE(forwarded.streamed);
        EXPECT_EQ(forwarded.target, 7);
        EXPECT_EQ(forwarded.api, "Test.Far");
        EXPECT_EQ(forwarded.version, 1);
        EXPECT_EQ(forwarded.method, "take");
        EXPECT_EQ(forwarded.headers, Parse(R"({"Content-Type": "multipart/form-data; boundary=x",
                            "Content-Length": "22"})"));
        EXPECT_EQ(forwarded.in, stdin);
        EXPECT_EQ(forwarded.out, nullptr);
        EXPECT_EQ(forwarded.sent, call.body);
    });
    EXPECT_EQ(output, kBlock + Peer().response);
}

TEST_F(RelayUpload, IsNotReadHere) {
    Peer().readsBody = false;
    (void)Forward(Take(), [](const fake::RelayCall&) {
        EXPECT_TRUE(fake::Now().uploadCalls.empty());
        EXPECT_TRUE(fake::Now().hashCapacities.empty());
        EXPECT_TRUE(fake::Now().volumeCalls.empty());
        EXPECT_EQ(lseek(STDIN_FILENO, 0, SEEK_CUR), 0);
    });
}

TEST_F(RelayUpload, HasNullForAHeaderThatIsNotThere) {
    (void)Forward(Take().Without("CONTENT_LENGTH"), [](const fake::RelayCall& call) {
        EXPECT_EQ(call.headers, Parse(R"({"Content-Type": "multipart/form-data; boundary=x",
                                          "Content-Length": null})"));
    });
    const Call slice = Take().With("HTTP_X_TYPE_NAME", "SLICEUPLOAD");
    (void)Forward(slice.Without("CONTENT_TYPE"), [](const fake::RelayCall& call) {
        EXPECT_TRUE(call.streamed);
        EXPECT_EQ(call.headers, Parse(R"({"Content-Type": null, "Content-Length": "7"})"));
    });
}

TEST_F(RelayUpload, IsLimitedInTimeAsAnyCall) {
    (void)Forward(Take("&relay_timeout=5"), [](const fake::RelayCall& call) {
        EXPECT_EQ(call.timeouts, std::vector<long>{5});
    });
    for (const char* timeout : {"", "&relay_timeout=0", "&relay_timeout=-1"}) {
        (void)Forward(Take(timeout),
                      [](const fake::RelayCall& call) { EXPECT_TRUE(call.timeouts.empty()); });
    }
}

TEST_F(RelayUpload, IsAnsweredWith115WhereTheMethodTakesNone) {
    RefuseAtOnce(ByAnn(Upload("api=Test.Far&version=1&method=list&relay_nd=7")),
                 TALO::kErrorUploadNotAllowed);
}

TEST_F(RelayUpload, OfNobodyIsNotRead) {
    Refuse(Take().Without("HTTP_COOKIE"), TALO::kErrorNoSession, [](ProbeEntry&) {
        EXPECT_EQ(Operations(), "");
        EXPECT_EQ(lseek(STDIN_FILENO, 0, SEEK_CUR), 0);
    });
}

TEST_F(RelayUpload, ThatCannotBeQueuedOrSentIsAnsweredWith109) {
    Peer().index = -1;
    Refuse(Take(), TALO::kErrorRelay, [](ProbeEntry&) {
        EXPECT_EQ(Operations(), "CredRequestMgr.CredRequestMgr CredRequestMgr.AddRelayRequest ");
    });
    Peer().index = 0;
    Peer().succeeds = false;
    Refuse(Take(), TALO::kErrorRelay);
}

// What was read of the body is gone: the target would get the rest of a form.
TEST_F(RelayUpload, ThatNamesItsAPIInTheBodyIsAnsweredWith109) {
    for (const char* query : {"relay_nd=7", "relay_nd=7&relay_timeout=5&api=Test.Far",
                              "relay_nd=7&version=1&method=take"}) {
        SCOPED_TRACE(query);
        RefuseAtOnce(TakeByBody(query), TALO::kErrorRelay);
        (void)Inside(TakeByBody(query), [](ProbeEntry& entry) {
            const support::LogCapture log;
            (void)entry.Run(Json::Value());
            ASSERT_EQ(log.Lines().size(), 1u);
            EXPECT_EQ(log.Lines()[0].priority, LOG_ERR);
            EXPECT_TRUE(
                log.Has("WebEntry.cpp",
                        "relay of an upload whose body was begun here: its query must name the "
                        "API"))
                << log.Lines()[0].text;
        });
    }
}

TEST_F(RelayUpload, ThatNamesItsApplianceInTheBodyIsAnsweredWith109) {
    const Call call = TakeByBody("version=1");
    Script().firstFields = {{"api", "Test.Far"}, {"method", "take"}, {"relay_nd", "7"}};
    RefuseAtOnce(call, TALO::kErrorRelay);
}

TEST_F(RelayUpload, WithItsIdentityInTheBodyNeedsASessionAndAnApplianceAllTheSame) {
    RefuseAtOnce(TakeByBody("relay_nd=7").Without("HTTP_COOKIE"), TALO::kErrorNoSession);
    RefuseAtOnce(TakeByBody("relay_nd=abc"), TALO::kErrorBadRequest);
}

// By the time that such a field is read, the method is about to run here.
TEST_F(RelayUpload, IsNoneWhereOnlyAFieldBehindTheFirstOnesAsksForIt) {
    Script().params = {{"relay_nd", "7"}};
    const Reply reply = Serve(ByAnn(UploadTo("upload")));
    EXPECT_EQ(reply.Code(), TALO::kErrorNone) << reply.output;
    EXPECT_EQ(reply.Param("relay_nd"), "7");
}

}  // namespace
