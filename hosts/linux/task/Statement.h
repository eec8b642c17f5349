#ifndef TALO_HOSTS_LINUX_TASK_STATEMENT_H
#define TALO_HOSTS_LINUX_TASK_STATEMENT_H

#include <sqlite3.h>

#include <string>

#include "hosts/linux/task/Connection.h"

namespace host {

// One run of a prepared statement, which is free for the next one at the end. A
// failure is logged, and makes all that follows fail:
//
//     Statement statement(connection, "SELECT id FROM task WHERE user = ?");
//     statement.Bind(user);
//     while (statement.Step()) { Use(statement.Text(0)); }
//     return statement.IsGood();
class Statement {
  public:
    Statement(Connection* connection, const char* sql);
    ~Statement();
    Statement(const Statement&) = delete;
    Statement& operator=(const Statement&) = delete;

    // The next parameter. A text has to outlive the statement.
    Statement& Bind(long long value);
    Statement& Bind(const std::string& text);
    Statement& Bind(const char* text, size_t size);

    // True as long as there is a row.
    bool Step();

    // For a statement without rows: whether it was done.
    bool Run();

    bool IsGood() const;

    // Of the row. A text stays until the next step; a column of another type, or
    // NULL, reads as 0 and as "".
    long long Number(int column) const;
    const char* Text(int column) const;
    size_t TextSize(int column) const;
    bool IsNull(int column) const;

  private:
    void Check(int result);

    Connection* const connection_;
    sqlite3_stmt* const statement_;
    int next_ = 1;
    bool good_;
};

// How long a stored change has to last. What follows on the same store and has
// to outlive a loss of power makes all before it last as well.
enum class Lasting { kForGood, kUnlessPowerFails };

// What happens between begin and Commit is stored whole, or not at all. It is
// undone at the end unless it was committed.
class Transaction {
  public:
    explicit Transaction(Connection* connection, Lasting lasting = Lasting::kForGood);
    ~Transaction();
    Transaction(const Transaction&) = delete;
    Transaction& operator=(const Transaction&) = delete;

    bool HasBegun() const;
    bool Commit();

  private:
    Connection* const connection_;
    bool open_;
};

}  // namespace host

#endif
