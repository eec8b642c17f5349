#ifndef WEBAPI_WEBENTRY_H
#define WEBAPI_WEBENTRY_H

#include <json/json.h>
#include <signal.h>

#include <string>

#include "webapi/APIExport.h"
#include "webapi/APIRunner.h"

struct TALOCGI;

namespace TALO {

/// The CGI front: made once per HTTP request and driven with one call. It reads
/// the CGI environment and the parameters, dispatches the request, writes header
/// block and body to standard output, and runs the response's callbacks in a
/// detached process.
///
///     int main(int argc, char** argv) {
///         TALO::WebEntry entry;
///         entry.SetArgs(argc, argv);
///         entry.Run(Json::Value());
///         return 0;
///     }
///
/// The working directory is expected to be the web API directory. Nothing throws.
class WEBAPI_EXPORT WebEntry : public APIRunner {
  public:
    /// The largest body of a request that is no upload; a longer one is 101
    /// before anything is allocated. It bounds the memory that one client takes.
    static constexpr long long kMaxBodyBytes = 16LL << 20;

    WebEntry();
    ~WebEntry();

    /// Serves the request. The argument is not used. The result is that of
    /// HandleCallback.
    int Run(const Json::Value& args) override;
    int Initialize(const Json::Value& args) override;
    bool NeedPermission(APIRequest* request) override;
    bool CheckPermission(APIRequest* request, APIResponse* response) override;
    bool HandleUpload(APIRequest* request, APIResponse* response) override;
    bool SkipPermission(APIRequest* request) override;

    /// The session check alone: 0, 105, 106 or 119. Asks the platform once for
    /// each variant; the session's facts go to the entry's own request.
    int CheckPermission(bool allowTimeout);

    /// Whether the "allowUser" list of the request's API has the class of the
    /// entry's caller. An API without a list admits nobody.
    bool CheckAllowUser(APIRequest* request, const char* userName);

    /// Read the parameters into "getParam" and "postParam" of a document.
    bool InitParam(Json::Value& document);
    bool InitGetParam(Json::Value& getParam);
    bool InitPostParam(Json::Value& postParam);

    /// Reads the first three fields of an upload's body, which name the API where
    /// the query does not. From then on the request's "CONTENT_LENGTH" is that of
    /// the rest.
    bool LoadUploadAPIDesc(Json::Value& postParam);

    /// Splits and decodes one parameter line into an object, carriers of
    /// enciphered parameters included.
    bool DetectAndDecryptParamLine(const std::string& line, Json::Value& params);
    bool DecryptParam(const std::string& text, Json::Value& params);
    bool DecryptAESParam(Json::Value& params);

    /// Forwards the request to the appliance that "relay_nd" names, an integer or
    /// its decimal text, and writes that appliance's answer to standard output as it
    /// came, behind the header block of this one. The call is checked against the
    /// descriptions here (101 to 104, 115, 116) and needs a session (105, 106, 119),
    /// which may have timed out where the API's description has "skipTimeout";
    /// whether the user may call the method is for the target to say. Neither
    /// "relay_nd" nor "relay_timeout", seconds to wait when above 0, is forwarded.
    /// The body of an upload passes through unread; one that names its API in the
    /// body, of which a part was read here, is 109.
    ///
    /// True when an answer was written: the response's output is off then. False
    /// with an error on the response: one of the above, 101 for a "relay_nd" that is
    /// no integer, 109 when the call could not be queued or failed.
    bool ProcessRelay(APIRequest* request, APIResponse* response);

    /// Write to standard output.
    void OutputHeader();
    void OutputBody();

    /// Lends a mark that is set to 1 right before the first byte of a reply can
    /// leave: before the header block is written, and before a method runs that may
    /// write the reply by itself ("allowDownload"). Until then somebody else, such as
    /// a handler of a crash, can still answer. It counts for every entry of this
    /// process from now on, not for processes forked from it, and has to last until
    /// another one, or null for none, takes its place. Clearing it is the lender's.
    static void WatchAnswer(volatile sig_atomic_t* begun);

    /// Runs the callbacks in a child. 0 when there are none, else the child's id,
    /// negative when it could not be started.
    int HandleCallback(APIResponse* response);

  private:
    void AdoptSessionParameter();
    void RenewSession(APIRequest* request, bool allowTimeout);

    Json::Value uploadFiles;
    TALOCGI* cgiContext;
    Json::Value permissionCache;
};

}  // namespace TALO

#endif
