#include "Kernel/Implementation/Raid/RaidLayout.h"

QString RaidLayoutName(std::uint32_t layout)
{
    switch (layout) {
    case 0:
        return QStringLiteral("None");
    case 1:
        return QStringLiteral("Single Member");
    case 2:
        return QStringLiteral("Concatenation");
    case 3:
        return QStringLiteral("Striping");
    case 4:
        return QStringLiteral("Mirroring");
    case 5:
        return QStringLiteral("Parity, Left Asymmetric");
    case 6:
        return QStringLiteral("Parity, Left Symmetric");
    case 7:
        return QStringLiteral("Parity, Right Asymmetric");
    case 8:
        return QStringLiteral("Parity, Right Symmetric");
    default:
        return QStringLiteral("Unknown");
    }
}

RaidPlace PlaceStriped(std::uint64_t sector, std::uint32_t members, std::uint32_t stripe)
{
    RaidPlace place;
    const std::uint64_t chunk = sector / stripe;
    const std::uint32_t offset = static_cast<std::uint32_t>(sector % stripe);
    const std::uint64_t row = chunk / members;
    place.member = static_cast<std::uint32_t>(chunk % members);
    place.parity = place.member;
    place.memberSector = row * stripe + offset;
    place.leftInChunk = stripe - offset;
    return place;
}

RaidPlace PlaceParity(std::uint32_t layout, std::uint64_t sector, std::uint32_t members, std::uint32_t stripe)
{
    RaidPlace place;
    const std::uint64_t chunk = sector / stripe;
    const std::uint32_t offset = static_cast<std::uint32_t>(sector % stripe);
    const std::uint64_t row = chunk / (members - 1);
    const std::uint32_t d = static_cast<std::uint32_t>(chunk % (members - 1));
    const std::uint32_t r = static_cast<std::uint32_t>(row % members);
    const bool parityFromFirst = layout == 7 || layout == 8;
    const bool symmetric = layout == 6 || layout == 8;
    const std::uint32_t p = parityFromFirst ? r : members - 1 - r;
    place.parity = p;
    if (symmetric)
        place.member = (d + 1 + p) % members;
    else
        place.member = d >= p ? d + 1 : d;
    place.memberSector = row * stripe + offset;
    place.leftInChunk = stripe - offset;
    return place;
}
