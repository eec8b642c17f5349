#include "hosts/linux/download/Disposition.h"
#include "hosts/linux/file/Guard.h"
#include "hosts/linux/sdk/Downloads.h"
#include "platform/HTTPFileOutputer.h"

namespace talo {

std::string AttachmentNamed(const std::string& name) {
    return host::Guarded(std::string("attachment"), [&] { return host::AttachmentNamed(name); });
}

std::string MimeTypeOf(const std::string& name) {
    return host::Guarded(std::string("application/octet-stream"),
                         [&] { return HTTPFileOutputer::GetMimeType(name.c_str()); });
}

}  // namespace talo
