#ifndef TALO_HOSTS_LINUX_FILE_PARENT_H
#define TALO_HOSTS_LINUX_FILE_PARENT_H

#include <string>
#include <vector>

#include "hosts/linux/sdk/Places.h"
#include "hosts/linux/util/Descriptor.h"

namespace host {

// The open folder that an entry is in, and the entry's name there. A share's own
// folder has no such parent that may be changed: kRefused.
class Parent {
  public:
    Parent(int root, const std::vector<std::string>& parts);
    int Get() const;  // -1 on failure
    const char* Name() const;
    talo::FileError Error() const;

  private:
    std::string name_;
    talo::FileError error_;
    Descriptor folder_;
};

}  // namespace host

#endif
