#ifndef TALO_HOSTS_LINUX_CGI_UPLOADNAMES_H
#define TALO_HOSTS_LINUX_CGI_UPLOADNAMES_H

#include <map>
#include <set>
#include <string>
#include <vector>

#include "hosts/linux/cgi/UploadForm.h"

namespace host {

// The names under which the files of one body are told: for a file N also
// "N_filename" and "N_size". A field of the client's cannot stand in their place.
class UploadNames {
  public:
    // Takes the three names for a file; `name` or, where one of them is another
    // file's, `name` with "_2", "_3" ... behind it. Answers the first of the three.
    std::string Take(const std::string& name);

    // Takes the three names whoever has them.
    void TakeAnyway(const std::string& name);

    // Whether a name is a file's.
    bool IsTaken(const std::string& name) const {
        return taken_.count(name) != 0;
    }

    // Leaves the fields whose names are not taken; logs the others.
    void DropTaken(std::vector<UploadForm::Field>* fields) const;

    static std::string FileNameOf(const std::string& name) {
        return name + "_filename";
    }
    static std::string SizeOf(const std::string& name) {
        return name + "_size";
    }

  private:
    std::set<std::string> taken_;
    std::map<std::string, unsigned> last_;  // the last number given to a name
};

}  // namespace host

#endif
