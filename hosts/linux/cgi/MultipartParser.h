#ifndef TALO_HOSTS_LINUX_CGI_MULTIPARTPARSER_H
#define TALO_HOSTS_LINUX_CGI_MULTIPARTPARSER_H

#include <cstddef>
#include <string>

#include "hosts/linux/cgi/MultipartLimits.h"
#include "hosts/linux/cgi/PartHeaders.h"

namespace host {

// Receives the parts of a body: a begin, data in pieces of any size, an end; then
// the next part. It does not see an end for the part in which a body breaks off.
class MultipartSink {
  public:
    enum class Answer {
        kGoOn,
        kPause,  // goes on with the next call of Feed
        kRefuse  // nothing more is read
    };

    virtual ~MultipartSink() {}
    virtual Answer OnPartBegin(const PartHeaders& headers) = 0;
    // The bytes live as long as what was fed; those of a boundary's look-alike that
    // came in two pieces live as long as the parser's next step. Never empty.
    virtual Answer OnData(const char* data, size_t size) = 0;
    virtual Answer OnPartEnd() = 0;
};

// Reads a multipart body (RFC 2046, RFC 7578) in pieces of any size:
//
//     MultipartParser parser(boundary, limits, &sink);
//     result = parser.Feed(data, size, &used);   // as long as it is kMore
//     result = parser.Finish();                  // kEnd: the body was whole
//
// A boundary line is CR LF (not needed at the begin of the body), "--", the
// boundary, up to kMaxBoundaryPadding blanks, CR LF; the last one has "--" behind
// the boundary, and what follows it is passed over. Bytes that only begin like
// that are data, except that nothing but the line's end may follow blanks. Bytes
// are neither copied nor held: the cost is that of one search.
class MultipartParser {
  public:
    enum class Result {
        kMore,       // all was taken
        kPaused,     // by the sink, after `used` bytes
        kEnd,        // the last boundary was read
        kRefused,    // by the sink
        kMalformed,  // no such body
        kLimit       // beyond a limit
    };

    // The sink outlives the parser.
    MultipartParser(const std::string& boundary, const MultipartLimits& limits,
                    MultipartSink* sink);

    // Whether a text can be a boundary: 1 to kMaxBoundary of RFC 2046's characters,
    // no blank at its end.
    static bool IsBoundary(const std::string& text);

    // Reads on. `used` gets the number of bytes read, all of them unless the sink
    // paused or something is wrong. A failure is answered again ever after.
    Result Feed(const char* data, size_t size, size_t* used);

    // Says that the body ends: kEnd or the failure.
    Result Finish();

    // Bytes read so far, and up to the end of the last boundary line.
    unsigned long long Offset() const {
        return offset_;
    }
    unsigned long long BoundaryEnd() const {
        return boundaryEnd_;
    }

  private:
    enum class State {
        kText,       // preamble, or a part's data
        kBoundary,   // behind "--boundary"
        kDash,       // behind "--boundary-"
        kLineEnd,    // behind "--boundary", CR
        kPadding,    // behind "--boundary "
        kPaddedEnd,  // behind "--boundary ", CR
        kHeaders,    // in a part's header lines
        kEpilogue,   // behind the last boundary line
        kFailed
    };

    const char* Step(const char* at, const char* end);
    const char* ReadText(const char* at, const char* end);
    const char* ReadMatch(const char* at, const char* end);
    const char* ReadBehindBoundary(const char* at);
    const char* ReadHeaders(const char* at, const char* end);
    void ReadPadding(char byte);
    void TakeBack(const char* more);
    void EmitText(const char* data, size_t size);
    void EndBoundaryLine(bool last);
    void BeginPart();
    void Heed(MultipartSink::Answer answer);
    void Fail(Result why);

    const std::string delimiter_;  // CR LF "--boundary"; a boundary has no CR
    const MultipartLimits limits_;
    MultipartSink* const sink_;
    State state_ = State::kText;
    Result result_ = Result::kMore;
    bool inPreamble_ = true;
    // The part of the delimiter that the text read so far ends with. Its first
    // `assumed_` bytes did not come, or were others' (a header's end).
    size_t matched_ = 2;
    size_t assumed_ = 2;
    size_t padding_ = 0;
    size_t preamble_ = 0;
    size_t parts_ = 0;
    std::string headers_;
    std::string lookAlike_;
    unsigned long long offset_ = 0;
    unsigned long long boundaryEnd_ = 0;
};

}  // namespace host

#endif
