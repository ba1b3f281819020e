// One enumeration pass: every candidate the platform lists is identified through a platform handle
// (geometry, partition style, identity texts, rotation) and given the volumes that lie on it.
#pragma once

#include "Kernel/Implementation/Common/DeviceInfo.h"
#include "Kernel/Implementation/Common/RootEnumSource.h"

#include <QList>

class CRoot;

class CEnumerator
{
public:
    CEnumerator(CRoot *root, IEnumerationSource &source);

    // Descriptors of every device found, in the platform's order. Each carries a platform handle
    // (closed) that the caller owns.
    QList<DeviceInfo> Enumerate();

    // Identifies one candidate without volumes. False when the candidate is to be dropped (it
    // vanished before it could be opened); a device that cannot be opened or queried for other
    // reasons is described as not ready from what the platform lists, with the reason reported.
    bool Identify(const EnumCandidate &candidate, DeviceInfo &info);

    // Identifies one candidate and claims the platform's volumes that lie on it.
    bool IdentifyWithVolumes(const EnumCandidate &candidate, DeviceInfo &info);

    // Appends the volumes whose extent names the device and marks them claimed; reports differences
    // of media type, ready state and sector size. `claimed` runs parallel to `volumes`.
    void ClaimVolumes(DeviceInfo &info, QList<VolumeInfo> &volumes, QList<bool> &claimed);
    // The checks after claiming and the "whole device is one volume" style.
    void FinishDevice(DeviceInfo &info);

private:
    void Internal(const QString &text);
    void Record(uint32_t operation, const QString &name, uint32_t error);
    void FillFromPlatform(const EnumCandidate &candidate, DeviceInfo &info);
    bool ReadIdentifyBlock(DeviceInfo &info, uint8_t *block512);
    QString DeviceName(const DeviceInfo &info) const;

    CRoot *m_root;
    IEnumerationSource &m_source;
};
