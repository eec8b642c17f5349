#include <sys/mman.h>

#include <optional>
#include <string>
#include <vector>

#include "src/base/ErrorCode.h"
#include "tests/entry/UploadRequestFixture.h"

// Every operation that an upload uses fails once, at each of its uses: the reply
// stays a proper one and nothing is left behind.

namespace {

const char* const kOperations[] = {"TaloCgiInit",
                                   "TaloCgiLoadInCookies",
                                   "TaloCgiDetectAndDecryptParamLine",
                                   "strPairToJsonObj",
                                   "ReadJsonFile",
                                   "TLIBCFileExist",
                                   "TLIBCFileCheckKeyValue",
                                   "VolumeAvailGet",
                                   "TALOFSMkdirP",
                                   "statvfs",
                                   "TLIBCSzHashAlloc",
                                   "SzHashToJsonObj",
                                   "TaloCgiLoadUploadNumParams",
                                   "TaloCgiLoadUploadAll",
                                   "TaloCgiLoadUploadParams",
                                   "TaloCgiLoadUploadFileToDir",
                                   "TLIBCSysUnlink"};

// What the process that served says of itself.
struct Leftovers {
    int uses;
    int hashes;
    int contexts;
    int files;     // that nobody tried to delete
    int unlinked;  // attempts to delete one
};

class UploadFaultSweep : public UploadRequestTest {
  protected:
    UploadFaultSweep() {
        Script().params = {{"text", "hello"}};
        Script().files = {{"file", "/volume1/@tmp/x"}, {"second", "/volume1/@tmp/y"}};
        Script().fileName = Script().fieldValue = "a.txt";
        Script().fieldName = "file";
        Script().partSize = 10;
        Script().stored = {{"file", "/volume1/@tmp/z"}};
        NameInBody("upload");
        fake::FileSystem roomy;
        roomy.freeBlocks = 1 << 18;
        fake::Now().fileSystems = {{"/tmp", roomy}, {"/", roomy}};
    }

    // The requests of the sweep: with the API in the query and in the body, read by
    // the entry and by the method; with a volume and without.
    static std::vector<Call> Calls() {
        return {UploadTo("upload"), Upload(""), UploadTo("reading"),
                UploadTo("upload").With("HTTP_X_TYPE_NAME", "SLICEUPLOAD")};
    }

    static Reply ServeFailing(const Call& call, const std::string& operation, int nth,
                              Leftovers* leftovers) {
        void* shared = mmap(nullptr, sizeof(Leftovers), PROT_READ | PROT_WRITE,
                            MAP_SHARED | MAP_ANONYMOUS, -1, 0);
        auto* seen = static_cast<Leftovers*>(shared);
        const std::string output = Inside(call, [&](ProbeEntry&) {
            const int contexts = fake::Now().openContexts;
            fake::Now().calls[operation] = 0;
            fake::Now().FailCall(operation, nth);
            std::optional<ProbeEntry> entry;
            entry.emplace();
            (void)entry->Run(Json::Value());
            entry.reset();
            seen->uses = fake::Now().calls[operation];
            seen->hashes = fake::Now().openHashes;
            seen->contexts = fake::Now().openContexts - contexts;
            for (const auto& file : Script().files) {
                seen->files += static_cast<int>(fake::Now().files.count(file.second));
            }
            seen->unlinked = static_cast<int>(fake::Now().unlinked.size());
        });
        *leftovers = *seen;
        (void)munmap(shared, sizeof(Leftovers));
        Reply reply;
        const size_t end = output.find("\r\n\r\n");
        reply.headers = output.substr(0, end);
        reply.bodyText = end == std::string::npos ? "" : output.substr(end + 4);
        Json::Reader reader(Json::Features::strictMode());
        reply.wellFormed = reader.parse(reply.bodyText, reply.body) && reply.body.isObject();
        return reply;
    }

    static bool IsOfTheQuery(const std::string& operation) {
        return operation == "TaloCgiDetectAndDecryptParamLine" || operation == "strPairToJsonObj";
    }

    static void Sweep() {
        for (const char* operation : kOperations) {
            for (const Call& call : Calls()) {
                Leftovers left = {};
                int nth = 0;
                do {
                    ++nth;
                    const Reply reply = ServeFailing(call, operation, nth, &left);
                    EXPECT_TRUE(reply.wellFormed) << operation << nth << ": " << reply.bodyText;
                    EXPECT_EQ(reply.headers.find("Content-type: "), 0u) << operation << nth;
                    // Only a query that cannot be read is answered without a code.
                    const bool mute = reply.bodyText == "{}" && IsOfTheQuery(operation);
                    EXPECT_TRUE(mute || reply.Code() != -1)
                        << operation << nth << ": " << reply.bodyText;
                    EXPECT_EQ(left.hashes, 0) << operation << nth;
                    EXPECT_EQ(left.contexts, 0) << operation << nth;
                    // One that could not be deleted was tried.
                    const bool deleting = std::string(operation) == "TLIBCSysUnlink";
                    EXPECT_EQ(left.files, deleting && nth <= left.uses ? 1 : 0) << operation << nth;
                    EXPECT_TRUE(left.unlinked == 0 || left.unlinked == 2) << operation << nth;
                } while (left.uses >= nth);
            }
        }
    }
};

TEST_F(UploadFaultSweep, LeavesAProperReplyAndNoFileWhateverFails) {
    Sweep();
}

TEST_F(UploadFaultSweep, LeavesAProperReplyAndNoFileWithoutAVolume) {
    fake::Now().volume = "";
    Sweep();
}

// The sweep would prove nothing if the operations were not used at all.
TEST_F(UploadFaultSweep, ReachesTheOperationsOfAnUpload) {
    for (const char* operation : kOperations) {
        fake::Now().volume = std::string(operation) == "statvfs" ? "" : "/volume1";
        int uses = 0;
        for (const Call& call : Calls()) {
            Leftovers left = {};
            (void)ServeFailing(call, operation, 1, &left);
            uses += left.uses;
        }
        EXPECT_GE(uses, 1) << operation;
    }
}

// What a client is told when one thing fails.
TEST_F(UploadFaultSweep, TellsWhyAnUploadFailed) {
    struct Row {
        const char* operation;
        const char* error;
    };
    const Row rows[] = {
        {"TaloCgiLoadUploadAll", R"({"code":108,"errors":{"upload_err":-1}})"},
        {"TLIBCSzHashAlloc", R"({"code":108,"errors":{"upload_err":-9}})"},
        {"SzHashToJsonObj", R"({"code":108,"errors":{"upload_err":-9}})"},
    };
    for (const Row& row : rows) {
        Leftovers left = {};
        EXPECT_EQ(ServeFailing(UploadTo("upload"), row.operation, 1, &left).bodyText,
                  std::string(R"({"error":)") + row.error + R"(,"success":false})")
            << row.operation;
    }
}

}  // namespace
