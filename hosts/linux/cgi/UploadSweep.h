#ifndef TALO_HOSTS_LINUX_CGI_UPLOADSWEEP_H
#define TALO_HOSTS_LINUX_CGI_UPLOADSWEEP_H

#include <string>

namespace host {

// Uploads that this long nobody wrote to are swept, if their process is gone; a
// folder is looked through this often at most.
constexpr long kAbandonedSeconds = 24 * 3600L;
constexpr long kSweepSeconds = 3600L;

// Removes from a folder the uploads that processes left behind which were killed:
// regular files of our own user with a name of UploadName.h. The time of the last
// sweep is that of the file ".webapi-upload-sweep" in the folder. Says nothing:
// what stays behind is met again.
void SweepUploads(const std::string& dir);

}  // namespace host

#endif
