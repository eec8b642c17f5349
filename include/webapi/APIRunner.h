#ifndef WEBAPI_APIRUNNER_H
#define WEBAPI_APIRUNNER_H

#include <json/json.h>

#include <functional>
#include <map>
#include <string>

#include "webapi/APIExport.h"
#include "webapi/APITable.h"

namespace TALO {

class APIRequest;
class APIResponse;
class APIRunnerPrivate;

/// The dispatcher: finds the description of the API that a request names, checks
/// the request against it, loads the API library, and calls the method. A runner
/// serves one top-level request and owns its request and response.
///
/// Any program can run one method in-process:
///
///     Json::Value out;
///     APIRunner::Exec(out, "TALO.System", 2, "ping", params, "admin");
///     if (out["success"].asBool()) Use(out["data"]);
///
/// Operations answer nonzero for success. Errors meant for the client are put
/// on the response. Process-wide state (name, priority, standard streams) is
/// changed while a request runs and put back; use it from one thread only, and
/// end its life as the type it was made: the destructor is not virtual.
class WEBAPI_EXPORT APIRunner {
  public:
    APIRunner();
    ~APIRunner();
    APIRunner(const APIRunner&) = delete;
    APIRunner& operator=(const APIRunner&) = delete;

    /// Runs the request that the document describes: "environ", "session",
    /// "attr", "getParam", "postParam". The outcome is in the response; the
    /// result carries no meaning. Throws nothing.
    virtual int Run(const Json::Value& document);

    /// Fills the request from the process environment and the document.
    virtual int Initialize(const Json::Value& document);

    /// The hooks that a front end overrides: whether the API needs a permission,
    /// whether the caller has it (the hook sets its error), what to do with an
    /// upload's body, and whether a refused permission is let pass all the same.
    virtual bool NeedPermission(APIRequest* request);
    virtual bool CheckPermission(APIRequest* request, APIResponse* response);
    virtual bool HandleUpload(APIRequest* request, APIResponse* response);
    virtual bool SkipPermission(APIRequest* request);

    /// Dispatches one request: name, description, library, method. ProcessLib and
    /// ProcessEntry are its two halves, for API libraries and for the framework's
    /// own compound API.
    int Process(APIRequest* request, APIResponse* response);
    int ProcessLib(APIRequest* request, APIResponse* response);
    int ProcessEntry(APIRequest* request, APIResponse* response);
    int HandleCompound(APIRequest* request, APIResponse* response);

    /// Checks API name, version and method against the descriptions.
    int CheckRequestParam(APIRequest* request, APIResponse* response);

    /// Copies the API's description into the request; 0 when none is loaded.
    int AddAPIInfo(APIRequest* request);

    /// Names the process after the request: log identity, argument vector, task.
    int SetProcessName(APIRequest* request, APIResponse* response);

    /// Lends the program's argument vector, whose first entry then shows the
    /// request. It must outlive the runner.
    void SetArgs(int argc, char** argv);

    /// Copies the process environment into an object.
    int InitEnv(Json::Value& environ);

    /// The result document with the member "httpd_restart" added.
    Json::Value GetResponse();

    /// Runs one method in-process as `user`, without any permission check, and
    /// leaves its result document in `out`. Null `api`, `method` or `user`: 101.
    /// Restores the working directory; throws nothing. Enciphered parameters in
    /// `params` are read, and what they hold wins, even over `api` and `method`: of
    /// an object that a client wrote, pass on the members that are meant.
    static void Exec(Json::Value& out, const char* api, int version, const char* method,
                     const Json::Value& params, const Json::Value& attrs, const char* user);
    static void Exec(Json::Value& out, const char* api, int version, const char* method,
                     const Json::Value& params, const char* user);

    /// Descriptions. The first two load the file that holds one API into `descs`
    /// unless it is there; the third loads every "*.lib" of the working directory.
    int InitLibDesc(Json::Value& descs, const std::string& api);
    int InitLibDesc(Json::Value& descs, APIRequest* request);
    int InitLibDesc(Json::Value& descs);

    /// For who needs one description after the other and not all at once: calls
    /// `visit` with the name and the description of each API of every "*.lib" of the
    /// working directory. The description is the visitor's to change or to swap away.
    /// Of an API that two files describe, the last one counts elsewhere.
    typedef std::function<void(const std::string& api, Json::Value& desc)> DescVisitor;
    int VisitLibDesc(const DescVisitor& visit);

    int CheckLibDescription(Json::Value& desc);
    Json::Value& ApplyLibDef(Json::Value& desc);

    /// The attributes of a method, or the site's defaults. The reference lives
    /// until the next call of this operation.
    Json::Value& GetMethod(const std::string& api, int version, const std::string& method);
    bool GetMethodAttr(const std::string& api, int version, const std::string& method,
                       const std::string& attr);
    bool GetMethodAttr(APIRequest* request, const std::string& attr);

    /// Opens the API library of the request, once per path, and fetches its
    /// tables; `checkTable` may be null. Tables stay valid until CloseLib.
    int OpenLib(APIRequest* request, _tag_API_TABLE** table, _tag_API_CHECK_TABLE** checkTable);
    int GetTableFunc(void* handle, _tag_API_TABLE** table);
    int GetCheckTableFunc(void* handle, _tag_API_CHECK_TABLE** checkTable);
    void CloseLib();

  protected:
    Json::Value libDef;
    Json::Value libDesc;
    APIRequest* request;
    APIResponse* response;
    std::map<std::string, void*> libHandles;
    int compoundDepth;
    APIRunnerPrivate* d;

  private:
    bool RunElement(APIRequest* element, APIResponse* answer, APIResponse* response);
};

}  // namespace TALO

#endif
