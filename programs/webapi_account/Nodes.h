#ifndef PROGRAMS_WEBAPI_ACCOUNT_NODES_H
#define PROGRAMS_WEBAPI_ACCOUNT_NODES_H

#include <string>

#include "Arguments.h"

// The commands about other appliances. False with `problem` in words.
bool RunNodeCommand(const Arguments& arguments, std::string* problem);

#endif
