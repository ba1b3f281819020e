// The storage of a volume: sectors come from the volume's partition (the volume's medium); the
// file-system questions are the volume's, with the volume starting at byte 0.
#pragma once

#include "hexeditor/StorageVolumeBase.h"

namespace HexEditor {

class StorageVolume : public StorageVolumeBase
{
    Q_OBJECT

public:
    explicit StorageVolume(CVolume *volume, QObject *parent = nullptr);

    bool isHfsVolume() const override;
    StorageKind kind() const override { return StorageKind::Volume; }
    QString name() const override;

protected:
    QList<NavigationPoint> buildNavigationPoints() override;
};

} // namespace HexEditor
