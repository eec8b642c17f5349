#ifndef TALO_HOSTS_LINUX_CGI_UPLOADREADER_H
#define TALO_HOSTS_LINUX_CGI_UPLOADREADER_H

#include <chrono>
#include <memory>
#include <string>

#include "hosts/linux/cgi/MultipartParser.h"
#include "hosts/linux/cgi/UploadForm.h"
#include "hosts/linux/cgi/UploadNames.h"
#include "platform/Cgi.h"

namespace host {

// The body of this process's request, read from standard input as far as it was
// asked for. It is one: what was read in a block lies here, and nowhere else.
class UploadReader {
  public:
    // Made at the first call, from the environment as it is then.
    static UploadReader& OfProcess();

    // The request is over: files that were not taken are gone, and the next call
    // makes another reader.
    static void Forget();

    // Reads up to where the form pauses, or to the end. TALO_UPLOAD_OK or, then and
    // ever after, why it failed; the files that were not taken are gone then.
    int Read(TALOCGIPROGRESS progress);

    // Takes note of a failure of its caller's; answers it.
    int Fail(int result, const std::string& reason);

    // 1, or the failure.
    int Result() const {
        return result_;
    }
    UploadForm& Form() {
        return form_;
    }
    // Those that the body's files have.
    UploadNames& Names() {
        return names_;
    }
    unsigned long long Total() const {
        return total_;
    }
    // Where the parser stands in the body, and where the last boundary line ended.
    unsigned long long Offset() const {
        return parser_->Offset();
    }
    unsigned long long BoundaryEnd() const {
        return parser_->BoundaryEnd();
    }

  private:
    UploadReader();
    static std::unique_ptr<UploadReader>& Current();
    bool Begin(std::string* reason);
    int ReadBlocks(TALOCGIPROGRESS progress);
    bool Fill();
    int FailAs(MultipartParser::Result why);
    void Report(TALOCGIPROGRESS progress);

    const MultipartLimits limits_;
    UploadForm form_;
    UploadNames names_;
    std::unique_ptr<MultipartParser> parser_;
    std::unique_ptr<char[]> block_;
    size_t at_ = 0;
    size_t filled_ = 0;
    unsigned long long received_ = 0;
    unsigned long long total_ = 0;
    int result_ = TALO_UPLOAD_OK;
    std::chrono::steady_clock::time_point reported_;
};

}  // namespace host

#endif
