#include "programs/webapi_server/SlotTable.h"

#include <sys/mman.h>
#include <unistd.h>

#include <new>

static_assert(std::atomic<long long>::is_always_lock_free &&
                  std::atomic<pid_t>::is_always_lock_free,
              "slots are shared between processes");

SlotTable::SlotTable(int count)
    : count_(count), pageSize_(static_cast<size_t>(sysconf(_SC_PAGESIZE))) {
    void* const memory = mmap(nullptr, static_cast<size_t>(count) * pageSize_,
                              PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
    if (memory != MAP_FAILED) {
        pages_ = static_cast<char*>(memory);
    }
}

SlotTable::~SlotTable() {
    if (pages_ != nullptr) {
        (void)munmap(pages_, static_cast<size_t>(count_) * pageSize_);
    }
}

void SlotTable::Clear(int index) {
    new (Page(index)) Slot();
    At(index)->api[0] = '\0';
    At(index)->answerBegun = 0;
}

Slot* SlotTable::At(int index) const {
    return std::launder(reinterpret_cast<Slot*>(Page(index)));
}

void SlotTable::KeepOnly(int index) {
    if (index > 0) {
        (void)munmap(pages_, static_cast<size_t>(index) * pageSize_);
    }
    if (index + 1 < count_) {
        (void)munmap(Page(index + 1), static_cast<size_t>(count_ - index - 1) * pageSize_);
    }
}

char* SlotTable::Page(int index) const {
    return pages_ + static_cast<size_t>(index) * pageSize_;
}
