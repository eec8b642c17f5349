#ifndef TALO_PROGRAMS_WEBAPI_SERVER_RESTOREDESCRIPTORS_H
#define TALO_PROGRAMS_WEBAPI_SERVER_RESTOREDESCRIPTORS_H

#include <sys/types.h>

#include <map>
#include <string>
#include <vector>

// The descriptors that a process has while it serves nobody. Standard input and
// output are the request's and not looked at.
class RestoreDescriptors {
  public:
    // Up to a handful in the folder `hostFolder` may come and go.
    explicit RestoreDescriptors(std::string hostFolder);
    ~RestoreDescriptors();
    RestoreDescriptors(const RestoreDescriptors&) = delete;
    RestoreDescriptors& operator=(const RestoreDescriptors&) = delete;

    // Closes those that are new, and tells of them and of those that are gone.
    void Restore(std::vector<std::string>* changes);

  private:
    struct Identity {
        dev_t device;
        ino_t number;
    };

    bool Record(int number);
    bool IsAsBefore(int descriptor, const Identity& before) const;
    // 0 where the system does not count them.
    long long Count() const;
    void CheckKnown(std::vector<std::string>* changes) const;
    void CloseNew(std::vector<std::string>* changes) const;
    void CloseAllBetween() const;

    const std::string hostFolder_;
    const int errors_;  // what standard error was
    const int folder_;  // of this process's descriptors
    long long count_ = 0;
    std::map<int, Identity> known_;
};

#endif
