// The assertion of the shared header once more, compiled as a release is: it must hold there, too.
// ov_kvassoc_test.cpp has everything else.
#include "orvale/ov_kvassoc.h"

#include <gtest/gtest.h>

#include <csignal>
#include <memory>

#if !defined(NDEBUG) || !defined(__OPTIMIZE__)
#error "compile this file with -DNDEBUG and -O2: it is about such builds"
#endif

namespace
{

TEST(KvAssocReleaseDeathTest, TheMarkOfAnEmptySlotIsNotStored)
{
    const auto table = std::make_unique<okv_assoc_entry[]>(OKV_ASSOC_SIZE);
    for (uint32 slot = 0; slot < OKV_ASSOC_SIZE; ++slot) {
        table[slot] = {0, OKV_INVALID_VALUE, 0};
    }
    okv_value old = 77;
    EXPECT_EXIT((void)okv_assoc_add_or_replace(table.get(), okv_key_of(1, 500), 65535, &old),
                testing::KilledBySignal(SIGABRT), "ov_kvassoc\\.h:99: .*v!=OKV_INVALID_VALUE");
    EXPECT_EQ(okv_assoc_add_or_replace(table.get(), okv_key_of(1, 500), 65534, &old), 1);
    EXPECT_EQ(old, 65535U);
    EXPECT_EQ(table[500].value, 65534U);
}

} // namespace
