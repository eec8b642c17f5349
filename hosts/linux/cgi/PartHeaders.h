#ifndef TALO_HOSTS_LINUX_CGI_PARTHEADERS_H
#define TALO_HOSTS_LINUX_CGI_PARTHEADERS_H

#include <string>
#include <utility>
#include <vector>

namespace host {

// The header lines of one part: names in lower case, values without blanks
// around them, in the order in which they came.
using PartHeaders = std::vector<std::pair<std::string, std::string>>;

// Parses header lines, each with its CR LF; a folded line (one that begins with a
// blank) goes on with its predecessor, joined by one blank. False, and `headers`
// untouched, for a line without a name, a bare CR or LF, or NUL.
bool ParsePartHeaders(const std::string& block, PartHeaders* headers);

// The value of the only header of that name (in lower case). False, and `value`
// untouched, when there is none, or more than one: who reads the first would
// see another part than who reads the last.
bool OnlyHeader(const PartHeaders& headers, const std::string& name, std::string* value);

// Whether there is a header of that name.
bool HasHeader(const PartHeaders& headers, const std::string& name);

}  // namespace host

#endif
