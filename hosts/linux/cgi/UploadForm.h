#ifndef TALO_HOSTS_LINUX_CGI_UPLOADFORM_H
#define TALO_HOSTS_LINUX_CGI_UPLOADFORM_H

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "hosts/linux/cgi/ContentDisposition.h"
#include "hosts/linux/cgi/MultipartLimits.h"
#include "hosts/linux/cgi/MultipartParser.h"
#include "hosts/linux/cgi/UploadFile.h"

namespace host {

// The parts of a body as a form: fields are gathered, a file part is either
// stored in a folder or left pending, which pauses the parser.
class UploadForm : public MultipartSink {
  public:
    using Field = std::pair<std::string, std::string>;
    struct Stored {
        std::string name;      // of the form field
        std::string fileName;  // the client's
        std::unique_ptr<UploadFile> file;
    };

    explicit UploadForm(const MultipartLimits& limits) : limits_(limits) {}

    // From now on file parts go to this folder; "" leaves them pending.
    void SetFolder(const std::string& dir) {
        dir_ = dir;
    }
    // Pauses once this many more fields are complete; 0 for never.
    void PauseAfterFields(int count) {
        fieldsLeft_ = count;
    }

    // The pending part, null for none.
    const ContentDisposition* Pending() const {
        return kind_ == Kind::kPending ? &part_ : nullptr;
    }
    // Whether a pending part's begin was looked at (feeding the parser on does
    // that), and whether it has no content.
    bool IsPeeked() const {
        return peek_.second != 0 || pendingEnded_;
    }
    bool IsPendingEmpty() const {
        return pendingEnded_;
    }
    // Stores the pending part in that folder, once the parser is fed on to its end.
    // False on failure, as when the parser is refused.
    bool StorePending(const std::string& dir);
    // Passes over a pending part without content.
    void DropPending();

    bool IsStoring() const {
        return kind_ == Kind::kStoring;
    }

    // What was gathered since the last call.
    std::vector<Field> TakeFields();
    std::vector<Stored> TakeStored();
    // Removes the files that are not taken.
    void Discard();

    // Why the parser was refused: a result of platform/Cgi.h and a text.
    int Problem() const {
        return problem_;
    }
    const std::string& Reason() const {
        return reason_;
    }

    Answer OnPartBegin(const PartHeaders& headers) override;
    Answer OnData(const char* data, size_t size) override;
    Answer OnPartEnd() override;

  private:
    enum class Kind { kNone, kField, kUnchosen, kPending, kStoring };

    Answer Refuse(int problem, const std::string& reason);
    Answer AddText(const char* data, size_t size);
    Answer EndField();
    Answer CannotStore();
    Answer EndFile();

    const MultipartLimits limits_;
    std::string dir_;
    int fieldsLeft_ = 0;
    Kind kind_ = Kind::kNone;
    ContentDisposition part_;
    std::string text_;
    size_t fieldBytes_ = 0;
    std::pair<const char*, size_t> peek_ = {nullptr, 0};
    bool pendingEnded_ = false;
    std::unique_ptr<UploadFile> file_;
    std::vector<Field> fields_;
    std::vector<Stored> stored_;
    int problem_ = 0;
    std::string reason_;
};

}  // namespace host

#endif
