#ifndef TALO_HOSTS_LINUX_UTIL_FILESTATE_H
#define TALO_HOSTS_LINUX_UTIL_FILESTATE_H

#include <sys/stat.h>

#include <string>
#include <utility>

namespace host {

// What tells one content of a regular file from another without reading it.
class FileState {
  public:
    FileState() = default;

    // As it is now; not known where the path leads to no regular file. Keeps errno.
    explicit FileState(const std::string& path);

    bool IsKnown() const;

    // Whether it is so old that a change from now on must show in it: times advance
    // in steps, and a file that is written twice within one looks the same after the
    // second time.
    bool IsSettled() const;

    bool operator==(const FileState& other) const;

    const struct stat& Facts() const;

  private:
    struct stat facts_ = {};
};

// What was made of a file the last time, as long as the file stays as it was. One
// for each thread: `static thread_local`.
template <typename Key, typename Value>
class KeptFromFile {
  public:
    // Null when it has to be made (again).
    const Value* Find(const Key& key, const FileState& now) const {
        return now.IsKnown() && now == state_ && key == key_ ? &value_ : nullptr;
    }

    // `before` is the state before the file was read: what changes it meanwhile makes
    // it another one, whatever of that was read.
    void Keep(Key key, const FileState& before, Value value) {
        state_ = before;
        key_ = std::move(key);
        value_ = std::move(value);
    }

  private:
    FileState state_;
    Key key_ = Key();
    Value value_ = Value();
};

}  // namespace host

#endif
