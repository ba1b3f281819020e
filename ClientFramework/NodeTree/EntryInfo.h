// What the nodes read from a file-system entry: its kernel objects, status, flags and the
// values of the file property groups.
#pragma once

#include "ClientFramework/NodeTree/IProperty.h"

#include <QString>

#include <cstdint>

class CEntry;
class CVolume;
class CPartition;
class CDevice;

namespace EntryInfo {

// Attribute bit of a deleted entry (file systems that list deleted entries set it).
constexpr std::uint32_t AttrDeleted = 0x80000000u;
// The system attribute of FAT-style attribute bytes.
constexpr std::uint32_t AttrSystem = 0x04u;

bool isDeleted(const CEntry *entry);
bool isSystem(const CEntry *entry);
// "Deleted", "System" or "Healthy".
QString statusText(const CEntry *entry);
// The node state bits that follow from the entry (Ready, System, Deleted, ReadOnly).
std::uint32_t stateOf(const CEntry *entry);

CVolume *volumeOf(const CEntry *entry);
CPartition *partitionOf(const CEntry *entry);
CDevice *deviceOf(const CEntry *entry);

// "%1[%2]": the name and the entry index.
QString key(const CEntry *entry);

// The "Attributes" and "Advanced Properties" groups of an entry.
PropertyGroup attributeGroup(const CEntry *entry);
PropertyGroup advancedGroup(const CEntry *entry);

} // namespace EntryInfo
