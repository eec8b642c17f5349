#include "File.h"
#include "webapi/APIResponse.h"

namespace {

using talo::FileError;

struct CodeRow {
    FileError error;
    int code;
};

constexpr CodeRow kCodes[] = {
    {FileError::kNotFound, kNoSuchFile},     {FileError::kExists, kExists},
    {FileError::kNotFolder, kNotFolder},     {FileError::kNotFile, kNotFile},
    {FileError::kLink, kLeadsOut},           {FileError::kNotEmpty, kNotEmpty},
    {FileError::kNoSpace, kNoSpace},         {FileError::kOtherFileSystem, kOtherFileSystem},
    {FileError::kIntoItself, kIntoItself},   {FileError::kTooMany, kTooManyNames},
    {FileError::kRefused, kRefusedBySystem}, {FileError::kStopped, kStopped},
};

}  // namespace

int CodeOf(FileError error) {
    if (error == FileError::kNone) {
        return 0;
    }
    for (const CodeRow& row : kCodes) {
        if (row.error == error) {
            return row.code;
        }
    }
    return kFailed;
}

bool AnswerError(TALO::APIResponse* response, FileError error, const std::string& path) {
    if (error != FileError::kNone) {
        response->SetError(CodeOf(error), path);
    }
    return error != FileError::kNone;
}
