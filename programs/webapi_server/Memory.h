#ifndef TALO_PROGRAMS_WEBAPI_SERVER_MEMORY_H
#define TALO_PROGRAMS_WEBAPI_SERVER_MEMORY_H

// How much memory this process holds for itself. Made in the process whose
// memory it tells of; keeps a descriptor open.
class PrivateMemory {
  public:
    PrivateMemory();
    ~PrivateMemory();
    PrivateMemory(const PrivateMemory&) = delete;
    PrivateMemory& operator=(const PrivateMemory&) = delete;

    // Pages that are no file's, what was there before a fork included. -1 when
    // the system does not tell.
    long long KiB() const;

  private:
    int statm_;
};

#endif
