// A disk image seen as a disk: the handle maps sectors of the virtual disk onto the bytes of
// one or more image files. One subclass per image format; a device whose sector access goes to
// an image handle is an image-backed device.
#pragma once

#include <QByteArray>
#include <QList>
#include <QRecursiveMutex>
#include <QString>
#include <QStringList>
#include <cstdint>

#include "Kernel/Implementation/Common/DeviceInfo.h"

class cRoot;
class cStorage;
class CPlatformFile;

class CImageHandle
{
public:
    virtual ~CImageHandle();

    // Image information of the format (empty for formats that have none).
    virtual QByteArray ImageInformation() const;
    // True when writes are allowed.
    virtual bool IsWritable() const;
    // Reads or writes `count` sectors from `first`. A request outside the image is reported
    // (platform record 20 under the name "Image (...)") and fails with error 1; a file failure
    // leaves the file's system error in `error`; a format failure leaves error 0.
    virtual bool ReadWrite(bool read, std::uint64_t first, std::uint32_t count, void *buffer,
                           std::uint32_t &error) = 0;
    // Flushes every image file that was written.
    virtual bool Flush(std::uint32_t &error);
    // Fills what the image knows of its source disk into a device descriptor (geometry, model,
    // serial); the base sets the sector shift and size only.
    virtual void Describe(DeviceInfo &info) const;

    ImageKind GetKind() const { return m_kind; }
    std::uint8_t GetSectorShift() const { return m_sectorShift; }
    std::uint32_t GetBytesPerSector() const { return 1u << m_sectorShift; }
    std::uint64_t GetTotalSectors() const { return m_totalSectors; }
    // False when the files could not be opened or a format check failed.
    bool IsValid() const { return m_totalSectors != 0; }
    // Why a handle is not valid, in words (empty when valid); for the callers' messages.
    const QString &GetProblem() const { return m_problem; }

    cRoot *GetRoot() const { return m_root; }
    const QList<CPlatformFile *> &GetFiles() const { return m_files; }
    QStringList GetFileNames() const;
    // "Image (" + first name [+ ",...," + last name] + ")".
    QString GetRecordName() const;

    bool Read(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error)
    {
        return ReadWrite(true, first, count, buffer, error);
    }
    bool Write(std::uint64_t first, std::uint32_t count, const void *buffer, std::uint32_t &error)
    {
        return ReadWrite(false, first, count, const_cast<void *>(buffer), error);
    }

protected:
    CImageHandle(cRoot *root, ImageKind kind, std::uint8_t sectorShift);
    CImageHandle(const CImageHandle &) = delete;
    CImageHandle &operator=(const CImageHandle &) = delete;

    // Opens each name as a File handle (Reopen with report) and records the sizes; any failure
    // closes what was opened and leaves the handle without files. False on failure.
    bool OpenFiles(const QStringList &names);
    // Opens one more file and appends it; false (nothing appended) when it cannot be opened.
    bool AddFile(const QString &name);
    // Wraps a file found on a kernel volume in a read-only platform file.
    bool OpenKernelFile(cStorage *source, const QString &name);
    // Takes over an already-open file (appended to the list; the handle owns it).
    void AdoptFile(CPlatformFile *file, std::uint64_t size);
    // Closes and deletes every file.
    void CloseFiles();

    // Byte transfers over the concatenation of the files; fail outside it.
    bool TransferBytes(bool read, std::uint64_t offset, std::uint32_t size, void *buffer,
                       std::uint32_t &error);
    std::uint64_t GetConcatenatedSize() const { return m_totalBytes; }
    std::uint64_t GetFileSize(int index) const { return m_fileSizes.value(index); }
    std::uint64_t GetFileStart(int index) const { return m_fileStarts.value(index); }
    // Re-reads the sizes of the files after one of them grew.
    void SetFileSize(int index, std::uint64_t size);

    // Checks a sector request against the total; sends record 20 and sets error 1 when outside.
    bool CheckRange(std::uint64_t first, std::uint32_t count, std::uint32_t &error) const;
    void Fail(const QString &problem);

    cRoot *m_root = nullptr;
    ImageKind m_kind;
    std::uint8_t m_sectorShift = 9;
    QList<CPlatformFile *> m_files;
    std::uint8_t m_writable = 0;
    std::uint64_t m_totalSectors = 0;
    QString m_problem;
    // Serialises transfers and the format's caches (several threads may share a device).
    mutable QRecursiveMutex m_lock;

private:
    QList<std::uint64_t> m_fileSizes;
    QList<std::uint64_t> m_fileStarts;
    std::uint64_t m_totalBytes = 0;
};
