// Names of integrity grades and items, and the list of items the property view shows for a
// volume ("Valid", "Invalid" or "Yes").
#pragma once

#include <QList>
#include <QString>

#include <cstdint>

namespace VolumeIntegrity {

// "Invalid", "Very Bad", ..., "Excellent" for 0..8; "Unknown" otherwise.
QString GradeName(std::uint32_t grade);

// The icon class of a grade: 0 good (>= 6), 1 neutral (4..5), 2 warning (2..3), 3 error (< 2).
int GradeClass(std::uint32_t grade);

// The name of one item bit of a file-system kind, or "0x%1" (hexadecimal) without a name.
QString ItemName(std::uint32_t kind, std::uint64_t bit);

struct Item
{
    std::uint64_t bit = 0;
    QString name;
    QString state; // "Valid", "Invalid" or "Yes"
};

// The items shown for the masks: kinds with the shared table in its fixed bit order, the others
// every set bit from the lowest. Nothing when checkedItems is all ones (not assessed).
QList<Item> Items(std::uint32_t kind, std::uint64_t validItems, std::uint64_t checkedItems);

} // namespace VolumeIntegrity
