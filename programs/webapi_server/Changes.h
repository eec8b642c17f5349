#ifndef TALO_PROGRAMS_WEBAPI_SERVER_CHANGES_H
#define TALO_PROGRAMS_WEBAPI_SERVER_CHANGES_H

#include <cstdint>
#include <string>
#include <vector>

// Whether the description files of a folder, its lib.def and the API libraries are
// still those that were there when they were loaded: names and identities (device,
// number, size, times) are compared, contents are not read. A look leaves nothing allocated.
class Changes {
  public:
    // Notes the folder as it is. To be done before its files are read.
    explicit Changes(std::string folder);

    // Notes a library, before it is loaded. A path that is not absolute is below the
    // folder.
    void AddLibrary(const std::string& path);

    // True when something changed, and nothing since the look before: an upgrade
    // that is under way is given the time to finish, within a bound.
    bool Look();

  private:
    uint64_t Now() const;

    std::string folder_;
    std::vector<std::string> libraries_;
    uint64_t loaded_;
    uint64_t last_;
    int unsettled_ = 0;
};

#endif
