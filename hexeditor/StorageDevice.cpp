#include "hexeditor/StorageDevice.h"

#include "Kernel/Implementation/Common/cDevice.h"
#include "hexeditor/StorageNavigation.h"

namespace HexEditor {

StorageDevice::StorageDevice(cDevice *device, QObject *parent) : Storage(device, parent), m_device(device) {}

QList<NavigationPoint> StorageDevice::buildNavigationPoints()
{
    return m_device ? Navigation::devicePoints(*m_device) : QList<NavigationPoint>();
}

} // namespace HexEditor
