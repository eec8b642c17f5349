#include <sys/mman.h>

#include <string>

#include "tests/entry/EntryTest.h"

namespace {

class FaultSweep : public EntryTest {
  protected:
    // Serves a call with the Nth use of an operation failing; `reached` says
    // whether there was an Nth use.
    static Reply ServeFailing(const Call& call, const std::string& operation, int nth,
                              bool* reached) {
        void* shared =
            mmap(nullptr, sizeof(int), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
        int* uses = static_cast<int*>(shared);
        fake::Now().calls[operation] = 0;
        fake::Now().FailCall(operation, nth);
        Reply reply;
        const std::string output = Inside(call, [&](ProbeEntry& entry) {
            (void)entry.Run(Json::Value());
            *uses = fake::Now().calls[operation];
        });
        const size_t end = output.find("\r\n\r\n");
        reply.headers = output.substr(0, end);
        reply.bodyText = end == std::string::npos ? "" : output.substr(end + 4);
        Json::Reader reader(Json::Features::strictMode());
        reply.wellFormed = reader.parse(reply.bodyText, reply.body) && reply.body.isObject();
        *reached = *uses >= nth;
        (void)munmap(shared, sizeof(int));
        fake::Now().failAt.clear();
        return reply;
    }
};

TEST_F(FaultSweep, LeavesAProperReplyWhateverFails) {
    const Call calls[] = {
        GetMethod("echo", "&_sid=XYZ"),
        Post("api=Test.Entry&version=1&method=echo&_sid=XYZ").With("QUERY_STRING", "a=1"),
        Traced(GetMethod("restartOnly")),
        Post("api=Test.Entry&version=1&method=echo&__cIpHeRtExT=sealed:a=1&__tXeTrEhPiC=under+t:b=2"
             "&__nEkOtReHpIc=t&webapi={%22__cIpHeRtExT%22:%22sealed:c=3%22}"),
    };
    for (const char* operation :
         {"TaloCgiInit", "TaloCgiLoadInCookies", "TaloCgiDetectAndDecryptParamLine",
          "TaloCgiDecryptParam", "TALONdtokenGenerateToken", "GetDecryptAESString",
          "strPairToJsonObj", "TLIBCProcFork", "ReadJsonFile", "TLIBCFileExist", "TLIBNetService",
          "TLIBCSysUnlink"}) {
        for (const Call& call : calls) {
            bool reached = true;
            for (int nth = 1; reached; ++nth) {
                const Reply reply = ServeFailing(call, operation, nth, &reached);
                EXPECT_TRUE(reply.wellFormed) << operation << " " << nth << ": " << reply.bodyText;
                EXPECT_EQ(reply.headers.find("Content-type: "), 0u) << operation << " " << nth;
            }
        }
    }
}

// The sweep would prove nothing if the operations were not used at all.
TEST_F(FaultSweep, ReachesTheOperationsOfARequest) {
    const Call call = Traced(GetMethod("restartOnly",
                                       "&_sid=XYZ&__cIpHeRtExT=sealed:a=1"
                                       "&__tXeTrEhPiC=under+t:b=2&__nEkOtReHpIc=t"));
    for (const char* operation :
         {"TaloCgiInit", "TaloCgiLoadInCookies", "TaloCgiDetectAndDecryptParamLine",
          "TaloCgiDecryptParam", "TALONdtokenGenerateToken", "GetDecryptAESString",
          "strPairToJsonObj", "TLIBCProcFork", "ReadJsonFile", "TLIBCFileExist"}) {
        bool reached = false;
        (void)ServeFailing(call, operation, 1, &reached);
        EXPECT_TRUE(reached) << operation;
    }
}

}  // namespace
