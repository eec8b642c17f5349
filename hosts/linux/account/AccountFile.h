#ifndef TALO_HOSTS_LINUX_ACCOUNT_ACCOUNTFILE_H
#define TALO_HOSTS_LINUX_ACCOUNT_ACCOUNTFILE_H

#include <cstddef>
#include <functional>
#include <string>
#include <vector>

#include "hosts/linux/account/AccountLine.h"

// The file of accounts: one strict JSON object a line. A line that is not
// understood is logged and skipped, and stays byte for byte when the file is
// written again. A missing file has no accounts. A file that somebody else than
// its owner could have written is not believed at all.
namespace host {

constexpr size_t kMaxAccountsBytes = 4u << 20;
constexpr unsigned kFirstUid = 1024;

enum class Lookup { kFound, kAbsent, kUnavailable };

// Of several lines with one name the first counts.
Lookup FindInFile(const std::string& path, const std::string& name, StoredAccount* stored);

// In byte order of the names.
bool ListFile(const std::string& path, std::vector<talo::Account>* accounts);

// Changes, one after the other whoever makes them: a lock on "PATH.lock" is
// held from reading to writing. False with `problem` in words.
bool AppendToFile(const std::string& path, const std::string& name, const std::string& hash,
                  std::string* problem);
bool RemoveFromFile(const std::string& path, const std::string& name, std::string* problem);

// `change` edits the members of the account's line, or refuses in words.
using MemberChange = std::function<bool(Json::Value* members, std::string* problem)>;
bool ChangeInFile(const std::string& path, const std::string& name, const MemberChange& change,
                  std::string* problem);

}  // namespace host

#endif
