#include "File.h"
#include "webapi/APIExport.h"
#include "webapi/APITable.h"

namespace {

TALO::_tag_API_TABLE table[] = {
    {"TALO.File", 1, "list", List},
    {"TALO.File", 1, "stat", Stat},
    {"TALO.File", 1, "mkdir", MakeFolder},
    {"TALO.File", 1, "rename", Rename},
    {"TALO.File", 1, "remove", Remove},
    {"TALO.File", 1, "upload", Upload},
    {"TALO.File", 1, "download", Download},
    {"TALO.File.Checksum", 1, "start", StartChecksum},
    {"TALO.File", 1, "upload_slice", UploadSlice},
    {"TALO.File", 1, "upload_status", UploadStatus},
    {nullptr, 0, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}
