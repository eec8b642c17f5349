#ifndef TALO_HOSTS_LINUX_DOWNLOAD_REDIRECT_H
#define TALO_HOSTS_LINUX_DOWNLOAD_REDIRECT_H

#include <string>

namespace host {

// The header line by which the web server sends this open regular file in our
// place, with its line end; "" when it was not set up for that, or when the file
// cannot be named to it: the environment's MOD_X_SENDFILE_ENABLED is "yes", and
// with a MOD_X_ACCEL_PREFIX the line is "X-Accel-Redirect" with that in front of
// the path, without one "X-Sendfile". With "yes" as MOD_X_SENDFILE_PLAIN the path
// of the latter goes out as it is, for a server that undoes no percent escapes.
//
// The path is what the kernel calls the open file now. A name from outside is
// not handed on: links in it could lead elsewhere by the time that the server
// follows them, and "/proc/self" means another process there.
std::string ServerSends(int file);

}  // namespace host

#endif
