#ifndef PROGRAMS_WEBAPI_ACCOUNT_LISTING_H
#define PROGRAMS_WEBAPI_ACCOUNT_LISTING_H

#include <string>
#include <vector>

#include "hosts/linux/sdk/Accounts.h"

// The accounts for people, a row each under a heading.
std::string ListingTable(const std::vector<talo::Account>& accounts);

// The same for programs: a JSON array of objects.
std::string ListingJson(const std::vector<talo::Account>& accounts);

#endif
