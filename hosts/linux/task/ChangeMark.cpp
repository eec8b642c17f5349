#include "hosts/linux/task/ChangeMark.h"

#include <sqlite3.h>

namespace host {

namespace {

// Of SQLite's file format: the shared index of the write-ahead log is mapped in
// pieces of this size, and begins with a header of 48 bytes that each commit
// writes anew, with a counter and check sums.
constexpr int kIndexPiece = 32768;

}  // namespace

bool ReadChangeMark(Connection* connection, ChangeMark* mark) {
    sqlite3_file* file = nullptr;
    void volatile* index = nullptr;
    if (sqlite3_file_control(connection->Handle(), "main", SQLITE_FCNTL_FILE_POINTER, &file) !=
            SQLITE_OK ||
        file == nullptr || file->pMethods == nullptr || file->pMethods->iVersion < 2 ||
        file->pMethods->xShmMap(file, 0, kIndexPiece, 0, &index) != SQLITE_OK || index == nullptr) {
        return false;
    }
    const unsigned volatile* words = static_cast<const unsigned volatile*>(index);
    for (unsigned& word : *mark) {
        word = *words++;
    }
    return true;
}

}  // namespace host
