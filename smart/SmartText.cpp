#include "smart/SmartText.h"

#include <QCoreApplication>

#include <algorithm>
#include <iterator>

namespace Smart {

namespace {

struct Named
{
    uint8_t id;
    const char *name;
};

// Sorted by id. 13 and 201, 191 and 221, 193 and 225 share their names.
constexpr Named AttributeNames[] = {
    {1, "Read Error Rate"},
    {2, "Throughput Performance"},
    {3, "Spin-Up Time"},
    {4, "Start/Stop Count"},
    {5, "Reallocated Sectors Count"},
    {6, "Read Channel Margin"},
    {7, "Seek Error Rate"},
    {8, "Seek Time Performance"},
    {9, "Power-On Hours Count"},
    {10, "Spin-up Retries"},
    {11, "Calibration Retries"},
    {12, "Power Cycle Count"},
    {13, "Soft Read Error Rate"},
    {100, "Erase/Program Cycles"},
    {103, "Translation Table Rebuild"},
    {108, "Unknown (108)"},
    {160, "Initial Bad Block Count"},
    {161, "Bad Block Count"},
    {162, "Spare Block Count"},
    {163, "Max Erase Count"},
    {164, "Min Erase Count"},
    {165, "Average Erase Count"},
    {166, "Minimum W/E Cycle"},
    {167, "Minimum Bad Block/Die"},
    {168, "SATA PHY Error Count"},
    {169, "Total Bad Block"},
    {170, "Reserved Block Count"},
    {171, "Program Fail Count"},
    {172, "Erase Fail Count"},
    {173, "Wear Leveller Worst Case Erase Count"},
    {174, "Unexpected Power Loss"},
    {175, "Program Fail Count Chip"},
    {176, "Erase Fail Count Chip"},
    {177, "Wear Leveling Count"},
    {178, "Used Reserved Block Count Chip"},
    {179, "Used Reserved Block Count Total"},
    {180, "Unused Reserved Block Count Total"},
    {181, "Program Fail Count Total"},
    {182, "Erase Fail Count Total"},
    {183, "SATA Downshifts"},
    {184, "End-to-End error"},
    {185, "Head Stability"},
    {186, "Induced Op-Vibration Detection"},
    {187, "Reported Uncorrectable Errors"},
    {188, "Command Timeout"},
    {189, "High Fly Writes"},
    {190, "Airflow Temperature Celsius"},
    {191, "G-Sense Error Rate"},
    {192, "Power-Off Retract Cycles"},
    {193, "Load/Unload Cycle Count"},
    {194, "HDA Temperature Celsius"},
    {195, "Hardware ECC Recovered"},
    {196, "Reallocated Event Count"},
    {197, "Current Pending Sectors"},
    {198, "Off-line Uncorrectable"},
    {199, "UDMA CRC Error Count"},
    {200, "Write Error Rate"},
    {201, "Soft Read Error Rate"},
    {202, "Data Address Mark Errors"},
    {203, "Run Out Cancel"},
    {204, "Soft ECC Corrections"},
    {205, "Thermal Asperity Rate"},
    {206, "Flying Height"},
    {207, "Spin High Current"},
    {208, "Spin Buzz"},
    {209, "Offline Seek Performance"},
    {220, "Disk Shift"},
    {221, "G-Sense Error Rate"},
    {222, "Loaded Hours"},
    {223, "Load/Unload Retry Count"},
    {224, "Load Friction"},
    {225, "Load/Unload Cycle Count"},
    {226, "Load-in Time"},
    {227, "Torque Amplification Count"},
    {228, "Power-off Retract Count"},
    {230, "GMR Head Amplitude"},
    {231, "Temperature Celsius"},
    {232, "Available Reserved Space"},
    {233, "Media Wearout Indicator"},
    {236, "Unstable Power Count"},
    {240, "Head Flying Hours"},
    {241, "Total LBAs Written"},
    {242, "Total LBAs Read"},
    {246, "Total Host Sector Write"},
    {247, "Host Program Page Count"},
    {248, "Background Program Page Count"},
    {249, "NAND Writes 1GiB"},
    {250, "Read Error Retry Rate"},
    {252, "Added Bad Flash Block Count"},
    {254, "Free Fall Sensor"},
};

// Minor versions 1..34 of the identify data's word 81.
constexpr const char *AtaStandards[] = {
    "ATA-1 X3T9.2 781D prior to revision 4",
    "ATA-1 published, ANSI X3.221-1994",
    "ATA-1 X3T9.2 781D revision 4",
    "ATA-2 published, ANSI X3.279-1996",
    "ATA-2 X3T10 948D prior to revision 2k",
    "ATA-3 X3T10 2008D revision 1",
    "ATA-2 X3T10 948D revision 2k",
    "ATA-3 X3T10 2008D revision 0",
    "ATA-2 X3T10 948D revision 3",
    "ATA-3 published, ANSI X3.298-1997",
    "ATA-3 X3T10 2008D revision 6",
    "ATA-3 X3T13 2008D revision 7 and 7a",
    "ATA/ATAPI-4 X3T13 1153D revision 6",
    "ATA/ATAPI-4 T13 1153D revision 13",
    "ATA/ATAPI-4 X3T13 1153D revision 7",
    "ATA/ATAPI-4 T13 1153D revision 18",
    "ATA/ATAPI-4 T13 1153D revision 15",
    "ATA/ATAPI-4 published, ANSI INCITS 317-1998",
    "ATA/ATAPI-5 T13 1321D revision 3",
    "ATA/ATAPI-4 T13 1153D revision 14",
    "ATA/ATAPI-5 T13 1321D revision 1",
    "ATA/ATAPI-5 published, ANSI INCITS 340-2000",
    "ATA/ATAPI-4 T13 1153D revision 17",
    "ATA/ATAPI-6 T13 1410D revision 0",
    "ATA/ATAPI-6 T13 1410D revision 3a",
    "ATA/ATAPI-7 T13 1532D revision 1",
    "ATA/ATAPI-6 T13 1410D revision 2",
    "ATA/ATAPI-6 T13 1410D revision 1",
    "ATA/ATAPI-7 published, ANSI INCITS 397-2005",
    "ATA/ATAPI-7 T13 1532D revision 0",
    "Reserved",
    "Reserved",
    "ATA/ATAPI-7 T13 1532D revision 4a",
    "ATA/ATAPI-6 published, ANSI INCITS 361-2002",
};
static_assert(std::size(AtaStandards) == 34);

QString tr(const char *text)
{
    return QCoreApplication::translate("Smart", text);
}

} // namespace

QString attributeName(uint8_t id)
{
    const auto *end = std::end(AttributeNames);
    const auto *it = std::lower_bound(std::begin(AttributeNames), end, id,
                                      [](const Named &n, uint8_t v) { return n.id < v; });
    if (it != end && it->id == id)
        return tr(it->name);
    return tr("Unknown (%1)").arg(id);
}

QString ataStandardText(uint16_t minorVersion)
{
    if (minorVersion >= 1 && minorVersion <= std::size(AtaStandards))
        return tr(AtaStandards[minorVersion - 1]);
    return tr("Device does not report version");
}

QString attributeTypeText(uint8_t type)
{
    return type == 1 ? tr("Old-age") : tr("Pre-fail");
}

QString attributeUpdatedText(uint8_t updated)
{
    return updated == 1 ? tr("Offline") : tr("Always");
}

QString whenFailedText(uint8_t whenFailed)
{
    switch (whenFailed) {
    case 2:
        return tr("Failing now");
    case 1:
        return tr("Failed in the past");
    default:
        return tr("Never");
    }
}

} // namespace Smart
