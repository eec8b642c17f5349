#ifndef TESTS_MODULES_BASIC_METHODS_H
#define TESTS_MODULES_BASIC_METHODS_H

#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

// The methods of Test.Basic. Parameters stand in brackets.
namespace basic {

using TALO::APIRequest;
using TALO::APIResponse;

// Results: success without data; all parameters as data; an error [code,
// details]; nothing at all; three ways to throw.
void Ok(APIRequest* request, APIResponse* response);
void Echo(APIRequest* request, APIResponse* response);
void Fail(APIRequest* request, APIResponse* response);
void Nothing(APIRequest* request, APIResponse* response);
void ThrowException(APIRequest* request, APIResponse* response);
void ThrowNumber(APIRequest* request, APIResponse* response);
void ThrowAfterSuccess(APIRequest* request, APIResponse* response);

// What else a response carries: an HTTP status [code, message], a header line
// [name, value], a text for the client's log [text], a restart of the web
// server, work for afterwards that appends [text] to [file].
void Status(APIRequest* request, APIResponse* response);
void Header(APIRequest* request, APIResponse* response);
void ServerError(APIRequest* request, APIResponse* response);
void Restart(APIRequest* request, APIResponse* response);
void Later(APIRequest* request, APIResponse* response);

// Writes [text] to std::cout and answers whether the stream took it.
void Print(APIRequest* request, APIResponse* response);
// Reads std::cin to its end and answers what was there.
void ReadInput(APIRequest* request, APIResponse* response);
// Prints a reply of its own, with [text] as its body, and switches the
// framework's off.
void Download(APIRequest* request, APIResponse* response);

// What a method sees: the process (nice value, task name, argument vector,
// working directory, user variables) and the request's session and attributes.
void Process(APIRequest* request, APIResponse* response);
void Caller(APIRequest* request, APIResponse* response);

}  // namespace basic

#endif
