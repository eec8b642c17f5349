#ifndef TALO_HOSTS_LINUX_DOWNLOAD_HTTPDATE_H
#define TALO_HOSTS_LINUX_DOWNLOAD_HTTPDATE_H

#include <time.h>

#include <string>

namespace host {

// A time as a header field writes it: "Sun, 06 Nov 1994 08:49:37 GMT". "" for a
// time whose year has not four digits.
std::string HttpDate(time_t when);

// Reads a date of a header field: the form above, and the two old ones that a
// recipient has to know ("Sunday, 06-Nov-94 08:49:37 GMT", "Sun Nov  6 08:49:37
// 1994"). `now` settles the century of a year of two digits. The name of the day
// is not compared with the date. On failure `when` stays untouched.
bool ParseHttpDate(const std::string& text, time_t now, time_t* when);

}  // namespace host

#endif
