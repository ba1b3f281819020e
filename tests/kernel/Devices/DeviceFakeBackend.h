// A platform back end over in-memory disks for the device tests: it logs every transfer
// (path, position, size) and answers device controls through a scripted function.
#pragma once

#include <QHash>
#include <QString>
#include <cstring>
#include <functional>
#include <map>
#include <vector>

#include "Kernel/Implementation/Platform/PlatformBackend.h"

class DeviceFakeBackend : public IPlatformBackend
{
public:
    struct Transfer
    {
        QString path;
        bool read;
        std::uint64_t pos;
        std::uint32_t size;
    };
    using Control = std::function<bool(std::uint32_t code, const std::uint8_t *in, std::uint32_t inSize,
                                       std::uint8_t *out, std::uint32_t outSize, std::uint32_t &returned,
                                       std::uint32_t &error)>;

    // Each path is one disk of bytes.
    QHash<QString, std::vector<std::uint8_t>> disks;
    std::vector<Transfer> log;
    Control control;
    std::uint32_t failReadsWith = 0; // when not 0, every read fails with this error

    std::vector<Transfer> Reads() const { return Filter(true); }
    std::vector<Transfer> Writes() const { return Filter(false); }

    PlatformHandle Open(const QString &path, bool, bool, std::uint32_t &error) override
    {
        if (!disks.contains(path)) {
            error = 2;
            return NullPlatformHandle;
        }
        const PlatformHandle h = m_next++;
        m_open[h] = {path, 0};
        return h;
    }
    bool Close(PlatformHandle h, std::uint32_t &) override
    {
        m_open.erase(h);
        return true;
    }
    bool SetPosition(PlatformHandle h, std::int64_t offset, SeekOrigin origin, std::uint64_t &position,
                     std::uint32_t &) override
    {
        auto &o = m_open.at(h);
        if (origin == SeekOrigin::Begin)
            o.pos = std::uint64_t(offset);
        else if (origin == SeekOrigin::Current)
            o.pos += std::uint64_t(offset);
        else
            o.pos = disks[o.path].size() + std::uint64_t(offset);
        position = o.pos;
        return true;
    }
    bool Read(PlatformHandle h, void *buffer, std::uint32_t size, std::uint32_t &done,
              std::uint32_t &error) override
    {
        auto &o = m_open.at(h);
        log.push_back({o.path, true, o.pos, size});
        if (failReadsWith) {
            error = failReadsWith;
            return false;
        }
        const auto &d = disks[o.path];
        done = o.pos >= d.size() ? 0 : std::uint32_t(std::min<std::uint64_t>(size, d.size() - o.pos));
        std::memcpy(buffer, d.data() + std::min<std::uint64_t>(o.pos, d.size()), done);
        o.pos += done;
        return true;
    }
    bool Write(PlatformHandle h, const void *buffer, std::uint32_t size, std::uint32_t &done,
               std::uint32_t &) override
    {
        auto &o = m_open.at(h);
        log.push_back({o.path, false, o.pos, size});
        auto &d = disks[o.path];
        done = o.pos >= d.size() ? 0 : std::uint32_t(std::min<std::uint64_t>(size, d.size() - o.pos));
        std::memcpy(d.data() + std::min<std::uint64_t>(o.pos, d.size()), buffer, done);
        o.pos += done;
        return true;
    }
    bool GetFileSize(PlatformHandle h, std::uint64_t &size, std::uint32_t &) override
    {
        size = disks[m_open.at(h).path].size();
        return true;
    }
    bool SetEndOfFile(PlatformHandle, std::uint32_t &error) override
    {
        error = 1;
        return false;
    }
    bool Flush(PlatformHandle, std::uint32_t &) override { return true; }
    bool CanOpenForWriting(const QString &path, std::uint32_t &error) override
    {
        return disks.contains(path) || fail(error);
    }
    bool DeviceControl(PlatformHandle, std::uint32_t code, const void *in, std::uint32_t inSize, void *out,
                       std::uint32_t outSize, std::uint32_t &returned, std::uint32_t &error) override
    {
        returned = 0;
        if (!control) {
            error = 1;
            return false;
        }
        return control(code, static_cast<const std::uint8_t *>(in), inSize, static_cast<std::uint8_t *>(out),
                       outSize, returned, error);
    }
    bool GetFreeSpace(const QString &, std::uint64_t &, std::uint32_t &error) override { return fail(error); }
    bool ClearAttributes(const QString &, std::uint32_t &error) override { return fail(error); }
    bool DeleteFile(const QString &, std::uint32_t &error) override { return fail(error); }
    bool MoveFile(const QString &, const QString &, std::uint32_t &error) override { return fail(error); }
    bool SetMountPoint(const QString &, const QString &, std::uint32_t &error) override
    {
        return fail(error);
    }
    bool DeleteMountPoint(const QString &, std::uint32_t &error) override { return fail(error); }
    QString ErrorText(std::uint32_t code) override { return QStringLiteral("error %1").arg(code); }
    QString ProductName() override { return QStringLiteral("Test"); }
    QString ProductVersion() override { return QStringLiteral("1"); }
    bool RestartWithPrivilege(std::uint32_t, std::uint32_t &error) override { return fail(error); }
    PathStyle Paths() const override { return PathStyle::Posix; }

private:
    static bool fail(std::uint32_t &error)
    {
        error = 1;
        return false;
    }
    std::vector<Transfer> Filter(bool read) const
    {
        std::vector<Transfer> r;
        for (const auto &t : log)
            if (t.read == read)
                r.push_back(t);
        return r;
    }
    struct OpenFile
    {
        QString path;
        std::uint64_t pos;
    };
    std::map<PlatformHandle, OpenFile> m_open;
    PlatformHandle m_next = 1;
};
