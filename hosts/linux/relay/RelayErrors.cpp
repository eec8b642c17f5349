#include "hosts/linux/sdk/Nodes.h"

namespace talo {

const char* RelayErrorText(RelayError error) {
    switch (error) {
        case RelayError::kNone:
            return "no error";
        case RelayError::kUnknownNode:
            return "no such appliance, or it is not called from here";
        case RelayError::kUnavailable:
            return "the relay module, the file of appliances or memory is missing";
        case RelayError::kTooManyHops:
            return "the call came over too many appliances already";
        case RelayError::kNoCaller:
            return "no session says for whom to call";
        case RelayError::kNotReached:
            return "the appliance cannot be reached";
        case RelayError::kNotTrusted:
            return "the appliance's certificate or key is not trusted";
        case RelayError::kTimedOut:
            return "no whole answer came in time";
        case RelayError::kBroken:
            return "the connection ended in the middle of the call";
        case RelayError::kTooLong:
            return "the answer is longer than the limit";
        case RelayError::kStatus:
            return "the appliance answered with an HTTP status other than 200";
        case RelayError::kRefused:
            return "the appliance does not let this one act for the caller";
        case RelayError::kBadBody:
            return "the body to send on ended too early";
    }
    return "unknown error";
}

}  // namespace talo
