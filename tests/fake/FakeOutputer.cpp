#include <unistd.h>

#include "platform/HTTPFileOutputer.h"
#include "tests/fake/FakePlatform.h"

namespace {

void Write(const std::string& text) {
    if (!fake::Now().outputByDescriptor) {
        (void)fwrite(text.data(), 1, text.size(), stdout);
        return;
    }
    for (size_t written = 0; written < text.size();) {
        const ssize_t put = write(STDOUT_FILENO, text.data() + written, text.size() - written);
        if (put <= 0) {
            return;
        }
        written += static_cast<size_t>(put);
    }
}

int Answer(const fake::OutputCall& call) {
    fake::Now().outputCalls.push_back(call);
    if (fake::Now().Called("HTTPFileOutputer::Output")) {
        return -1;
    }
    Write(fake::Now().outputMarker);
    return fake::Now().outputResult;
}

}  // namespace

std::string HTTPFileOutputer::GetMimeType(const char* fileName) {
    fake::Now().mimeTypeCalls.push_back(fileName);
    (void)fake::Now().Called("HTTPFileOutputer::GetMimeType");
    return fake::Now().mimeType;
}

int HTTPFileOutputer::Output(FILE* file, const char* fileName, const char* mimeType) {
    return Answer({file, "", fileName, mimeType});
}

int HTTPFileOutputer::Output(const char* path, const char* mimeType) {
    return Answer({nullptr, path, "", mimeType});
}
