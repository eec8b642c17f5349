#include "hosts/linux/cgi/MultipartLimits.h"

#include <limits>

#include "hosts/linux/conf/KeyValueFile.h"

namespace host {

MultipartLimits ConfiguredMultipartLimits() {
    const HostSettings settings;
    MultipartLimits limits;
    settings.Limit("upload_parts", size_t{10000}, &limits.parts);
    settings.Limit("upload_header_bytes", size_t{1} << 20, &limits.headerBytes);
    settings.Limit("upload_preamble_bytes", size_t{1} << 20, &limits.preambleBytes);
    settings.Limit("upload_field_bytes", size_t{16} << 20, &limits.fieldBytes);
    settings.Limit("upload_fields_bytes", size_t{16} << 20, &limits.allFieldsBytes);
    settings.Limit("upload_total_bytes", std::numeric_limits<unsigned long long>::max(),
                   &limits.totalBytes);
    return limits;
}

}  // namespace host
