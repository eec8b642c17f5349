#include "src/base/Guarded.h"

#include <exception>

namespace TALO {

void LogCurrentException(const char* source, int line) {
    try {
        throw;
    } catch (const std::exception& exception) {
        LogAt(LOG_ERR, source, line, "exception: %s", exception.what());
    } catch (...) {
        LogAt(LOG_ERR, source, line, "exception of an unknown type");
    }
}

}  // namespace TALO
