// Shared pieces of the kernel-root tests: a listing of candidate devices chosen by the test and a
// scripted back end that answers the geometry, partition and property controls for in-memory disks.
#pragma once

#include "Kernel/Implementation/Common/RootEnumSource.h"
#include "Kernel/Implementation/Platform/DeviceControl.h"
#include "Kernel/Implementation/Platform/ScriptedBackend.h"

#include <QByteArray>
#include <QHash>
#include <QMutex>
#include <QMutexLocker>

#include <cstring>

namespace RootTest {

// A listing the test fills; Resolve matches platform paths and the portable forms.
class FakeSource : public IEnumerationSource
{
public:
    void Set(const QList<EnumCandidate> &candidates, const QList<VolumeInfo> &volumes = {})
    {
        QMutexLocker guard(&m_mutex);
        m_candidates = candidates;
        m_volumes = volumes;
    }
    QList<EnumCandidate> Candidates() override
    {
        QMutexLocker guard(&m_mutex);
        return m_candidates;
    }
    QList<VolumeInfo> Volumes() override
    {
        QMutexLocker guard(&m_mutex);
        return m_volumes;
    }
    bool Resolve(const QString &path, EnumCandidate &out) override
    {
        QMutexLocker guard(&m_mutex);
        for (const EnumCandidate &c : std::as_const(m_candidates)) {
            bool portable = c.source == EnumSource::PhysicalDrive &&
                            path.compare(QStringLiteral("\\\\.\\PhysicalDrive%1").arg(c.number),
                                         Qt::CaseInsensitive) == 0;
            if (c.path == path || portable) {
                out = c;
                return true;
            }
        }
        return false;
    }

private:
    QMutex m_mutex;
    QList<EnumCandidate> m_candidates;
    QList<VolumeInfo> m_volumes;
};

inline EnumCandidate Candidate(const QString &path, quint16 number,
                               EnumSource source = EnumSource::PhysicalDrive, quint64 sizeBytes = 1 << 20)
{
    EnumCandidate c;
    c.path = path;
    c.kernelName = path.section(QLatin1Char('/'), -1);
    c.number = number;
    c.source = source;
    c.mediaType = source == EnumSource::OpticalDrive ? MediaType::CdRom : MediaType::Fixed;
    c.sizeBytes = sizeBytes;
    c.logicalSectorSize = 512;
    c.physicalSectorSize = 512;
    return c;
}

// A disk image with the boot signature in its first sector (or without).
inline QByteArray Disk(quint64 bytes, bool signature)
{
    QByteArray d(qsizetype(bytes), '\0');
    if (signature && bytes >= 512) {
        d[510] = char(0x55);
        d[511] = char(0xAA);
    }
    return d;
}

// Geometry and partition-information answers for every device of the back end from its size.
inline void AnswerGeometry(ScriptedBackend &backend, quint32 bytesPerSector = 512,
                           quint32 style = DeviceControl::PARTITION_STYLE_MBR, quint64 lengthBytes = 0)
{
    using namespace DeviceControl;
    backend.SetControlHandler(IOCTL_DISK_GET_DRIVE_GEOMETRY,
                              [bytesPerSector](const QByteArray &, QByteArray &out, uint32_t &returned) {
                                  DISK_GEOMETRY g{};
                                  g.Cylinders = 2;
                                  g.MediaType = FixedMedia;
                                  g.TracksPerCylinder = 1;
                                  g.SectorsPerTrack = 1024;
                                  g.BytesPerSector = bytesPerSector;
                                  std::memcpy(out.data(), &g, sizeof(g));
                                  returned = sizeof(g);
                                  return 0u;
                              });
    backend.SetControlHandler(IOCTL_DISK_GET_PARTITION_INFO_EX,
                              [style, lengthBytes](const QByteArray &, QByteArray &out, uint32_t &returned) {
                                  PARTITION_INFORMATION_EX p{};
                                  p.PartitionStyle = style;
                                  p.PartitionLength = int64_t(lengthBytes ? lengthBytes : (1u << 20));
                                  std::memcpy(out.data(), &p, sizeof(p));
                                  returned = sizeof(p);
                                  return 0u;
                              });
}

// A storage device descriptor answer: vendor, product, revision and an 8-bit serial.
inline QByteArray Descriptor(const QByteArray &vendor, const QByteArray &product, const QByteArray &revision,
                             const QByteArray &serial)
{
    QByteArray d(40, '\0');
    auto put32 = [&](int at, quint32 v) { std::memcpy(d.data() + at, &v, 4); };
    auto add = [&](int field, const QByteArray &text) {
        put32(field, quint32(d.size()));
        d += text;
        d += '\0';
    };
    add(12, vendor);
    add(16, product);
    add(20, revision);
    add(24, serial);
    put32(4, quint32(d.size()));
    return d;
}

} // namespace RootTest
