// The storage of a whole device: the device is the kernel object. Navigation points: the
// partition tables, the LDM database and one submenu per partition.
#pragma once

#include "hexeditor/Storage.h"

class cDevice;

namespace HexEditor {

class StorageDevice : public Storage
{
    Q_OBJECT

public:
    explicit StorageDevice(cDevice *device, QObject *parent = nullptr);
    cDevice *device() const { return m_device; }

protected:
    QList<NavigationPoint> buildNavigationPoints() override;

private:
    cDevice *m_device = nullptr;
};

} // namespace HexEditor
