#include "hosts/linux/sdk/Process.h"

#include "hosts/linux/cgi/Caller.h"
#include "hosts/linux/cgi/UploadReader.h"
#include "platform/System.h"

namespace talo {

void ForgetRequest() {
    host::UploadReader::Forget();
    host::ForgetCaller();
    TLIBCErrSet(0);
}

}  // namespace talo
