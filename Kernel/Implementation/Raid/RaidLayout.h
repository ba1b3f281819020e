// The layouts of a RAID assembly and the arithmetic that places an assembly sector on a member.
#pragma once

#include <QString>

#include <cstdint>

enum class RaidLayout : std::uint32_t {
    None = 0,          // no data
    SingleMember = 1,  // one member read by byte position
    Concatenation = 2, // members one after another
    Striping = 3,      // chunks of `stripe` sectors across the members
    Mirroring = 4,     // every member holds the same data
    // Striping with one rotating parity chunk per row.
    ParityLeftAsymmetric = 5,  // parity from the last member down, data in member order
    ParityLeftSymmetric = 6,   // parity from the last member down, data after the parity
    ParityRightAsymmetric = 7, // parity from the first member up, data in member order
    ParityRightSymmetric = 8,  // parity from the first member up, data after the parity
};

// "Concatenation", "Striping", ...; "Unknown" for codes outside the list.
QString RaidLayoutName(std::uint32_t layout);
inline QString RaidLayoutName(RaidLayout layout)
{
    return RaidLayoutName(static_cast<std::uint32_t>(layout));
}

inline bool IsParityLayout(std::uint32_t layout)
{
    return layout >= 5 && layout <= 8;
}

// Where a sector of a striped assembly lies: the member, the sector relative to the member's start
// and how many sectors remain in its chunk from there.
struct RaidPlace
{
    std::uint32_t member = 0;
    std::uint32_t parity = 0; // parity layouts: the member holding the row's parity
    std::uint64_t memberSector = 0;
    std::uint32_t leftInChunk = 0;
};

// Layout 3 with `members` members and chunks of `stripe` sectors (both above 0).
RaidPlace PlaceStriped(std::uint64_t sector, std::uint32_t members, std::uint32_t stripe);
// Layouts 5 to 8 with `members` members (at least 3) and chunks of `stripe` sectors.
RaidPlace PlaceParity(std::uint32_t layout, std::uint64_t sector, std::uint32_t members,
                      std::uint32_t stripe);
