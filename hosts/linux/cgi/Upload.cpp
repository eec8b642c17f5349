#include <string.h>

#include <map>
#include <string>

#include "hosts/linux/cgi/UploadNames.h"
#include "hosts/linux/cgi/UploadReader.h"
#include "hosts/linux/util/SzHash.h"
#include "platform/Cgi.h"
#include "platform/System.h"

namespace {

using host::UploadForm;
using host::UploadNames;
using host::UploadReader;

using Entries = std::vector<UploadForm::Field>;

// A folder's name without the final slash that the file's would get.
std::string FolderOf(const char* dir) {
    std::string folder = dir;
    while (folder.size() > 1 && folder.back() == '/') {
        folder.pop_back();
    }
    return folder;
}

bool Fits(const TALOSZHASH* hash, size_t more) {
    return (hash != nullptr ? hash->entries.size() : 0) + more <= host::kMaxHashEntries;
}

bool MakeHash(TALOSZHASH** hash) {
    if (*hash == nullptr) {
        *hash = TLIBCSzHashAlloc(0);
    }
    return *hash != nullptr;
}

void Pour(const Entries& entries, TALOSZHASH* hash) {
    for (const auto& entry : entries) {
        (void)host::HashSet(hash, entry.first, entry.second);
    }
}

void AddFacts(const std::string& name, const UploadForm::Stored& stored, Entries* entries) {
    entries->emplace_back(UploadNames::FileNameOf(name), stored.fileName);
    entries->emplace_back(UploadNames::SizeOf(name), std::to_string(stored.file->Size()));
}

int LoadAll(UploadReader& reader, TALOSZHASH** params, TALOSZHASH** files, const char* dir) {
    UploadForm& form = reader.Form();
    if (reader.Result() != TALO_UPLOAD_OK) {
        return reader.Result();
    }
    const std::string folder = FolderOf(dir);
    if (form.Pending() != nullptr && !form.StorePending(folder)) {
        return reader.Fail(form.Problem(), form.Reason());
    }
    form.SetFolder(folder);
    if (reader.Read(nullptr) != TALO_UPLOAD_OK) {
        return reader.Result();
    }
    auto stored = form.TakeStored();
    Entries paths;
    Entries facts;
    for (const auto& file : stored) {
        const std::string name = reader.Names().Take(file.name);
        paths.emplace_back(name, file.file->Path());
        AddFacts(name, file, &facts);
    }
    auto fields = form.TakeFields();
    reader.Names().DropTaken(&fields);
    if (!Fits(*params, fields.size() + facts.size()) || !Fits(*files, paths.size())) {
        return reader.Fail(TALO_UPLOAD_LIMIT, "too many fields and files");
    }
    if (!MakeHash(params) || !MakeHash(files)) {
        return reader.Fail(TALO_UPLOAD_MEMORY, "no memory");
    }
    Pour(fields, *params);
    Pour(facts, *params);
    Pour(paths, *files);
    for (const auto& file : stored) {
        file.file->Keep();
    }
    return TALO_UPLOAD_OK;
}

// Reads up to the next file part that somebody chose, or to the end.
int ReadToFile(UploadReader& reader, TALOCGIPROGRESS progress) {
    UploadForm& form = reader.Form();
    // One without content was told before; nobody can store it.
    if (form.Pending() != nullptr && form.IsPendingEmpty()) {
        form.DropPending();
    }
    form.SetFolder("");
    form.PauseAfterFields(0);
    return form.Pending() != nullptr ? reader.Result() : reader.Read(progress);
}

// Where a text is to be written; what does not fit is not written.
struct Buffer {
    char* text;
    size_t size;

    bool Takes(const std::string& content) const {
        return text != nullptr && content.size() < size;
    }
    void Write(const std::string& content) const {
        memcpy(text, content.c_str(), content.size() + 1);
    }
};

int TellPending(UploadReader& reader, const Buffer& fileName, const Buffer& fieldName,
                const Buffer& fieldValue, TALOCGIUPLOAD* upload) {
    UploadForm& form = reader.Form();
    const host::ContentDisposition none;
    const host::ContentDisposition& part = form.Pending() != nullptr ? *form.Pending() : none;
    if (!fileName.Takes(part.fileName) || !fieldName.Takes(part.name) ||
        !fieldValue.Takes(part.fileName)) {
        return reader.Fail(TALO_UPLOAD_LIMIT, "a name does not fit");
    }
    // The rest of the body is counted from where the content begins.
    if (form.Pending() != nullptr && !form.IsPeeked()) {
        const unsigned long long rest = reader.Total() - reader.Offset();
        if (reader.Read(nullptr) != TALO_UPLOAD_OK) {
            return reader.Result();
        }
        upload->partSize = form.IsPendingEmpty() ? 0 : rest;
    } else if (form.Pending() == nullptr) {
        upload->partSize = 0;
    }
    fileName.Write(part.fileName);
    fieldName.Write(part.name);
    fieldValue.Write(part.fileName);
    return TALO_UPLOAD_OK;
}

int LoadParams(UploadReader& reader, TALOCGI* ctx, TALOCGIPROGRESS progress, TALOCGIUPLOAD* upload,
               const Buffer& fileName, const Buffer& fieldName, const Buffer& fieldValue) {
    if (ReadToFile(reader, progress) != TALO_UPLOAD_OK ||
        TellPending(reader, fileName, fieldName, fieldValue, upload) != TALO_UPLOAD_OK) {
        return reader.Result();
    }
    auto fields = reader.Form().TakeFields();
    reader.Names().DropTaken(&fields);
    if (!Fits(ctx->paramHash, fields.size())) {
        return reader.Fail(TALO_UPLOAD_LIMIT, "too many fields");
    }
    if (!MakeHash(&ctx->paramHash)) {
        return reader.Fail(TALO_UPLOAD_MEMORY, "no memory");
    }
    Pour(fields, ctx->paramHash);
    return static_cast<int>(fields.size());
}

int LoadFile(UploadReader& reader, TALOCGI* ctx, const char* dir, TALOCGIPROGRESS progress,
             TALOCGIUPLOAD* upload, const char* fieldName) {
    UploadForm& form = reader.Form();
    if (reader.Result() != TALO_UPLOAD_OK) {
        return reader.Result();
    }
    // A part that was not told could be another one than the caller means.
    if (form.Pending() == nullptr || !form.IsPeeked()) {
        return TALO_UPLOAD_NO_PART;
    }
    const std::string name =
        fieldName != nullptr && *fieldName != '\0' ? fieldName : form.Pending()->name;
    form.SetFolder("");
    form.PauseAfterFields(0);
    if (!form.StorePending(FolderOf(dir))) {
        return reader.Fail(form.Problem(), form.Reason());
    }
    if (reader.Read(progress) != TALO_UPLOAD_OK) {
        return reader.Result();
    }
    const auto stored = form.TakeStored();
    reader.Names().TakeAnyway(name);
    auto entries = form.TakeFields();
    reader.Names().DropTaken(&entries);
    for (const auto& file : stored) {
        entries.emplace_back(name, file.file->Path());
        AddFacts(name, file, &entries);
    }
    if (!Fits(ctx->paramHash, entries.size())) {
        return reader.Fail(TALO_UPLOAD_LIMIT, "too many fields");
    }
    if (!MakeHash(&ctx->paramHash)) {
        return reader.Fail(TALO_UPLOAD_MEMORY, "no memory");
    }
    Pour(entries, ctx->paramHash);
    for (const auto& file : stored) {
        file.file->Keep();
    }
    upload->partSize = 0;
    return TALO_UPLOAD_OK;
}

int LoadFields(UploadReader& reader, TALOSZHASH** params, int count,
               TALOCGIUPLOADCOUNTERS* counters, const Buffer& name) {
    UploadForm& form = reader.Form();
    form.SetFolder("");
    if (count > 0 && form.Pending() == nullptr) {
        form.PauseAfterFields(count);
        (void)reader.Read(nullptr);
    }
    if (reader.Result() != TALO_UPLOAD_OK) {
        return reader.Result();
    }
    const std::string pending = form.Pending() != nullptr ? form.Pending()->fileName : "";
    if (!name.Takes(pending)) {
        return reader.Fail(TALO_UPLOAD_LIMIT, "a name does not fit");
    }
    if (!MakeHash(params)) {
        return reader.Fail(TALO_UPLOAD_MEMORY, "no memory");
    }
    const auto fields = form.TakeFields();
    if (!Fits(*params, fields.size())) {
        return reader.Fail(TALO_UPLOAD_LIMIT, "too many fields");
    }
    Pour(fields, *params);
    counters->total = reader.Total();
    counters->consumed = reader.BoundaryEnd();
    name.Write(pending);
    return static_cast<int>(fields.size());
}

// Nothing may leave these operations; what does is no memory.
template <typename Body>
int Guarded(Body body) {
    try {
        UploadReader& reader = UploadReader::OfProcess();
        try {
            return body(reader);
        } catch (...) {
            return reader.Fail(TALO_UPLOAD_MEMORY, "no memory");
        }
    } catch (...) {
        return TALO_UPLOAD_MEMORY;
    }
}

}  // namespace

extern "C" {

int TaloCgiLoadUploadAll(TALOSZHASH** params, TALOSZHASH** files, const char* dir, int) {
    if (params == nullptr || files == nullptr || dir == nullptr || *dir == '\0') {
        return TALO_UPLOAD_STORE;
    }
    return Guarded([&](UploadReader& reader) { return LoadAll(reader, params, files, dir); });
}

int TaloCgiLoadUploadParams(TALOCGI* ctx, TALOCGIPROGRESS progress, TALOCGIUPLOAD* upload,
                            char* fileName, size_t fileNameSize, char* fieldName,
                            size_t fieldNameSize, char* fieldValue, size_t fieldValueSize) {
    if (ctx == nullptr || upload == nullptr) {
        return TALO_UPLOAD_NO_PART;
    }
    const int result = Guarded([&](UploadReader& reader) {
        return LoadParams(reader, ctx, progress, upload, {fileName, fileNameSize},
                          {fieldName, fieldNameSize}, {fieldValue, fieldValueSize});
    });
    upload->status = result < 0 ? result : TALO_UPLOAD_OK;
    return result;
}

int TaloCgiLoadUploadFileToDir(TALOCGI* ctx, const char* dir, TALOCGIPROGRESS progress,
                               TALOCGIUPLOAD* upload, const char*, const char* fieldName,
                               const char*) {
    if (ctx == nullptr || upload == nullptr || dir == nullptr || *dir == '\0') {
        return TALO_UPLOAD_STORE;
    }
    upload->status = Guarded([&](UploadReader& reader) {
        return LoadFile(reader, ctx, dir, progress, upload, fieldName);
    });
    return upload->status;
}

int TaloCgiLoadUploadNumParams(TALOSZHASH** params, int count, int, TALOCGIUPLOADCOUNTERS* counters,
                               char* name, size_t nameSize) {
    if (params == nullptr || counters == nullptr) {
        return TALO_UPLOAD_NO_PART;
    }
    return Guarded([&](UploadReader& reader) {
        return LoadFields(reader, params, count, counters, {name, nameSize});
    });
}

}  // extern "C"
