// What the platform lists of its storage before anything is opened: candidate devices (floppy,
// physical, optical and volume-backed) and volumes with their extents. The identification of each
// candidate (geometry, partition style, identity) runs through platform handles and is the same on
// every platform; only these listings are the platform's own.
#pragma once

#include "Kernel/Implementation/Common/DeviceInfo.h"

#include <QList>
#include <QString>

#include <memory>

// One device the platform lists, with what it knows of it without opening it (0 or empty where not
// known). A device that cannot be opened is described from these facts as not ready.
struct EnumCandidate
{
    QString path;       // the path it is opened on
    QString kernelName; // the platform's short name ("sda")
    EnumSource source = EnumSource::PhysicalDrive;
    quint16 number = 0;
    MediaType mediaType = MediaType::Fixed; // the platform's drive type
    bool openAsVolume = false;              // a floppy volume is opened as a Volume handle
    bool readOnly = false; // opened for reading only (devices that other programs assemble and own)

    quint64 sizeBytes = 0;
    quint32 logicalSectorSize = 0;
    quint32 physicalSectorSize = 0;
    quint32 alignmentOffset = 0;
    int rotational = -1; // 1 rotating, 0 not, -1 unknown
    bool removable = false;
    QString model;
    QString firmware;
    QString managementSerial; // the serial of the system's device database
    QString backingFile;      // the image file behind a volume-backed device
    quint64 diskSequence = 0;
    BlockStack stack; // what the device is built from and what is built on it
};

class IEnumerationSource
{
public:
    virtual ~IEnumerationSource();

    // Every candidate device, in the platform's order.
    virtual QList<EnumCandidate> Candidates() = 0;
    // Every volume, with its extents naming the candidates they lie on.
    virtual QList<VolumeInfo> Volumes() = 0;
    // The candidate a path names: one of the platform's own device paths, or "\\.\X:" (floppy
    // volume by letter), "\\.\PhysicalDriveN" or "\\.\CDRomN" (case-insensitive). False when the
    // path names no storage device of the platform.
    virtual bool Resolve(const QString &path, EnumCandidate &out) = 0;
};

// The enumeration source of the platform the program runs on.
std::unique_ptr<IEnumerationSource> MakePlatformEnumerationSource();
