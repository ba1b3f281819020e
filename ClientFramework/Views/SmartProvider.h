// Where the SMART pane gets a device's SMART data: the parameter record and the attribute table of
// a device node. Until the kernel reads SMART data from drives, NoSmartProvider answers for every
// device that it has none.
#pragma once

#include <QList>
#include <QString>

#include <cstdint>

class NodeCore;

namespace Framework {

// The identification and SMART status fields of one device.
struct SmartParameters
{
    QString model;
    QString serial;
    QString firmware;
    std::uint64_t capacity = 0; // bytes
    std::uint8_t ataMajor = 255;
    std::uint16_t ataMinor = 65535;
    // 1 supported and enabled, 2 supported but the return-status command failed, 3 switched off.
    std::uint8_t support = 0;
    std::uint8_t offlineStatus = 0;
    std::uint8_t selfTestStatus = 0;
    std::uint16_t offlineSeconds = 0;
    std::uint8_t offlineCapability = 0;
    std::uint16_t smartCapability = 0;
    std::uint8_t errorLogCapability = 0;
    std::uint8_t shortTestMinutes = 0;
    std::uint8_t extendedTestMinutes = 0;
};

// One row of the attribute table.
struct SmartAttribute
{
    std::uint8_t id = 0;
    std::uint8_t value = 0;
    std::uint8_t worst = 0;
    std::uint8_t threshold = 0;
    std::uint8_t type = 0;       // 1 Old-age, else Pre-fail
    std::uint8_t updated = 0;    // 1 Offline, else Always
    std::uint8_t whenFailed = 0; // 2 failing now, 1 failed in the past, 0 never
    std::uint64_t raw = 0;
};

class ISmartProvider
{
public:
    virtual ~ISmartProvider() = default;
    // False when the device gives no parameters.
    virtual bool readParameters(NodeCore *device, SmartParameters &out) = 0;
    // False when the device gives no attributes.
    virtual bool readAttributes(NodeCore *device, QList<SmartAttribute> &out) = 0;
};

class NoSmartProvider : public ISmartProvider
{
public:
    bool readParameters(NodeCore *, SmartParameters &) override { return false; }
    bool readAttributes(NodeCore *, QList<SmartAttribute> &) override { return false; }
};

} // namespace Framework
