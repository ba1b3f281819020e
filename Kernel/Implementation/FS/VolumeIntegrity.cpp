#include "Kernel/Implementation/FS/VolumeIntegrity.h"

#include <QHash>

namespace VolumeIntegrity {

QString GradeName(std::uint32_t grade)
{
    static const char *const names[] = {"Invalid",    "Very Bad", "Bad",       "Poor",     "Not Bad",
                                        "Acceptable", "Good",     "Very Good", "Excellent"};
    return grade <= 8 ? QString::fromLatin1(names[grade]) : QStringLiteral("Unknown");
}

int GradeClass(std::uint32_t grade)
{
    if (grade >= 6)
        return 0;
    if (grade >= 4)
        return 1;
    if (grade >= 2)
        return 2;
    return 3;
}

namespace {

using Table = QHash<std::uint64_t, const char *>;

const Table &Shared()
{
    static const Table t = {
        {1, "Primary Boot Sector"}, {2, "Copy of Boot Sector"}, {4, "Primary Boot Sector matches a Copy"}};
    return t;
}

const Table *TableOf(std::uint32_t kind)
{
    static const Table fat = {{8, "Primary FAT Table"},
                              {16, "Copy of FAT Table"},
                              {32, "Root Folder"},
                              {64, "Primary Boot Sector partially matches a Copy"}};
    static const Table none = {};
    static const Table refs = {{8, "SuperBlock"}, {16, "Check Point"}, {32, "$Chunks"},    {64, "$Bitmap"},
                               {128, "$BTree"},   {256, "$Volume"},    {512, "$Metadata"}, {1024, "$Root"}};
    static const Table zfs = {{8, "Root VDev"},     {16, "Uberblocks"},       {32, "Meta Objects Set"},
                              {64, "Pool Bitmaps"}, {128, "Meta main ZAP"},   {256, "Volume Objects Set"},
                              {512, "Root Folder"}, {1024, "Complete Volume"}};
    static const Table apfs = {{8, "Container Structures"}, {16, "Has Volume(s)"}};
    static const Table ntfs = {{1, "Primary Boot Sector"},
                               {2, "Copy of Boot Sector"},
                               {4, "Primary Boot Sector matches a Copy"},
                               {64, "Primary Boot Sector partially matches a Copy"},
                               {0x10000, "Primary $MFT"},
                               {0x20000, "Primary $MFTMrr"},
                               {0x40000, "Primary $LogFile"},
                               {0x80000, "Primary $Volume"},
                               {0x100000, "Primary $Root"},
                               {0x200000, "Primary $BitMap"},
                               {0x400000, "Primary $Boot"},
                               {0x800000, "Mirror $MFT"},
                               {0x1000000, "Mirror $MFTMirr"},
                               {0x2000000, "Mirror $LogFile"},
                               {0x4000000, "Mirror $Volume"},
                               {0x8000000, "Primary MFT matches MFT Mirror"},
                               {0x10000000, "Most likely quick-formatted"}};
    static const Table ext = {{1, "FS signature is valid"},
                              {2, "FS version is valid"},
                              {4, "Volume block size is valid"},
                              {8, "Volume fragment size is valid"},
                              {16, "Volume size is valid"},
                              {32, "INodes count is valid"},
                              {64, "First data block position is valid"},
                              {128, "Free blocks number is defined"},
                              {256, "Blocks per group is valid"},
                              {512, "Frags per group is valid"},
                              {1024, "INodes per group is valid"},
                              {2048, "INode record size is valid"},
                              {4096, "Reserved blocks number is valid"},
                              {8192, "First non-reserved inode record value is valid"},
                              {16384, "Global Group Descriptors table is valid"},
                              {32768, "SuperSector Copy exists and matched"},
                              {0x10000, "Root INode size is valid"},
                              {0x20000, "Root INode type is valid"},
                              {0x80000, "First root data block exists and valid"},
                              {0x100000, "All root data blocks are valid"},
                              {0x200000, "Location of Root Node is valid"}};
    static const Table hfs = {{256, "Main Volume header"},          {512, "Spare Volume header"},
                              {1024, "Volume headers are equal"},   {4096, "Catalog File (CF)"},
                              {8192, "Extents Overflow File (EF)"}, {16384, "Allocation File (AF)"}};
    static const Table ufs = {{1, "Superblock magic signature"},
                              {2, "Volume total size"},
                              {4, "First and last SB matched"},
                              {16, "Volume block size"},
                              {32, "Volume fragment size"},
                              {64, "Cylinder group size"},
                              {1024, "Cylinder group quantity"},
                              {4096, "Repeated SB offset"},
                              {8192, "Repeated CB descriptor offset"},
                              {16384, "Repeated INode block offset"},
                              {32768, "Root node"},
                              {0x100000000000000ull, "First SB existed"},
                              {0x200000000000000ull, "Last SB existed"}};
    static const Table btrfs = {{1, "Superblock magic signature"},
                                {16, "Sector size"},
                                {32, "Node size"},
                                {64, "Leaf size"},
                                {0x10000, "Chunks datarun collected from a \"chunk_root\""},
                                {0x20000, "Root of roots tree"},
                                {0x40000, "Root of File System tree"},
                                {0x80000, "Root folder description"},
                                {0x200000000000000ull, "Superblocks are existed and matched"}};
    static const Table xfs = {{1, "FS signature is valid."},
                              {2, "Number of data blocks is valid."},
                              {4, "Base AGF header is valid."},
                              {8, "Base AGI header is valid."},
                              {16, "Sector size is valid."},
                              {32, "Block size is valid."},
                              {64, "AG size is valid."},
                              {128, "INode size is valid."},
                              {256, "SB sector size log2 is valid."},
                              {512, "SB block size log2 is valid."},
                              {1024, "SB inode size log2 is valid."},
                              {2048, "SB directory block log2 is valid."},
                              {4096, "UUID is not zeroed."},
                              {8192, "SB root inode address is valid."},
                              {16384, "SB AG count is valid."},
                              {32768, "AG size correlates AG number and volume size."},
                              {0x10000, "Supported XFS version."},
                              {0x20000, "Supported XFS SB features."},
                              {0x40000, "Can be RO mounted."},
                              {0x80000, "SB quota flags is OK."},
                              {0x100000, "Sparse inode feature is ON."},
                              {0x200000, "Stripe unit size for the log is valid."},
                              {0x400000, "INodes per block value is valid."},
                              {0x800000, "inopblk log2 is valid."},
                              {0x1000000, "Realtime extent size is valid."},
                              {0x2000000, "max % of fs for inode space value is valid."},
                              {0x4000000, "Main block root inode is valid."},
                              {0x8000000, "AG size log2 is valid."},
                              {0x10000000, "Main SuperBlock is in use."},
                              {0x20000000, "Spare SuperBlock is in use"},
                              {0x40000000, "Mandatory SB settings."},
                              {0x100000000ull, "AGF headers are valid in all AG."},
                              {0x200000000ull, "AGI headers are valid in all AG."},
                              {0x400000000ull, "SB are completely valid in all AG."}};
    static const Table jfs = {{1, "FS signature is valid."},
                              {2, "FS Version is valid"},
                              {4, "Physical block size is valid"},
                              {16, "Block size (in bytes) is valid"},
                              {128, "Aggregate size (in physical blocks) is valid"},
                              {256, "Allocation group size is valid"},
                              {0x10000000000000ull, "Bad flag for secondary AIM & AIT is ON"},
                              {0x20000000000000ull, "FS dirty flag is ON"},
                              {0x100000000000000ull, "Main SB existed & valid"},
                              {0x200000000000000ull, "Spare SB existed & valid"}};
    switch (kind) {
    case 7:
    case 8:
    case 9:
        return &fat;
    case 10:
        return &ntfs;
    case 11:
    case 12:
        return &none;
    case 13:
        return &hfs;
    case 14:
    case 15:
    case 16:
        return &ext;
    case 17:
        return &ufs;
    case 18:
        return &refs;
    case 19:
        return &zfs;
    case 20:
        return &btrfs;
    case 21:
        return &xfs;
    case 22:
        return &jfs;
    case 23:
        return &apfs;
    default:
        return nullptr;
    }
}

// Kinds whose items follow the shared table and its fixed listing order.
bool SharedOrder(std::uint32_t kind)
{
    return kind == 7 || kind == 8 || kind == 9 || kind == 11 || kind == 12 || kind == 18 || kind == 19 ||
           kind == 23;
}

} // namespace

QString ItemName(std::uint32_t kind, std::uint64_t bit)
{
    const Table *own = TableOf(kind);
    if (own) {
        auto it = own->constFind(bit);
        if (it != own->constEnd())
            return QString::fromUtf8(it.value());
    }
    if (SharedOrder(kind)) {
        auto it = Shared().constFind(bit);
        if (it != Shared().constEnd())
            return QString::fromUtf8(it.value());
    }
    return QStringLiteral("0x%1").arg(bit, 0, 16);
}

QList<Item> Items(std::uint32_t kind, std::uint64_t validItems, std::uint64_t checkedItems)
{
    QList<Item> out;
    if (checkedItems == ~0ull)
        return out;
    // A ReFS volume without a usable copy lists neither the copy nor the comparison.
    if (kind == 18 && (checkedItems & 2) && !(validItems & 2))
        checkedItems &= ~6ull;
    QList<std::uint64_t> order;
    if (SharedOrder(kind)) {
        for (std::uint64_t b : {1ull, 2ull, 4ull, 8ull, 16ull, 32ull, 64ull})
            order << b;
        for (std::uint64_t b = 0x10000; b <= 0x10000000; b <<= 1)
            order << b;
        for (std::uint64_t b : {256ull, 512ull, 1024ull, 4096ull, 8192ull, 16384ull})
            order << b;
    } else {
        for (int i = 0; i < 64; ++i)
            order << (1ull << i);
    }
    for (std::uint64_t bit : order) {
        Item item;
        item.bit = bit;
        if (checkedItems & bit)
            item.state = (validItems & bit) ? QStringLiteral("Valid") : QStringLiteral("Invalid");
        else if (validItems & bit)
            item.state = QStringLiteral("Yes");
        else
            continue;
        item.name = ItemName(kind, bit);
        out << item;
    }
    return out;
}

} // namespace VolumeIntegrity
