#ifndef TESTS_FAKE_FAKEPLATFORM_H
#define TESTS_FAKE_FAKEPLATFORM_H

#include <json/json.h>

#include <cstdio>
#include <map>
#include <set>
#include <string>
#include <utility>
#include <vector>

// A stand-in for the appliance's platform that lives in memory. A test writes
// its files, names its administrators, makes the Nth call of an operation fail,
// and looks at what was asked for. Text functions follow the host's own rules.
namespace fake {

struct ServiceCall {
    int service;
    int action;
    int flags;
};

struct Session {
    std::string user;
    int result = 1;          // what the check answers
    int timeoutAllowed = 1;  // what it answers when timed-out sessions count
    std::map<int, std::string> options;
    std::string language = "enu";
    std::string file;  // what the context then names as the session's file
};

struct AuthCall {
    std::string sessionId;
    int checkMask;
    int allowTimeout;
    size_t nameSize;
    bool nameWasZero;
    int flags;
};

struct OptionCall {
    int option;
    std::string fallback;  // "(null)" for none
};

struct RemoteCall {
    size_t size;
    bool bufferWasZero;
};

struct UidCall {
    std::string sessionId;
    std::string user;
};

struct ContextCall {
    int timeout;
    int allowTimeout;
    std::string userClass;
    std::string prefix;
};

struct PrivilegeCall {
    std::string user;
    std::string privilege;
    std::string remoteIP;
};

// One call of TALONdtokenGenerateToken.
struct KeyCall {
    std::string token;
    size_t size;
    bool bufferWasZero;
};

struct TouchCall {
    std::string path;
    int now;
    long when;
};

// One call of either HTTPFileOutputer::Output: by file, or by path.
struct OutputCall {
    FILE* file;
    std::string path;
    std::string fileName;
    std::string mimeType;
};

// What the readers of a multipart body find in it.
struct UploadScript {
    using Texts = std::map<std::string, std::string>;
    Texts params;       // fields that LoadUploadAll and LoadUploadParams find
    Texts files;        // what LoadUploadAll stores, name to path: they are then files
    int allResult = 1;  // what LoadUploadAll answers, whatever it has stored

    int paramsResult = 1;  // what LoadUploadParams answers; above 0 it finds the fields
    int paramsStatus = 1;  // and the status that it leaves
    std::string fileName;  // the file part that it leaves pending
    std::string fieldName;
    std::string fieldValue;
    unsigned long long partSize = 0;

    Texts stored;        // what LoadUploadFileToDir then adds to the context's hash
    int fileResult = 1;  // what it answers, and its status

    Texts firstFields;  // what LoadUploadNumParams finds
    // The whole body's size and what is read of it, told to all who ask.
    std::pair<unsigned long long, unsigned long long> counters = {0, 0};
};

// One call of a TaloCgiLoadUpload operation. The sizes of buffers, and the number
// of fields asked for, stand in the texts' places.
struct UploadCall {
    std::string operation;
    std::string dir;
    int flags;
    std::string fileName;
    std::string fieldName;
    std::string fieldValue;
    bool hasProgress;
};

struct VolumeCall {
    unsigned long long size;
    int status;  // as the caller left it
    int flags;
    bool recordWasZero;
};

// A file system as statvfs tells it.
struct FileSystem {
    unsigned long long freeBlocks = 0;       // for everybody,
    unsigned long long availableBlocks = 0;  // for an ordinary process
    unsigned long fragmentSize = 4096;
    unsigned long blockSize = 4096;
};

struct FolderCall {
    std::string path;
    int flags;
    int parents;
    int uid;
    int gid;
    unsigned mode;
};

struct Platform {
    std::map<std::string, std::string> files;            // path to content
    std::set<std::string> administrators;                // user names
    std::map<std::string, std::string> userPreference;   // user to folder
    std::map<std::string, std::string> groupPreference;  // group to folder

    // "sealed:LINE" stands for a line under the appliance's own cipher, which opens
    // it once; "under TOKEN:LINE" for one under the key of a token, "key of TOKEN".
    std::set<std::string> sealedLinesSeen;
    int cipherResult = 1;                   // what a success of the former answers
    int keyResult = 0;                      // and one of TALONdtokenGenerateToken
    std::vector<std::string> detectCalls;   // calls of TaloCgiDetectAndDecryptParamLine
    std::vector<std::string> decryptCalls;  // calls of TaloCgiDecryptParam
    std::vector<KeyCall> keyCalls;          // calls of TALONdtokenGenerateToken
    std::vector<std::pair<std::string, std::string>> textCalls;  // key, text: GetDecryptAESString

    std::map<std::string, Session> sessions;  // by id
    std::string sessionDir = "/session";
    int defaultTimeout = 30;
    int skipIPCheck = 0;
    int configuredTimeout = 15;        // TLIBCConfGetORBTimeout
    std::string remoteAddress;         // "" makes TaloCgiGetRemoteIP fail
    std::map<std::string, int> uids;   // user to id
    std::set<std::string> privileges;  // "user/privilege"

    std::vector<AuthCall> authCalls;                // calls of TaloCgiIsAuthorizedEx
    std::vector<ContextCall> contextCalls;          // calls of TaloCgiInitEx
    std::vector<OptionCall> optionCalls;            // calls of TaloCgiGetOption
    std::vector<RemoteCall> remoteCalls;            // calls of TaloCgiGetRemoteIP
    std::vector<UidCall> uidCalls;                  // calls of TaloCgiUIDGet
    std::vector<PrivilegeCall> privilegeCalls;      // calls of TLIBAppPrivUserHas
    std::vector<TouchCall> touched;                 // calls of TLIBCFileUTime
    std::vector<ServiceCall> services;              // calls of TLIBNetService
    std::vector<std::string> unlinked;              // paths given to TLIBCSysUnlink
    std::vector<std::string> cookiesRead;           // HTTP_COOKIE at each TaloCgiLoadInCookies
    std::string mimeType = "fake/type";             // what HTTPFileOutputer::GetMimeType answers
    std::vector<std::string> mimeTypeCalls;         // the names that it was asked about
    std::vector<OutputCall> outputCalls;            // calls of HTTPFileOutputer::Output
    std::string outputMarker;                       // what Output writes to standard output,
    bool outputByDescriptor = false;                // past stdio's buffer or into it,
    int outputResult = 0;                           // and what it then answers
    UploadScript upload;                            // what a multipart body holds
    std::vector<UploadCall> uploadCalls;            // calls of TaloCgiLoadUpload...
    std::string volume;                             // mount path that VolumeAvailGet finds, "" none
    unsigned long long volumeFree = 0;              // and its free bytes
    int volumeAnswer = 1;                           // what it then answers
    std::vector<VolumeCall> volumeCalls;            // calls of VolumeAvailGet
    std::map<std::string, FileSystem> fileSystems;  // what statvfs says of these paths
    std::vector<std::string> fileSystemCalls;       // those of them that it was asked about
    std::vector<FolderCall> foldersMade;            // calls of TALOFSMkdirP
    // What the tests of addresses and names answer for a text, in place of the
    // host's rules, by operation and text; and all that they were asked.
    std::map<std::pair<std::string, std::string>, int> nameAnswers;
    std::vector<std::pair<std::string, std::string>> nameCalls;
    std::vector<int> errors;           // codes given to TLIBCErrSet
    std::vector<int> hashCapacities;   // asked of TLIBCSzHashAlloc
    int openHashes = 0;                // allocated and not yet freed
    int openContexts = 0;              // TaloCgiInit less TaloCgiFree
    std::vector<std::string> journal;  // every operation by name, in order

    std::map<std::string, int> calls;   // operation to number of calls
    std::map<std::string, int> failAt;  // operation to the call that fails, counted from 1

    // Makes the Nth call from now of an operation fail, by its name.
    void FailCall(const std::string& operation, int nth);

    // Writes a JSON document as a file.
    void WriteJson(const std::string& path, const Json::Value& document);

    // Counts a call; true when this one is to fail.
    bool Called(const std::string& operation);
};

// The platform of this process.
Platform& Now();

// Back to an empty machine.
void Reset();

}  // namespace fake

#endif
