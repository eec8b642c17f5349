#include "hosts/linux/cgi/UploadNames.h"

#include <algorithm>

#include "hosts/linux/util/HostLog.h"

namespace host {

namespace {
constexpr char kSource[] = "UploadNames.cpp";
}

std::string UploadNames::Take(const std::string& name) {
    std::string free = name;
    unsigned& number = last_.emplace(name, 1).first->second;
    while (IsTaken(free) || IsTaken(FileNameOf(free)) || IsTaken(SizeOf(free))) {
        free = name + "_" + std::to_string(++number);
    }
    TakeAnyway(free);
    return free;
}

void UploadNames::TakeAnyway(const std::string& name) {
    taken_.insert(name);
    taken_.insert(FileNameOf(name));
    taken_.insert(SizeOf(name));
}

void UploadNames::DropTaken(std::vector<UploadForm::Field>* fields) const {
    const auto dropped = [this](const UploadForm::Field& field) {
        if (IsTaken(field.first)) {
            HOST_LOG("field %s dropped: an uploaded file has that name", field.first.c_str());
            return true;
        }
        return false;
    };
    fields->erase(std::remove_if(fields->begin(), fields->end(), dropped), fields->end());
}

}  // namespace host
