#ifndef TESTS_SUPPORT_SLOTS_H
#define TESTS_SUPPORT_SLOTS_H

#include <cstring>

namespace support {

// The place of a virtual operation in its class's table, counted from 0, out of
// a pointer to member as the Itanium C++ ABI encodes it; -1 for an operation
// that is not virtual.
template <typename Member>
long SlotOf(Member member) {
    static_assert(sizeof member == 2 * sizeof(long), "an offset and an adjustment");
    long words[2];
    std::memcpy(words, &member, sizeof words);
    constexpr long kEntry = sizeof(void*);
#if defined(__arm__) || defined(__aarch64__)
    return (words[1] & 1) != 0 ? words[0] / kEntry : -1;
#else
    return (words[0] & 1) != 0 ? (words[0] - 1) / kEntry : -1;
#endif
}

// Calls an entry of an object's table that takes nothing but the object, as both
// entries of a destructor do.
inline void CallSlot(void* object, size_t slot) {
    typedef void (*Entry)(void*);
    Entry* table = nullptr;
    std::memcpy(&table, object, sizeof table);
    table[slot](object);
}

}  // namespace support

#endif
