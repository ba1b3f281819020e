// Back and Forward through the caret's jumps.
#include "hexeditor/JumpHistory.h"

#include <gtest/gtest.h>

using HexEditor::JumpHistory;
using Entry = JumpHistory::Entry;

TEST(JumpHistory, BackStaysDisabledAfterTheFirstJump)
{
    JumpHistory h;
    EXPECT_FALSE(h.canGoBack());
    EXPECT_FALSE(h.canGoForward());
    h.add(4096);
    EXPECT_FALSE(h.canGoBack());
    EXPECT_FALSE(h.back().has_value());
    h.add(8192);
    EXPECT_TRUE(h.canGoBack());
}

TEST(JumpHistory, BackFromTheEndStepsOverTheCurrentPositionAndForwardReturns)
{
    JumpHistory h;
    h.add(0);
    h.add(5000);
    h.add(20000);
    ASSERT_EQ(h.index(), 3);

    EXPECT_EQ(h.back(), (Entry{5000, 0}));
    EXPECT_TRUE(h.canGoForward());
    // Applying the entry moves the caret there again: that is no new jump.
    h.add(5000);
    EXPECT_EQ(h.entries().size(), 3);
    EXPECT_EQ(h.index(), 1);

    EXPECT_EQ(h.back(), (Entry{0, 0}));
    EXPECT_FALSE(h.canGoBack()) << "at the first entry";
    EXPECT_EQ(h.forward(), (Entry{5000, 0}));
    EXPECT_EQ(h.forward(), (Entry{20000, 0}));
    EXPECT_FALSE(h.canGoForward());
    EXPECT_FALSE(h.forward().has_value());
}

TEST(JumpHistory, ANewJumpAfterBackDropsTheForwardEntries)
{
    JumpHistory h;
    h.add(0);
    h.add(5000);
    h.add(20000);
    h.back(); // onto 5000
    h.add(70000);
    ASSERT_EQ(h.entries().size(), 3);
    EXPECT_EQ(h.entries()[0].offset, 0u);
    EXPECT_EQ(h.entries()[1].offset, 5000u);
    EXPECT_EQ(h.entries()[2].offset, 70000u);
    EXPECT_FALSE(h.canGoForward());
    EXPECT_EQ(h.index(), 3);
}

TEST(JumpHistory, SameOffsetTakesTheNewTemplateType)
{
    JumpHistory h;
    h.add(0);
    h.add(512);
    h.add(512, 2);
    ASSERT_EQ(h.entries().size(), 2);
    EXPECT_EQ(h.entries().last(), (Entry{512, 2}));
    EXPECT_EQ(h.back(), (Entry{0, 0}));
    EXPECT_EQ(h.forward(), (Entry{512, 2}));
}

TEST(JumpHistory, NeverHoldsMoreThanSixtyOneEntries)
{
    JumpHistory h;
    for (uint64_t i = 0; i < 200; ++i)
        h.add(i * 4096);
    EXPECT_EQ(h.entries().size(), JumpHistory::Limit + 1);
    EXPECT_EQ(h.entries().last().offset, 199u * 4096);
    EXPECT_EQ(h.entries().first().offset, (199u - JumpHistory::Limit) * 4096);
    int steps = 0;
    while (h.back())
        ++steps;
    EXPECT_EQ(steps, JumpHistory::Limit);
    EXPECT_EQ(h.index(), 0);
}
