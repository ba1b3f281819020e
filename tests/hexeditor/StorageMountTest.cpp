// A device whose file system the system has mounted is not written: save() refuses every sector
// with the reason, and the medium stays as it was. After the unmount the same save goes through.
#include <gtest/gtest.h>

#include <QDir>
#include <QTemporaryDir>

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Root/Root.h"
#include "hexeditor/StorageFactory.h"
#include "tests/common/TestUtil.h"

using namespace HexEditor;

namespace {

class MountGuard
{
public:
    MountGuard(const QString &device, const QString &where)
        : m_where(where), m_ok(TestUtil::run("mount", {device, where}).exitCode == 0)
    {
    }
    ~MountGuard() { unmount(); }
    void unmount()
    {
        if (m_ok)
            TestUtil::run("umount", {m_where});
        m_ok = false;
    }
    bool ok() const { return m_ok; }

private:
    QString m_where;
    bool m_ok;
};

} // namespace

TEST(StorageMount, MountedDeviceIsNotWritten)
{
    if (!TestUtil::canAttachLoop() || !TestUtil::haveTool("mkfs.ext4") || !TestUtil::haveTool("mount"))
        GTEST_SKIP() << "loop devices cannot be attached here (needs root), or mkfs.ext4/mount is missing";
    QTemporaryDir dir;
    const QString image = dir.filePath("ext.img");
    ASSERT_EQ(TestUtil::run("truncate", {"-s", "32M", image}).exitCode, 0);
    ASSERT_EQ(TestUtil::run("mkfs.ext4", {"-q", "-F", image}).exitCode, 0);
    TestUtil::LoopDevice loop(image);
    ASSERT_FALSE(loop.Device().isEmpty());
    QDir().mkpath(dir.filePath("mnt"));
    MountGuard mount(loop.Device(), dir.filePath("mnt"));
    if (!mount.ok())
        GTEST_SKIP() << "mount is not permitted here";

    const QByteArray before = TestUtil::readFile(image).left(4096);
    {
        CRoot root;
        CDevice *device = root.AddDevice(loop.Device());
        ASSERT_TRUE(device);
        std::unique_ptr<Storage> s = createStorage(device);
        s->write(100, QByteArray("must not land"));
        const QList<SaveFailure> failures = s->save();
        ASSERT_EQ(failures.size(), 1);
        EXPECT_TRUE(failures[0].message.contains(loop.Device())) << failures[0].message.toStdString();
        EXPECT_TRUE(s->isModified());
        EXPECT_EQ(s->write(200, QByteArray("nor this"), false), 0u);
    }
    EXPECT_EQ(TestUtil::readFile(image).left(4096), before);

    mount.unmount();
    CRoot root;
    CDevice *device = root.AddDevice(loop.Device());
    ASSERT_TRUE(device);
    std::unique_ptr<Storage> s = createStorage(device);
    s->write(100, QByteArray("lands now"));
    EXPECT_TRUE(s->save().isEmpty());
    device->Flush();
    TestUtil::run("sync", {});
    EXPECT_EQ(TestUtil::readFile(image).mid(100, 9), QByteArray("lands now"));
}
