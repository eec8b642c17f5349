#ifndef TALO_PROGRAMS_WEBAPI_SERVER_SLOTTABLE_H
#define TALO_PROGRAMS_WEBAPI_SERVER_SLOTTABLE_H

#include "programs/webapi_server/Slot.h"

// The slots of all workers, in memory that the master shares with what it forks.
// Each has a page of its own: a worker gives up the others, so that one that runs
// wild cannot falsify what the master knows of its neighbours.
class SlotTable {
  public:
    explicit SlotTable(int count);
    ~SlotTable();
    SlotTable(const SlotTable&) = delete;
    SlotTable& operator=(const SlotTable&) = delete;

    bool IsMapped() const {
        return pages_ != nullptr;
    }
    int Count() const {
        return count_;
    }

    // Makes the slot empty.
    void Clear(int index);
    Slot* At(int index) const;

    // In the worker: unmaps every other slot. Only this one may be used from then on.
    void KeepOnly(int index);

  private:
    char* Page(int index) const;

    int count_;
    size_t pageSize_;
    char* pages_ = nullptr;
};

#endif
