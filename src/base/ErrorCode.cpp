#include "src/base/ErrorCode.h"

namespace TALO {

const ErrorCodeRow kErrorCodes[] = {
    {kErrorBadRequest,
     "bad request: environment or parameters unreadable, API name or method "
     "missing, version below 1, or a relay parameter that names no appliance or "
     "where relay is not allowed"},
    {kErrorNoSuchAPI, "no description for the API"},
    {kErrorNoSuchMethod, "method not listed for that version"},
    {kErrorVersion, "version out of the API's range"},
    {kErrorPermission, "not permitted"},
    {kErrorSessionTimeout, "session timed out"},
    {kErrorSessionRefused, "session refused"},
    {kErrorUpload, "upload could not be read"},
    {kErrorRelay, "relay failed, or a relay parameter in a call that cannot be relayed"},
    {kErrorCompoundOrFork,
     "compound request without a usable list, or a background task could "
     "not be started"},
    {kErrorLibrary, "API library cannot be opened or has no method table"},
    {kErrorCompoundSkipped, "compound element skipped after a failure"},
    {kErrorCompoundTransfer, "compound element whose method allows upload or download"},
    {kErrorShareGroup, "background task shared with a group that does not exist"},
    {kErrorUploadNotAllowed, "upload to a method that takes none"},
    {kErrorDemoMode, "method not available in demo mode"},
    {kErrorNoResult, "the method left no result"},
    {kErrorProcessName, "setting the process name failed"},
    {kErrorNoSession, "no session id"},
    {kErrorNotInTable, "method missing from the API library's table"},
};

const size_t kErrorCodeCount = sizeof kErrorCodes / sizeof kErrorCodes[0];

}  // namespace TALO
