#include "hosts/linux/cgi/UploadForm.h"

#include <errno.h>
#include <string.h>

#include "hosts/linux/cgi/HeaderParameters.h"
#include "hosts/linux/cgi/UploadSweep.h"
#include "platform/Cgi.h"
#include "platform/System.h"

namespace host {

namespace {

constexpr int kErrorNoSpace = 10496;

// A part whose bytes are not its content would be handed on as if they were.
bool IsPlainlyEncoded(const PartHeaders& headers) {
    const char name[] = "content-transfer-encoding";
    std::string encoding;
    if (!HasHeader(headers, name)) {
        return true;
    }
    if (!OnlyHeader(headers, name, &encoding)) {
        return false;
    }
    encoding = LowerCase(encoding);
    return encoding == "binary" || encoding == "8bit" || encoding == "7bit";
}

}  // namespace

MultipartSink::Answer UploadForm::OnPartBegin(const PartHeaders& headers) {
    std::string disposition;
    if (!OnlyHeader(headers, "content-disposition", &disposition) ||
        !ParseContentDisposition(disposition, &part_)) {
        return Refuse(TALO_UPLOAD_MALFORMED, "a part without an acceptable name");
    }
    if (!IsPlainlyEncoded(headers)) {
        return Refuse(TALO_UPLOAD_MALFORMED, "a part in a transfer encoding");
    }
    if (!part_.isFile || part_.fileName.empty()) {
        kind_ = part_.isFile ? Kind::kUnchosen : Kind::kField;
        text_.clear();
        return Answer::kGoOn;
    }
    kind_ = Kind::kPending;
    peek_ = {nullptr, 0};
    pendingEnded_ = false;
    if (dir_.empty()) {
        return Answer::kPause;
    }
    return StorePending(dir_) ? Answer::kGoOn : Answer::kRefuse;
}

MultipartSink::Answer UploadForm::OnData(const char* data, size_t size) {
    switch (kind_) {
        case Kind::kField:
            return AddText(data, size);
        case Kind::kPending:
            peek_ = {data, size};
            return Answer::kPause;
        case Kind::kStoring:
            return file_->Write(data, size) ? Answer::kGoOn : CannotStore();
        case Kind::kUnchosen:
        case Kind::kNone:
            break;
    }
    return Refuse(TALO_UPLOAD_MALFORMED, "a file without a name");
}

MultipartSink::Answer UploadForm::OnPartEnd() {
    switch (kind_) {
        case Kind::kField:
            return EndField();
        case Kind::kPending:
            pendingEnded_ = true;
            return Answer::kPause;
        case Kind::kStoring:
            return EndFile();
        case Kind::kUnchosen:
        case Kind::kNone:
            break;
    }
    kind_ = Kind::kNone;
    return Answer::kGoOn;
}

bool UploadForm::StorePending(const std::string& dir) {
    SweepUploads(dir);
    file_ = UploadFile::Create(dir);
    if (file_ == nullptr || !file_->Write(peek_.first, peek_.second)) {
        (void)CannotStore();
        return false;
    }
    peek_ = {nullptr, 0};
    kind_ = Kind::kStoring;
    return !pendingEnded_ || EndFile() == Answer::kGoOn;
}

void UploadForm::DropPending() {
    kind_ = Kind::kNone;
    pendingEnded_ = false;
}

std::vector<UploadForm::Field> UploadForm::TakeFields() {
    std::vector<Field> taken;
    taken.swap(fields_);
    return taken;
}

std::vector<UploadForm::Stored> UploadForm::TakeStored() {
    std::vector<Stored> taken;
    taken.swap(stored_);
    return taken;
}

void UploadForm::Discard() {
    kind_ = Kind::kNone;
    file_.reset();
    stored_.clear();
}

MultipartSink::Answer UploadForm::AddText(const char* data, size_t size) {
    if (size > limits_.fieldBytes - text_.size() || size > limits_.allFieldsBytes - fieldBytes_) {
        return Refuse(TALO_UPLOAD_LIMIT, "too much text in fields");
    }
    if (memchr(data, '\0', size) != nullptr) {
        return Refuse(TALO_UPLOAD_MALFORMED, "a field with NUL");
    }
    text_.append(data, size);
    fieldBytes_ += size;
    return Answer::kGoOn;
}

MultipartSink::Answer UploadForm::EndField() {
    fields_.emplace_back(part_.name, text_);
    kind_ = Kind::kNone;
    const bool last = fieldsLeft_ > 0 && --fieldsLeft_ == 0;
    return last ? Answer::kPause : Answer::kGoOn;
}

MultipartSink::Answer UploadForm::EndFile() {
    if (!file_->Close()) {
        return CannotStore();
    }
    stored_.push_back({part_.name, part_.fileName, std::move(file_)});
    kind_ = Kind::kNone;
    pendingEnded_ = false;
    return Answer::kGoOn;
}

// errno has the reason.
MultipartSink::Answer UploadForm::CannotStore() {
    const int error = errno;
    if (error == ENOSPC || error == EDQUOT) {
        TLIBCErrSet(kErrorNoSpace);
    }
    return Refuse(TALO_UPLOAD_STORE, std::string("cannot store a file: ") + strerror(error));
}

MultipartSink::Answer UploadForm::Refuse(int problem, const std::string& reason) {
    problem_ = problem;
    reason_ = reason;
    return Answer::kRefuse;
}

}  // namespace host
