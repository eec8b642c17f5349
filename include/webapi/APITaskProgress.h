#ifndef WEBAPI_APITASKPROGRESS_H
#define WEBAPI_APITASKPROGRESS_H

#include <string>

#include "webapi/APIExport.h"

namespace TALO {

class APIRequest;
class APITaskProgressPrivate;

/// How far a background task has come, for those who watch it: a percentage, a
/// line of text, and a log. The work function makes one on its stack.
///
///     void Index(APIRequest* request, APIResponse* response, void* argument) {
///         APITaskProgress progress(request);
///         for (size_t i = 0; i < files.size(); ++i) {
///             progress.SetPercent(100.0 * i / files.size());
///             progress.SetText(files[i].name);
///             Add(files[i]);
///         }
///         response->SetSuccess(Json::Value());
///     }
///
/// It may be told as often as is convenient: the record is written ten times a
/// second at most, and what was told last always arrives, within a tenth of a
/// second or at the latest when the object goes. The record's property
/// "progress" then holds "percent" (null until told), "text", "log" (the last
/// lines, an array of texts), "log_first" (the number of lines before them) and
/// "time" (of the writing, seconds since the epoch).
///
/// In a request that is no background task it does nothing. Failures of the task
/// manager are not reported: the next writing tries again.
class WEBAPI_EXPORT APITaskProgress {
  public:
    /// Lines that the log keeps, and bytes that one line, or the text, keeps.
    static constexpr int kMaxLogLines = 500;
    static constexpr int kMaxTextBytes = 1024;

    explicit APITaskProgress(APIRequest* request);
    /// Writes what has not been written yet.
    ~APITaskProgress();
    APITaskProgress(const APITaskProgress&) = delete;
    APITaskProgress& operator=(const APITaskProgress&) = delete;

    /// From 0 to 100: what lies outside is moved to the nearer end, and what is
    /// no number is ignored.
    void SetPercent(double percent);

    /// What is being done. Longer texts are cut.
    void SetText(const std::string& text);

    /// Adds a line; the oldest go when there are too many.
    void AddLog(const std::string& line);

  private:
    APITaskProgressPrivate* d;
};

}  // namespace TALO

#endif
