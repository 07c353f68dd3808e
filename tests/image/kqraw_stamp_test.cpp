// The creation time that a new raw container's header block records.

#include <cstdint>
#include <ctime>

#include <gtest/gtest.h>

#include "image/kqraw_block.h"

namespace img {
namespace {

TEST(KqRawHeaderStamp, RecordsTheSystemClock) {
    KqRawBlockPtr header(kqrawBlockCreateHeader());
    ASSERT_NE(header, nullptr);
    const std::int64_t before = static_cast<std::int64_t>(std::time(nullptr));
    kqrawHeaderStamp(header.get());
    const std::int64_t after = static_cast<std::int64_t>(std::time(nullptr));

    std::uint32_t seconds = 0, microseconds = 0;
    ASSERT_TRUE(kqrawBlockGet32(header.get(), img::kqhdr::kSeconds, &seconds));
    ASSERT_TRUE(kqrawBlockGet32(header.get(), img::kqhdr::kMicroseconds, &microseconds));
    EXPECT_GE(seconds, before);
    EXPECT_LE(seconds, after);
    EXPECT_LT(microseconds, 1000000u);
}

// A 32-bit time_t ends in January 2038: the clock then fails, the stamp
// reads 1970 and the run's start time is garbage. The build asks for 64-bit
// time on 32-bit hosts.
TEST(KqRawHeaderStamp, ClockReachesPastJanuary2038) {
    EXPECT_GE(sizeof(std::time_t), 8u);
}

} // namespace
} // namespace img
