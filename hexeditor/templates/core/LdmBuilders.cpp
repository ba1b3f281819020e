#include "hexeditor/templates/core/LdmBuilders.h"

#include <QCoreApplication>

#include "hexeditor/templates/core/Record.h"
#include "hexeditor/templates/core/Values.h"

namespace HexEditor::Templates {

namespace {

QString tr(const char *text)
{
    return QCoreApplication::translate("HexEditor::Templates::LdmModel", text);
}

struct Row
{
    std::uint32_t offset;
    std::uint32_t size;
    const char *name;
    FieldFormat format;
};

template <std::size_t N> void addRows(Record &r, Node *parent, const Row (&rows)[N])
{
    for (const Row &row : rows)
        r.add(parent, tr(row.name), row.format, row.offset, row.size);
}

} // namespace

void LdmPrivHeadBuilder::build(Record &r)
{
    static const Row rows[] = {
        {0, 8, "Signature", AnsiSpacePadded},
        {8, 4, "Check sum", UInt32},
        {12, 2, "Major version", UInt16},
        {14, 2, "Minor version", UInt16},
        {16, 8, "Time stamp", FileTime},
        {32, 8, "Primary Header", UInt64},
        {40, 8, "Backup Header", UInt64},
        {48, 64, "Disk Id GUID (string)", AnsiZeroPadded},
        {112, 64, "Host Id GUID (string)", AnsiZeroPadded},
        {176, 64, "Disk group Id GUID (string)", AnsiZeroPadded},
        {240, 32, "Disk group name", AnsiZeroPadded},
        {283, 8, "Data partition start", UInt64},
        {291, 8, "Data partition size", UInt64},
        {299, 8, "Meta partition start", UInt64},
        {307, 8, "Meta partition size", UInt64},
        {315, 8, "Primary TOC block", UInt64},
        {323, 8, "Backup TOC block", UInt64},
        {339, 8, "Configuration size", UInt64},
        {347, 8, "Log size", UInt64},
        {359, 16, "Disk set GUID", HexBytes},
        {375, 16, "Disk set GUID copy", HexBytes},
    };
    addRows(r, nullptr, rows);
}

void LdmTocBuilder::build(Record &r)
{
    static const Row rows[] = {
        {0, 8, "Signature", AnsiZeroPadded},    {8, 4, "Check sum", UInt32},
        {36, 8, "Config name", AnsiZeroPadded}, {46, 8, "Config start", UInt64},
        {54, 8, "Config size", UInt64},         {70, 8, "Log name", AnsiZeroPadded},
        {80, 8, "Log start", UInt64},           {88, 8, "Log size", UInt64},
    };
    addRows(r, nullptr, rows);
}

void LdmVmdbBuilder::build(Record &r)
{
    static const Row rows[] = {
        {0, 4, "Signature", AnsiZeroPadded},
        {4, 4, "Total VBLK records", UInt32},
        {8, 4, "VBLK size", UInt32},
        {12, 4, "First VBLK offset", UInt32},
        {16, 2, "Update status", UInt16},
        {18, 2, "Major version number", UInt16},
        {20, 2, "Minor version number", UInt16},
        {22, 31, "Disk group name", AnsiZeroPadded},
        {53, 64, "Disk group Id", AnsiZeroPadded},
        {117, 8, "Committed sequence", UInt64},
        {125, 8, "Pending sequence", UInt64},
        {133, 4, "Committed volume VBLKs", UInt32},
        {137, 4, "Committed component VBLKs", UInt32},
        {141, 4, "Committed partition VBLKs", UInt32},
        {145, 4, "Committed disk VBLKs", UInt32},
        {161, 4, "Pending volume VBLKs", UInt32},
        {165, 4, "Pending component VBLKs", UInt32},
        {169, 4, "Pending partition VBLKs", UInt32},
        {173, 4, "Pending disk VBLKs", UInt32},
        {189, 8, "Last accessed time", FileTime},
    };
    addRows(r, nullptr, rows);
}

void LdmKlogBuilder::build(Record &r)
{
    static const Row rows[] = {
        {0, 4, "Signature", AnsiSpacePadded}, {12, 4, "Log count", UInt32},
        {16, 4, "KLOGs number", UInt32},      {20, 4, "KLOG index", UInt32},
        {25, 8, "Committed Id 1", UInt64},    {33, 8, "Pending Id 1", UInt64},
    };
    addRows(r, nullptr, rows);
}

void LdmVblkBuilder::build(Record &r)
{
    const QByteArray &b = r.buffer(false);
    Node *header = r.add(nullptr, tr("Standard header"), Group, 0, 16);
    static const Row headerRows[] = {
        {0, 4, "Signature", AnsiZeroPadded},  {4, 4, "Sequence number", UInt32},
        {8, 4, "Group number", UInt32},       {12, 2, "Record number", UInt16},
        {14, 2, "Number of records", UInt16},
    };
    addRows(r, header, headerRows);

    std::uint64_t type = 0, length = 0;
    Values::readUnsigned(b, 19, 1, true, type);
    const bool haveLength = Values::readUnsigned(b, 20, 4, true, length);
    const char *groupName = "Data";
    switch (type) {
    case 0x32:
        groupName = "Component";
        break;
    case 0x33:
        groupName = "Partition";
        break;
    case 0x34:
        groupName = "Disk";
        break;
    case 0x35:
        groupName = "Disk Group";
        break;
    case 0x51:
        groupName = "Volume";
        break;
    default:
        break;
    }
    Node *g = r.add(nullptr, tr(groupName), Group, 16, 112);
    static const Row recordRows[] = {
        {16, 2, "Update status", UInt16},
        {18, 1, "Flags", Hex8},
        {19, 1, "Record type", Hex8},
        {20, 4, "Data length", UInt32},
    };
    addRows(r, g, recordRows);
    // The data length comes from the record: only a length that fits the record gets a field.
    if (haveLength && length >= 1 && length <= MaxDataLength)
        r.add(g, tr("Data"), HexBytes, 24, std::uint32_t(length));
}

} // namespace HexEditor::Templates
