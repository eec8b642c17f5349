#ifndef TALO_PROGRAMS_WEBAPI_SERVER_RESTORE_H
#define TALO_PROGRAMS_WEBAPI_SERVER_RESTORE_H

#include <signal.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/types.h>

#include <locale>
#include <string>
#include <vector>

#include "programs/webapi_server/RestoreDescriptors.h"
#include "programs/webapi_server/RestoreStreams.h"
#include "programs/webapi_server/Status.h"

// What a process is while it serves nobody, recorded when its life begins and put
// back after each request, but for its environment (Environment.h). One in a
// process; its standard output gets the buffer that a reply fits into.
class ProcessState {
  public:
    // Descriptors of the worker's own are to be open by now. Whatever lies in the
    // folder `hostFolder` may stay open: the host's store of tasks is kept open.
    explicit ProcessState(const std::string& hostFolder);
    ~ProcessState();
    ProcessState(const ProcessState&) = delete;
    ProcessState& operator=(const ProcessState&) = delete;

    // Puts everything back and tells in words what a method that leaves nothing
    // behind would not have changed; nothing when the process may serve on. What
    // any request leaves goes unmentioned: names of the process, children that have
    // ended or are of a session of their own, the rest of a body. So does the child
    // `spared`, which may be about to begin one; 0 for none.
    std::vector<std::string> Restore(pid_t spared = 0);

    // Memory that is no file's, as it was at the end of the last Restore, what was
    // there before a fork included. -1 when the system does not tell.
    long long PrivateKiB() const;

    // Gives what is free of it back to the system, which takes a while.
    void ReturnMemory();

  private:
    // As the system writes them.
    struct Told {
        std::string mask;
        std::string ids;
        std::string blocked;
        std::string actions;
    };

    Told Tell() const;
    void RecordSignals();
    void RestoreFolder(std::vector<std::string>* changes) const;
    void RestoreMask(std::vector<std::string>* changes) const;
    void RestoreSignal(int number, std::vector<std::string>* changes) const;
    void RestoreSignals(const Told& now, std::vector<std::string>* changes);
    void RestoreBlocked(std::vector<std::string>* changes) const;
    void RestoreLimits(std::vector<std::string>* changes) const;
    void RestoreLocale(std::vector<std::string>* changes) const;
    void RestoreIds(std::vector<std::string>* changes) const;
    void RestoreName() const;

    struct Ids {
        uid_t user[3];
        gid_t group[3];
        std::vector<gid_t> more;

        bool operator==(const Ids& other) const;
    };
    static Ids IdsNow();

    int folder_;
    struct stat folderFacts_;
    mode_t mask_;
    struct sigaction actions_[NSIG];
    sigset_t blocked_;
    int nice_;
    struct rlimit limits_[RLIM_NLIMITS];
    std::string locale_;
    std::locale streamLocale_;
    Ids ids_;
    ProcessStatus status_;
    Told told_;
    long long threads_;
    std::vector<int> watched_;
    char taskName_[17];
    std::string programName_;
    RestoreStreams streams_;
    RestoreDescriptors descriptors_;
};

#endif
