#ifndef PROGRAMS_WEBAPI_ACCOUNT_NODELISTING_H
#define PROGRAMS_WEBAPI_ACCOUNT_NODELISTING_H

#include <string>
#include <vector>

#include "hosts/linux/sdk/Nodes.h"

// The appliances for people, a row each under a heading. No secrets, and not what
// stands for one.
std::string NodeTable(const std::vector<talo::Node>& nodes);

// The same for programs: a JSON array of objects.
std::string NodeJson(const std::vector<talo::Node>& nodes);

#endif
