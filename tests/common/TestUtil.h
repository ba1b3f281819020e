// Helpers shared by the tests: scratch folders, running standard tools, reading files.
#pragma once

#include <QByteArray>
#include <QString>
#include <QStringList>
#include <QTemporaryDir>

namespace TestUtil {

struct ToolResult {
    int exitCode = -1;
    QByteArray out;
    QByteArray err;
};

// Runs a program to completion (no shell); exitCode -1 when it could not be started.
ToolResult run(const QString &program, const QStringList &args, int timeoutMs = 120000);

// True when the program is on PATH.
bool haveTool(const QString &program);

// True when the process may attach loop devices (root and /dev/loop-control present).
bool canAttachLoop();

// Writes bytes to a file, replacing it; returns false on failure.
bool writeFile(const QString &path, const QByteArray &data);
QByteArray readFile(const QString &path);

// SIZE bytes of noise from SEED, without a boot-record signature (bytes 510 and 511 are zero), so
// a partition scan finds no table in an image made of them.
QByteArray randomBytes(int size, unsigned seed);

// Path of a built program (brindle, brindle-cli) in the build tree.
QString builtProgram(const QString &name);

// A loop device attached over an image file (losetup OPTIONS -f --show IMAGE), detached again when
// the guard goes. Device() is empty when it could not be attached.
class LoopDevice
{
public:
    LoopDevice(const QString &image, const QStringList &options = {})
    {
        ToolResult r = run("losetup", options + QStringList{"-f", "--show", image});
        if (r.exitCode == 0)
            m_device = QString::fromUtf8(r.out).trimmed();
        else
            m_error = QString::fromUtf8(r.err);
    }
    ~LoopDevice() { detach(); }
    // Detaches now (true when losetup did) and forgets the device: the name may be taken by another
    // test's loop device at once, which the destructor must then leave alone.
    bool detach()
    {
        const bool ok = !m_device.isEmpty() && run("losetup", {"-d", m_device}).exitCode == 0;
        m_device.clear();
        return ok;
    }
    LoopDevice(const LoopDevice &) = delete;
    LoopDevice &operator=(const LoopDevice &) = delete;
    const QString &Device() const { return m_device; }
    // What losetup said when it could not attach.
    const QString &Error() const { return m_error; }

private:
    QString m_device;
    QString m_error;
};

// What `blockdev OPTION DEVICE` prints as a number (--getsize64, --getss, --getpbsz); -1 on failure.
inline qint64 blockdev(const QString &option, const QString &device)
{
    ToolResult r = run("blockdev", {option, device});
    return r.exitCode == 0 ? QString::fromUtf8(r.out).trimmed().toLongLong() : -1;
}

} // namespace TestUtil
