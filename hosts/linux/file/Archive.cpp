#include "hosts/linux/sdk/Archive.h"

#include "hosts/linux/file/ArchiveModule.h"
#include "hosts/linux/file/Guard.h"
#include "hosts/linux/util/Module.h"

namespace talo {

namespace {

constexpr char kSource[] = "Archive.cpp";

// A module that was missing may be there at the next call.
const TaloArchiveModule* Module() {
    static thread_local const TaloArchiveModule* module = nullptr;
    if (module == nullptr) {
        module = static_cast<const TaloArchiveModule*>(host::OpenModule(
            kArchiveModuleFile, kArchiveModuleSymbol, "no archive can be written"));
    }
    return module;
}

void Drop(void** state) {
    if (*state != nullptr) {
        Module()->drop(*state);
        *state = nullptr;
    }
}

bool KeepOnlyIf(bool done, void** state) {
    if (!done && *state != nullptr) {
        HOST_LOG("an archive stays incomplete: %s", Module()->problem(*state));
        Drop(state);
    }
    return done;
}

}  // namespace

ZipWriter::ZipWriter(int output)
    : state_(host::Guarded<void*>(nullptr, [&]() -> void* {
          return Module() != nullptr ? Module()->begin(output) : nullptr;
      })) {}

ZipWriter::~ZipWriter() {
    Drop(&state_);
}

bool ZipWriter::IsOpen() const {
    return state_ != nullptr;
}

bool ZipWriter::AddFolder(const std::string& path, long long mtime) {
    return KeepOnlyIf(state_ != nullptr && Module()->addFolder(state_, path.c_str(), mtime) != 0,
                      &state_);
}

bool ZipWriter::AddFile(const std::string& path, long long mtime, unsigned long long size,
                        int file) {
    return KeepOnlyIf(
        state_ != nullptr && Module()->addFile(state_, path.c_str(), mtime, size, file) != 0,
        &state_);
}

bool ZipWriter::Finish() {
    const bool done = KeepOnlyIf(state_ != nullptr && Module()->finish(state_) != 0, &state_);
    Drop(&state_);
    return done;
}

}  // namespace talo
