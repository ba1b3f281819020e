// The words of SMART data shown to the user and written into reports: attribute names by id, the
// ATA standard revision of a minor version, and the texts of an attribute's type, update mode and
// failure state.
#pragma once

#include <QString>
#include <cstdint>

namespace Smart {

// The name of an attribute id; an id without a name gives "Unknown (%1)" with the id in decimal.
QString attributeName(uint8_t id);
// The published revision name of an ATA minor version 1..34, else "Device does not report version".
QString ataStandardText(uint16_t minorVersion);
// 1 "Old-age", anything else "Pre-fail".
QString attributeTypeText(uint8_t type);
// 1 "Offline", anything else "Always".
QString attributeUpdatedText(uint8_t updated);
// 2 "Failing now", 1 "Failed in the past", anything else "Never".
QString whenFailedText(uint8_t whenFailed);

} // namespace Smart
