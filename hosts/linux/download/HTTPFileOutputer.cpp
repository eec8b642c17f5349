#include "platform/HTTPFileOutputer.h"

#include <errno.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <time.h>
#include <unistd.h>

#include <exception>

#include "hosts/linux/download/Answer.h"
#include "hosts/linux/download/Disposition.h"
#include "hosts/linux/download/MimeTypes.h"
#include "hosts/linux/download/Redirect.h"
#include "hosts/linux/download/Send.h"
#include "hosts/linux/util/Descriptor.h"
#include "hosts/linux/util/HostLog.h"

namespace {

constexpr char kSource[] = "HTTPFileOutputer.cpp";

int StatusOf(int error) {
    switch (error) {
        case EACCES:
        case EPERM:
            return 403;
        case ENOENT:
        case ENOTDIR:
        case ELOOP:
        case ENAMETOOLONG:
        case ENXIO:
            return 404;
        default:
            return 500;
    }
}

int Refuse(int status) {
    host::ClientStream client;
    (void)client.WriteHeader(host::ErrorAnswer(host::CurrentRequest(), status));
    return -1;
}

int Say(const std::string& header) {
    host::ClientStream client;
    return client.WriteHeader(header) ? 0 : -1;
}

// A regular file, from that place to its present end.
int SendRegular(int file, const struct stat& facts, uint64_t start, host::Content content) {
    const uint64_t end = static_cast<uint64_t>(facts.st_size);
    content.size = start < end ? end - start : 0;
    content.validators = host::ValidatorsOf(facts, start);
    const host::Answer answer = host::AnswerFor(host::CurrentRequest(), content, time(nullptr));
    host::ClientStream client;
    bool good = client.WriteHeader(answer.header);
    for (const host::Piece& piece : answer.pieces) {
        good = good && client.Write(piece.before.data(), piece.before.size()) &&
               client.WriteFile(file, start + piece.range.first, piece.range.length);
    }
    return good && client.Write(answer.after.data(), answer.after.size()) ? 0 : -1;
}

int SendStream(FILE* file, const host::Content& content) {
    const bool onlyHeader = host::CurrentRequest().method == "HEAD";
    host::ClientStream client;
    return client.WriteHeader(host::StreamHeader(content)) && (onlyHeader || client.WriteRest(file))
               ? 0
               : -1;
}

// What stdio still holds of the caller's writing lies before the position.
int SendOpen(FILE* file, const host::Content& content) {
    const int descriptor = fileno(file);
    struct stat facts = {};
    if (descriptor < 0) {
        return SendStream(file, content);  // memory, as of fmemopen
    }
    if (fstat(descriptor, &facts) != 0 || (fcntl(descriptor, F_GETFL) & O_ACCMODE) == O_WRONLY) {
        return Refuse(500);
    }
    if (S_ISDIR(facts.st_mode)) {
        return Refuse(404);
    }
    if (!S_ISREG(facts.st_mode)) {
        return SendStream(file, content);
    }
    const off_t start = ftello(file);
    return start < 0 ? Refuse(500)
                     : SendRegular(descriptor, facts, static_cast<uint64_t>(start), content);
}

// O_NONBLOCK: a FIFO in the place of a file must not hang the request.
int SendNamed(const char* path, const host::Content& content) {
    const host::Descriptor file(open(path, O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY));
    struct stat facts = {};
    if (file.Get() < 0 || fstat(file.Get(), &facts) != 0) {
        const int error = errno;
        HOST_LOG("cannot send %s: %m", path);
        return Refuse(StatusOf(error));
    }
    if (!S_ISREG(facts.st_mode)) {
        HOST_LOG("cannot send %s: no regular file", path);
        return Refuse(404);
    }
    const std::string line = host::ServerSends(file.Get());
    return line.empty() ? SendRegular(file.Get(), facts, 0, content)
                        : Say(host::RedirectHeader(content, line));
}

}  // namespace

std::string HTTPFileOutputer::GetMimeType(const char* fileName) {
    return host::MimeTypeOf(fileName != nullptr ? fileName : "", host::kMimeTable);
}

int HTTPFileOutputer::Output(FILE* file, const char* fileName, const char* mimeType) {
    try {
        host::Content content;
        content.mimeType = host::CheckedMimeType(mimeType);
        if (fileName != nullptr && *fileName != '\0') {
            content.disposition = host::AttachmentNamed(fileName);
        }
        return file != nullptr ? SendOpen(file, content) : Refuse(500);
    } catch (const std::exception& problem) {
        HOST_LOG("cannot send: %s", problem.what());
        return -1;
    }
}

int HTTPFileOutputer::Output(const char* path, const char* mimeType) {
    try {
        host::Content content;
        content.mimeType = host::CheckedMimeType(mimeType);
        return path != nullptr ? SendNamed(path, content) : Refuse(404);
    } catch (const std::exception& problem) {
        HOST_LOG("cannot send: %s", problem.what());
        return -1;
    }
}
