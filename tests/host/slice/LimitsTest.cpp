#include "hosts/linux/slice/Limits.h"

#include "tests/host/slice/SliceFixture.h"

namespace {

class SliceLimits : public SliceTest {};

TEST_F(SliceLimits, AreTheseWhenNothingIsConfigured) {
    const host::SliceLimits limits = host::ConfiguredSliceLimits();
    EXPECT_EQ(limits.keepSeconds, 172800);
    EXPECT_EQ(limits.perUser, 100u);
    EXPECT_EQ(limits.maxBytes, 1ull << 42);
}

struct Row {
    const char* value;
    long long keepSeconds;
    size_t perUser;
    unsigned long long maxBytes;
};

TEST_F(SliceLimits, AreConfiguredByDecimalNumbersInTheirRanges) {
    constexpr unsigned long long kBytes = 1ull << 42;
    const Row rows[] = {
        {"1", 1, 1, 1},
        {"10000", 10000, 10000, 10000},
        {"10001", 10001, 100, 10001},
        {"315360000", 315360000, 100, 315360000},
        {"315360001", 172800, 100, 315360001},
        {"9223372036854775807", 172800, 100, 9223372036854775807ull},
        {"9223372036854775808", 172800, 100, kBytes},
        {"99999999999999999999999", 172800, 100, kBytes},
        {"0", 172800, 100, kBytes},
        {"-1", 172800, 100, kBytes},
        {"+1", 172800, 100, kBytes},
        {"0x10", 172800, 100, kBytes},
        {"1 day", 172800, 100, kBytes},
        {"1e3", 172800, 100, kBytes},
        {"many", 172800, 100, kBytes},
    };
    for (const Row& row : rows) {
        const std::string value = row.value;
        Configure("slice_keep=\"" + value + "\"\nslice_per_user=\"" + value +
                  "\"\nslice_max_bytes=\"" + value + "\"\n");
        const host::SliceLimits limits = host::ConfiguredSliceLimits();
        EXPECT_EQ(limits.keepSeconds, row.keepSeconds) << value;
        EXPECT_EQ(limits.perUser, row.perUser) << value;
        EXPECT_EQ(limits.maxBytes, row.maxBytes) << value;
    }
}

}  // namespace
