// A platform back end for tests: files are byte arrays in memory, and each call may be scripted to
// answer with an error, a short count or prepared device-control data. Every call is logged.
#pragma once

#include "Kernel/Implementation/Platform/PlatformBackend.h"

#include <QByteArray>
#include <QMap>
#include <QMutex>
#include <QString>
#include <QStringList>

#include <deque>
#include <functional>
#include <map>

class ScriptedBackend : public IPlatformBackend
{
public:
    // One scripted result of a read or write: an error (0: the transfer happens) and, for a transfer that
    // happens, the count to transfer at most (-1: all).
    struct Transfer
    {
        uint32_t error = 0;
        int64_t count = -1;
    };

    // One scripted answer of a device control: an error (0: success), the answer bytes (cut to the
    // output size) and the byte count reported (-1: the size of the data copied).
    struct Control
    {
        uint32_t error = 0;
        QByteArray data;
        int64_t returned = -1;
    };

    // Answers a device control in code: fills out and returned; returns the error (0: success).
    using ControlHandler = std::function<uint32_t(const QByteArray &in, QByteArray &out, uint32_t &returned)>;

    ScriptedBackend();
    ~ScriptedBackend() override;

    // Files and devices by path.
    void AddFile(const QString &path, const QByteArray &data = {});
    QByteArray FileData(const QString &path) const;
    bool HasFile(const QString &path) const;
    // Opening for writing fails with the error (19 write protected, 5 access denied); reading works.
    void SetWriteOpenError(const QString &path, uint32_t error);
    // Every later call on the path or its handles fails with the error (a vanished device).
    void Vanish(const QString &path, uint32_t error = 55);

    // Results of the next calls, in order; once used up, calls behave normally.
    void ScriptOpen(uint32_t error);
    void ScriptRead(const Transfer &step);
    void ScriptWrite(const Transfer &step);
    void ScriptSeek(uint32_t error);
    void ScriptClose(uint32_t error);
    void ScriptFlush(uint32_t error);
    void ScriptControl(uint32_t code, const Control &answer);
    // Answer of a device control whenever no scripted answer is left (default: error 1).
    void SetControlHandler(uint32_t code, ControlHandler handler);

    void SetFreeSpace(const QString &path, uint64_t bytes, uint32_t error = 0);
    void SetProduct(const QString &name, const QString &version);
    void SetDeleteError(uint32_t error);

    // The log of calls ("open rw NAME", "open ro NAME", "create NAME", "close NAME", "seek POS", "read SIZE",
    // "write SIZE", "size", "eof", "flush NAME", "may write NAME", "control 0xCODE", "free PATH",
    // "attributes PATH", "delete PATH", "move FROM TO", "mount MP VOL", "unmount MP"), and its count of
    // entries starting with a prefix.
    QStringList Calls() const;
    int CallCount(const QString &prefix) const;
    void ClearCalls();
    int OpenHandles() const;

    PlatformHandle Open(const QString &path, bool readOnly, bool create, uint32_t &error) override;
    bool Close(PlatformHandle handle, uint32_t &error) override;
    bool SetPosition(PlatformHandle handle, int64_t offset, SeekOrigin origin, uint64_t &position,
                     uint32_t &error) override;
    bool Read(PlatformHandle handle, void *buffer, uint32_t size, uint32_t &done, uint32_t &error) override;
    bool Write(PlatformHandle handle, const void *buffer, uint32_t size, uint32_t &done,
               uint32_t &error) override;
    bool GetFileSize(PlatformHandle handle, uint64_t &size, uint32_t &error) override;
    bool SetEndOfFile(PlatformHandle handle, uint32_t &error) override;
    bool Flush(PlatformHandle handle, uint32_t &error) override;
    bool CanOpenForWriting(const QString &path, uint32_t &error) override;
    bool DeviceControl(PlatformHandle handle, uint32_t code, const void *in, uint32_t inSize, void *out,
                       uint32_t outSize, uint32_t &returned, uint32_t &error) override;
    bool GetFreeSpace(const QString &path, uint64_t &freeBytes, uint32_t &error) override;
    bool ClearAttributes(const QString &path, uint32_t &error) override;
    bool DeleteFile(const QString &path, uint32_t &error) override;
    bool MoveFile(const QString &from, const QString &to, uint32_t &error) override;
    bool SetMountPoint(const QString &mountPoint, const QString &volumeName, uint32_t &error) override;
    bool DeleteMountPoint(const QString &mountPoint, uint32_t &error) override;
    QString ErrorText(uint32_t code) override;
    QString ProductName() override;
    QString ProductVersion() override;
    bool RestartWithPrivilege(uint32_t reason, uint32_t &error) override;
    PathStyle Paths() const override { return PathStyle::Posix; }

private:
    struct Entry
    {
        QByteArray data;
        uint32_t writeOpenError = 0;
        uint32_t vanished = 0;
    };
    struct OpenFile
    {
        QString path;
        uint64_t position = 0;
        bool readOnly = true;
    };

    void log(const QString &call);
    uint32_t vanishedError(const OpenFile &open) const;

    mutable QMutex m_mutex;
    std::map<QString, Entry> m_files;
    std::map<PlatformHandle, OpenFile> m_open;
    PlatformHandle m_next = 3;
    std::deque<uint32_t> m_openScript, m_seekScript, m_closeScript, m_flushScript;
    std::deque<Transfer> m_readScript, m_writeScript;
    std::map<uint32_t, std::deque<Control>> m_controlScript;
    std::map<uint32_t, ControlHandler> m_controlHandlers;
    std::map<QString, std::pair<uint64_t, uint32_t>> m_freeSpace;
    QString m_productName = QStringLiteral("Scripted System 1.0");
    QString m_productVersion = QStringLiteral("1.0");
    uint32_t m_deleteError = 0;
    QStringList m_calls;
};
