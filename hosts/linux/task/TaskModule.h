#ifndef TALO_HOSTS_LINUX_TASK_TASKMODULE_H
#define TALO_HOSTS_LINUX_TASK_TASKMODULE_H

#include <cstddef>

// What the module talo-task.so offers: the records of tasks in a database,
// opened only by a process that has to do with tasks. Nothing throws, neither
// here nor in what is called back. A failure is logged where it happens; outputs
// stay untouched then. Users, ids, prefixes and names of properties come
// checked, values as JSON texts that are taken as they are.
extern "C" {

// An answer of the store. Nothing else reports.
enum TaloTaskAnswer {
    kTaskFailed = -1,  // the store could not be used
    kTaskMissing = 0,  // there is no such record, property or process
    kTaskDone = 1,
};

// What the module takes from the host. It stays the host's, and stays.
struct TaloTaskHost {
    const char* folder;  // of the database; made when it is missing
    // A setting of the host that is a number of seconds.
    long long (*seconds)(const char* key, long long fallback);
};

// A process that no other is mistaken for.
struct TaloTaskProcess {
    int pid;                   // 0: none
    unsigned long long start;  // in clock ticks since the machine started
    char boot[40];             // the id of that start of the machine
};

struct TaloTaskFacts {
    TaloTaskProcess process;
    int finished;
};

struct TaloTaskText {
    const char* name;
    const char* text;
    size_t size;
};

struct TaloTaskModule {
    // Settles the host; the first call, once.
    void (*use)(const TaloTaskHost* host);

    // Finds a record, or makes it where `make` is not 0. Its number is never
    // another record's, also when this one is gone.
    int (*find)(const char* user, const char* id, int make, long long* number);

    // Reads a record as it is at one moment: first `facts`, then each property.
    int (*read)(long long number, void* context,
                void (*facts)(void* context, const TaloTaskFacts* facts),
                void (*property)(void* context, const TaloTaskText* property));

    // Each of these is stored whole or not at all.
    int (*write)(long long number, const TaloTaskText* properties, size_t count);
    int (*setProcess)(long long number, int pid, TaloTaskProcess* process);
    int (*finish)(long long number, int autoRemove);
    int (*remove)(long long number);

    // Whether this very process lives.
    int (*lives)(const TaloTaskProcess* process);

    // Waits until the record has the property, for that many seconds at most.
    int (*wait)(long long number, const char* property, unsigned long seconds);

    // The user's ids that begin with the prefix, the oldest first.
    int (*list)(const char* user, const char* prefix, void* context,
                void (*id)(void* context, const char* id));

    // Writes a new id and its NUL.
    int (*newId)(const char* user, const char* prefix, char* id, size_t size);
};
}

constexpr char kTaskModuleFile[] = "talo-task.so";
constexpr char kTaskModuleSymbol[] = "taloTaskModule";

#endif
