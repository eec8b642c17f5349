#include "programs/webapi_server/Status.h"

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <charconv>

namespace {

constexpr size_t kMostBytes = size_t{16} * 1024;  // a line tells of each group of the user

}  // namespace

ProcessStatus::ProcessStatus()
    : file_(open("/proc/self/status", O_RDONLY | O_CLOEXEC)), text_(kMostBytes) {}

ProcessStatus::~ProcessStatus() {
    if (file_ >= 0) {
        (void)close(file_);
    }
}

bool ProcessStatus::Read() {
    const ssize_t size = pread(file_, text_.data(), text_.size(), 0);
    fields_.clear();
    for (std::string_view rest(text_.data(), size > 0 ? static_cast<size_t>(size) : 0);
         !rest.empty();) {
        const std::string_view line = rest.substr(0, rest.find('\n'));
        const size_t colon = line.find(':');
        if (colon != std::string_view::npos) {
            fields_.push_back({line.substr(0, colon), line.substr(colon + 1)});
        }
        rest.remove_prefix(std::min(line.size() + 1, rest.size()));
    }
    return size > 0;
}

std::string_view ProcessStatus::Field(std::string_view name) const {
    for (const NamedField& field : fields_) {
        if (field.name == name) {
            return field.value;
        }
    }
    return std::string_view();
}

long long ProcessStatus::Number(std::string_view name) const {
    std::string_view field = Field(name);
    field.remove_prefix(std::min(field.find_first_not_of(" \t"), field.size()));
    long long number = -1;
    (void)std::from_chars(field.data(), field.data() + field.size(), number);
    return number;
}
