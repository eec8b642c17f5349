#ifndef TALO_HOSTS_LINUX_FILE_ARCHIVEMODULE_H
#define TALO_HOSTS_LINUX_FILE_ARCHIVEMODULE_H

// What the module talo-archive.so offers: the door to libarchive, opened only by
// a process that writes an archive. Nothing throws. After a failure the state
// takes only `problem` and `drop`.
extern "C" {

struct TaloArchiveModule {
    // A new zip archive to a descriptor, null on failure.
    void* (*begin)(int output);
    int (*addFolder)(void* state, const char* path, long long mtime);
    int (*addFile)(void* state, const char* path, long long mtime, unsigned long long size,
                   int file);
    // Writes the archive's end. 1 on success.
    int (*finish)(void* state);
    // Why the last operation failed.
    const char* (*problem)(void* state);
    // Writes nothing more.
    void (*drop)(void* state);
};
}

constexpr char kArchiveModuleFile[] = "talo-archive.so";
constexpr char kArchiveModuleSymbol[] = "taloArchiveModule";

#endif
