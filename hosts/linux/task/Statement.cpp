#include "hosts/linux/task/Statement.h"

namespace host {

Statement::Statement(Connection* connection, const char* sql)
    : connection_(connection),
      statement_(connection->Prepared(sql)),
      good_(statement_ != nullptr) {}

Statement::~Statement() {
    if (statement_ != nullptr) {
        (void)sqlite3_reset(statement_);
        (void)sqlite3_clear_bindings(statement_);
    }
}

void Statement::Check(int result) {
    if (good_ && result != SQLITE_OK) {
        good_ = false;
        connection_->Fail("use it");
    }
}

Statement& Statement::Bind(long long value) {
    if (good_) {
        Check(sqlite3_bind_int64(statement_, next_++, value));
    }
    return *this;
}

Statement& Statement::Bind(const std::string& text) {
    return Bind(text.data(), text.size());
}

Statement& Statement::Bind(const char* text, size_t size) {
    if (good_) {
        Check(sqlite3_bind_text64(statement_, next_++, text, size, SQLITE_STATIC, SQLITE_UTF8));
    }
    return *this;
}

bool Statement::Step() {
    if (!good_) {
        return false;
    }
    const int result = sqlite3_step(statement_);
    if (result != SQLITE_ROW && result != SQLITE_DONE) {
        Check(result);
    }
    return result == SQLITE_ROW;
}

bool Statement::Run() {
    return !Step() && good_;
}

bool Statement::IsGood() const {
    return good_;
}

long long Statement::Number(int column) const {
    return sqlite3_column_int64(statement_, column);
}

const char* Statement::Text(int column) const {
    const unsigned char* text = sqlite3_column_text(statement_, column);
    return text != nullptr ? reinterpret_cast<const char*>(text) : "";
}

size_t Statement::TextSize(int column) const {
    return static_cast<size_t>(sqlite3_column_bytes(statement_, column));
}

bool Statement::IsNull(int column) const {
    return sqlite3_column_type(statement_, column) == SQLITE_NULL;
}

// IMMEDIATE: whoever reads first and writes then could be too late for both.
Transaction::Transaction(Connection* connection, Lasting lasting)
    : connection_(connection),
      open_(Statement(connection, lasting == Lasting::kForGood ? "PRAGMA synchronous = FULL"
                                                               : "PRAGMA synchronous = NORMAL")
                .Run() &&
            Statement(connection, "BEGIN IMMEDIATE").Run()) {}

Transaction::~Transaction() {
    // Some failures have undone it already.
    if (open_ && sqlite3_get_autocommit(connection_->Handle()) == 0) {
        (void)Statement(connection_, "ROLLBACK").Run();
    }
}

bool Transaction::HasBegun() const {
    return open_;
}

bool Transaction::Commit() {
    if (!open_ || !Statement(connection_, "COMMIT").Run()) {
        return false;
    }
    open_ = false;
    return true;
}

}  // namespace host
