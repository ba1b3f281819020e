#include <gtest/gtest.h>

#include "Kernel/Implementation/Common/KernelVersion.h"
#include "smart/AtaString.h"

TEST(KernelVersion, IsTheDottedText) { EXPECT_EQ(Kernel::version(), QStringLiteral("14.04.23")); }

TEST(AtaString, SwapsBytesTrimsAndStaysInside)
{
    // "ST3500630AS " stored word-swapped, then blanks; a field running past the buffer stops at its end.
    const char raw[] = "TS530036A0 S    ";
    const auto *p = reinterpret_cast<const uint8_t *>(raw);
    EXPECT_EQ(Smart::ataString(p, 16, 0, 8), QStringLiteral("ST3500630AS"));
    EXPECT_EQ(Smart::ataString(p, 4, 0, 8), QStringLiteral("ST35"));
    EXPECT_EQ(Smart::ataString(p, 16, 100, 4), QString());
}
