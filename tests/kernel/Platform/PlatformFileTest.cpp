// The platform handle's logic against the scripted back end: states, misuse messages, retries,
// lost devices, media changes, short transfers and the drive layout answer.
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Platform/DeviceControl.h"
#include "Kernel/Implementation/Platform/ScriptedBackend.h"
#include "tests/common/TestRoot.h"

#include <gtest/gtest.h>

#include <cstring>
#include <thread>
#include <vector>

namespace {

using Transfer = ScriptedBackend::Transfer;

QByteArray pattern(int size, int seed = 1)
{
    QByteArray data(size, '\0');
    for (int i = 0; i < size; ++i)
        data[i] = char((i * 7 + seed) & 0xFF);
    return data;
}

class PlatformFileTest : public ::testing::Test
{
protected:
    // Locking and unlocking volumes succeed.
    void AllowLocks()
    {
        auto succeed = [](const QByteArray &, QByteArray &, uint32_t &) -> uint32_t { return 0; };
        backend.SetControlHandler(DeviceControl::FSCTL_LOCK_VOLUME, succeed);
        backend.SetControlHandler(DeviceControl::FSCTL_UNLOCK_VOLUME, succeed);
    }
    ScriptedBackend backend;
    TestRoot root{&backend};

    void SetUp() override
    {
        backend.AddFile("/dev/disk0", pattern(64 * 1024));
        backend.AddFile("/dev/vol0", pattern(64 * 1024, 3));
        backend.AddFile("/tmp/file", pattern(4096, 5));
    }
};

TEST_F(PlatformFileTest, ClosingANeverOpenedHandleIsMisuseAndDestroyingItIsSilent)
{
    {
        CPlatformFile file(&root, "/tmp/file", PlatformKind::File);
        EXPECT_FALSE(file.Close(false));
        ASSERT_EQ(root.InternalTexts(), QStringList{"Attempt to close non opened file /tmp/file"});
        EXPECT_EQ(backend.CallCount("close"), 0);
    }
    EXPECT_EQ(root.internal.size(), 1);
}

TEST_F(PlatformFileTest, DestroyingAnOpenHandleReportsAndClosesIt)
{
    {
        CPlatformFile file(&root, "/tmp/file", PlatformKind::File);
        ASSERT_TRUE(file.Reopen(true));
        EXPECT_EQ(backend.OpenHandles(), 1);
    }
    EXPECT_EQ(root.InternalTexts(), QStringList{"Not closed handle /tmp/file"});
    EXPECT_EQ(backend.OpenHandles(), 0);
    EXPECT_TRUE(backend.HasFile("/tmp/file"));
}

TEST_F(PlatformFileTest, HandlesOpenReadOnlyAndTheFirstWriteReopensForWritingOnce)
{
    for (PlatformKind kind : {PlatformKind::Device, PlatformKind::Volume, PlatformKind::File}) {
        const QString path = kind == PlatformKind::File ? "/tmp/file" : "/dev/disk0";
        backend.ClearCalls();
        root.ClearRecords();
        CPlatformFile handle(&root, path, kind);
        ASSERT_TRUE(handle.Reopen(true));
        QByteArray buffer(512, '\0');
        ASSERT_TRUE(handle.Read(512, 512, buffer.data()));
        // Asking whether it may write opens nothing for writing.
        EXPECT_TRUE(handle.IsWritable());
        EXPECT_EQ(backend.CallCount("open ro " + path), 1);
        EXPECT_EQ(backend.CallCount("open rw"), 0);
        ASSERT_EQ(root.debug.size(), 1);
        EXPECT_EQ(root.debug[0].level, 2u);
        EXPECT_EQ(root.debug[0].text, "Open: " + path);

        const QByteArray data = pattern(512, 11);
        ASSERT_TRUE(handle.Write(1024, 512, data.constData()));
        ASSERT_TRUE(handle.Write(2048, 512, data.constData()));
        ASSERT_TRUE(handle.Read(1024, 512, buffer.data()));
        EXPECT_EQ(buffer, data);
        EXPECT_EQ(backend.CallCount("open rw " + path), 1);
        EXPECT_EQ(backend.CallCount("close"), 1); // the read-only handle gave way
        EXPECT_EQ(backend.OpenHandles(), 1);

        // After a close the next open reads only again.
        ASSERT_TRUE(handle.Close(false));
        EXPECT_EQ(root.debug.last().text, "Close: " + path);
        ASSERT_TRUE(handle.Read(0, 512, buffer.data()));
        EXPECT_EQ(backend.CallCount("open ro " + path), 2);
        EXPECT_TRUE(handle.Close());
    }
}

TEST_F(PlatformFileTest, RefusedWriteOpenFailsTheWriteAndKeepsReading)
{
    backend.SetWriteOpenError("/dev/disk0", SystemError::WriteProtect);
    CPlatformFile disk(&root, "/dev/disk0", PlatformKind::Device);
    EXPECT_FALSE(disk.IsWritable());
    EXPECT_EQ(backend.CallCount("open rw"), 0);
    const QByteArray before = backend.FileData("/dev/disk0");
    const QByteArray data = pattern(512, 12);
    EXPECT_FALSE(disk.Write(0, 512, data.constData()));
    EXPECT_EQ(disk.GetError(), SystemError::WriteProtect);
    ASSERT_EQ(root.platform.size(), 1);
    EXPECT_EQ(root.platform[0].operation, uint32_t(PlatformOperation::CreateFileOpen));
    EXPECT_EQ(root.platform[0].error, SystemError::WriteProtect);
    EXPECT_EQ(backend.FileData("/dev/disk0"), before);
    QByteArray buffer(512, '\0');
    EXPECT_TRUE(disk.Read(0, 512, buffer.data()));
    EXPECT_TRUE(disk.IsOpened());

    // A handle declared read-only refuses writes without asking the system.
    CPlatformFile file(&root, "/tmp/file", PlatformKind::File);
    file.SetWritable(false);
    backend.ClearCalls();
    EXPECT_FALSE(file.Write(0, 512, data.constData()));
    EXPECT_EQ(file.GetError(), SystemError::AccessDenied);
    EXPECT_EQ(root.InternalTexts().last(), "Attempt to write read-only handle /tmp/file");
    EXPECT_EQ(backend.CallCount("open rw"), 0);
    EXPECT_TRUE(disk.Close());
    EXPECT_FALSE(file.IsOpened());
}

TEST_F(PlatformFileTest, FlushSendsWhatWasWrittenToTheMediumAndReportsAFailure)
{
    for (PlatformKind kind : {PlatformKind::Device, PlatformKind::Volume, PlatformKind::File}) {
        const QString path = kind == PlatformKind::File ? "/tmp/file" : "/dev/vol0";
        backend.ClearCalls();
        root.ClearRecords();
        CPlatformFile handle(&root, path, kind);
        uint32_t error = 7;
        // Nothing written, nothing to flush.
        EXPECT_TRUE(handle.Flush(error));
        EXPECT_EQ(error, 0u);
        QByteArray buffer(512, '\0');
        ASSERT_TRUE(handle.Read(0, 512, buffer.data()));
        EXPECT_TRUE(handle.Flush(error));
        EXPECT_EQ(backend.CallCount("flush"), 0);

        ASSERT_TRUE(handle.Write(0, 512, buffer.constData()));
        EXPECT_TRUE(handle.Flush(error));
        EXPECT_EQ(backend.CallCount("flush " + path), 1);
        backend.ScriptFlush(SystemError::WriteFault);
        EXPECT_FALSE(handle.Flush(error));
        EXPECT_EQ(error, SystemError::WriteFault);
        EXPECT_EQ(handle.GetError(), SystemError::WriteFault);
        ASSERT_EQ(root.platform.size(), 1);
        EXPECT_EQ(root.platform[0].operation, uint32_t(PlatformOperation::WriteFile));
        EXPECT_EQ(root.platform[0].error, SystemError::WriteFault);
        EXPECT_TRUE(root.InternalTexts().isEmpty());
        EXPECT_TRUE(handle.Close());
    }
}

TEST_F(PlatformFileTest, ReopenFailureIsRecordedOnlyWhenAsked)
{
    CPlatformFile missing(&root, "/dev/none", PlatformKind::Device);
    EXPECT_FALSE(missing.Reopen(false));
    EXPECT_EQ(missing.GetError(), SystemError::FileNotFound);
    EXPECT_TRUE(root.platform.isEmpty());
    EXPECT_FALSE(missing.Reopen(true));
    ASSERT_EQ(root.platform.size(), 1);
    EXPECT_EQ(root.platform[0].operation, uint32_t(PlatformOperation::CreateFileOpen));
    EXPECT_EQ(root.platform[0].name, "/dev/none");
    EXPECT_EQ(root.platform[0].error, SystemError::FileNotFound);
}

TEST_F(PlatformFileTest, VolumeOpenAsksForExtendedAccessAndIgnoresTheAnswer)
{
    CPlatformFile volume(&root, "/dev/vol0", PlatformKind::Volume);
    ASSERT_TRUE(volume.Reopen(true));
    EXPECT_EQ(backend.Calls(), (QStringList{"open ro /dev/vol0", "control 0x90083"}));
    EXPECT_EQ(volume.GetError(), 0u);
    EXPECT_TRUE(volume.Close());
}

TEST_F(PlatformFileTest, ShortTransfersFailWithEndOfFileAndOneRecordEach)
{
    CPlatformFile disk(&root, "/dev/disk0", PlatformKind::Device);
    backend.ScriptRead(Transfer{0, 100});
    QByteArray buffer(512, '\0');
    EXPECT_FALSE(disk.Read(512, 512, buffer.data()));
    EXPECT_EQ(disk.GetError(), SystemError::HandleEof);
    EXPECT_EQ(backend.CallCount("read"), 1);
    backend.ScriptWrite(Transfer{0, 10});
    EXPECT_FALSE(disk.Write(0, 512, buffer.constData()));
    ASSERT_EQ(root.platform.size(), 2);
    EXPECT_EQ(root.platform[0].operation, uint32_t(PlatformOperation::ReadFile));
    EXPECT_EQ(root.platform[0].position, 512u);
    EXPECT_EQ(root.platform[0].block, 512u);
    EXPECT_EQ(root.platform[0].error, SystemError::HandleEof);
    EXPECT_EQ(root.platform[1].operation, uint32_t(PlatformOperation::WriteFile));
    EXPECT_EQ(root.platform[1].error, SystemError::HandleEof);
    EXPECT_TRUE(disk.Close());
}

TEST_F(PlatformFileTest, VanishedDeviceBecomesLostSilently)
{
    CPlatformFile disk(&root, "/dev/disk0", PlatformKind::Device);
    backend.ScriptRead(Transfer{SystemError::DevNotExist, -1});
    QByteArray buffer(512, '\0');
    EXPECT_FALSE(disk.Read(0, 512, buffer.data()));
    EXPECT_EQ(disk.GetError(), SystemError::DevNotExist);
    EXPECT_TRUE(disk.IsLost());
    EXPECT_EQ(backend.CallCount("read"), 1); // no retry of a vanished device

    backend.ClearCalls();
    EXPECT_FALSE(disk.Read(512, 512, buffer.data()));
    EXPECT_EQ(disk.GetError(), SystemError::DevNotExist);
    EXPECT_EQ(backend.CallCount("read"), 0);
    EXPECT_EQ(backend.CallCount("seek"), 0);
    EXPECT_TRUE(root.platform.isEmpty());

    uint32_t error = 0;
    EXPECT_FALSE(disk.Flush(error));
    EXPECT_EQ(error, SystemError::DevNotExist);
    uint64_t position = 0;
    EXPECT_FALSE(disk.GetPosition(position));
    EXPECT_FALSE(disk.DIOC(DeviceControl::IOCTL_DISK_GET_DRIVE_GEOMETRY, nullptr, 0, nullptr, 0));
    EXPECT_EQ(disk.GetError(), SystemError::DevNotExist);
    EXPECT_TRUE(disk.Close());
}

TEST_F(PlatformFileTest, NotFoundOnDeviceIsLostButOnFileAndVolumeIsAnOrdinaryFailure)
{
    // A media change on a device is an ordinary failure: the device is not reopened.
    CPlatformFile disk(&root, "/dev/disk0", PlatformKind::Device);
    backend.ScriptRead(Transfer{SystemError::MediaChanged, -1});
    backend.ScriptRead(Transfer{SystemError::MediaChanged, -1});
    QByteArray buffer(512, '\0');
    EXPECT_FALSE(disk.Read(0, 512, buffer.data()));
    EXPECT_EQ(backend.CallCount("open"), 1);
    EXPECT_EQ(root.platform.size(), 1);
    EXPECT_FALSE(disk.IsLost());
    backend.ScriptRead(Transfer{SystemError::FileNotFound, -1});
    EXPECT_FALSE(disk.Read(0, 512, buffer.data()));
    EXPECT_TRUE(disk.IsLost());
    EXPECT_TRUE(disk.Close());
    root.ClearRecords();

    CPlatformFile volume(&root, "/dev/vol0", PlatformKind::Volume);
    backend.ScriptRead(Transfer{SystemError::DevNotExist, -1});
    backend.ScriptRead(Transfer{SystemError::DevNotExist, -1});
    EXPECT_FALSE(volume.Read(0, 512, buffer.data()));
    EXPECT_FALSE(volume.IsLost());
    EXPECT_EQ(root.platform.size(), 1);

    root.ClearRecords();
    backend.ScriptRead(Transfer{SystemError::FileInvalid, -1});
    EXPECT_FALSE(volume.Read(0, 512, buffer.data()));
    EXPECT_TRUE(volume.IsLost());
    EXPECT_TRUE(root.platform.isEmpty());
    EXPECT_TRUE(volume.Close());
}

TEST(PlatformFileRetryTest, FailingDeviceReadIsAttemptedRetryCountTimes)
{
    for (uint8_t retries : {uint8_t(1), uint8_t(2), uint8_t(5)}) {
        ScriptedBackend backend;
        backend.AddFile("/dev/disk0", pattern(8192));
        TestRoot root(&backend);
        root.retries = retries;
        CPlatformFile disk(&root, "/dev/disk0", PlatformKind::Device);
        for (int i = 0; i < 10; ++i)
            backend.ScriptRead(Transfer{SystemError::Crc, -1});
        QByteArray buffer(512, '\0');
        EXPECT_FALSE(disk.Read(1024, 512, buffer.data()));
        EXPECT_EQ(backend.CallCount("read"), retries);
        EXPECT_EQ(backend.CallCount("seek 1024"), retries); // each attempt positions again
        ASSERT_EQ(root.platform.size(), 1);
        EXPECT_EQ(root.platform[0].operation, uint32_t(PlatformOperation::ReadFile));
        EXPECT_EQ(root.platform[0].position, 1024u);
        EXPECT_EQ(root.platform[0].block, 512u);
        EXPECT_EQ(root.platform[0].error, SystemError::Crc);
        EXPECT_FALSE(disk.IsLost());
        EXPECT_TRUE(disk.Close());
    }
}

TEST_F(PlatformFileTest, RetriedReadSucceedsAndFileTransfersAreNotRetried)
{
    CPlatformFile disk(&root, "/dev/disk0", PlatformKind::Device);
    backend.ScriptRead(Transfer{SystemError::Crc, -1});
    QByteArray buffer(512, '\0');
    ASSERT_TRUE(disk.Read(512, 512, buffer.data()));
    EXPECT_EQ(buffer, backend.FileData("/dev/disk0").mid(512, 512));
    EXPECT_TRUE(root.platform.isEmpty());
    EXPECT_TRUE(disk.Close());

    root.retries = 5;
    backend.ClearCalls();
    CPlatformFile file(&root, "/tmp/file", PlatformKind::File);
    backend.ScriptRead(Transfer{SystemError::Crc, -1});
    EXPECT_FALSE(file.Read(0, 512, buffer.data()));
    EXPECT_EQ(backend.CallCount("read"), 1);
    EXPECT_EQ(root.platform.size(), 1);
    EXPECT_TRUE(file.Close());
}

TEST_F(PlatformFileTest, MediaChangeOnVolumeReopensOnceAndReadsTheSamePosition)
{
    CPlatformFile volume(&root, "/dev/vol0", PlatformKind::Volume);
    ASSERT_TRUE(volume.Reopen(true));
    backend.ClearCalls();
    backend.ScriptRead(Transfer{SystemError::MediaChanged, -1});
    QByteArray buffer(512, '\0');
    ASSERT_TRUE(volume.Read(2048, 512, buffer.data()));
    EXPECT_EQ(buffer, backend.FileData("/dev/vol0").mid(2048, 512));
    EXPECT_EQ(backend.Calls(), (QStringList{"seek 2048", "read 512", "close /dev/vol0", "open ro /dev/vol0",
                                            "control 0x90083", "seek 2048", "read 512"}));
    EXPECT_TRUE(root.platform.isEmpty());

    // A second media change in the same transfer counts as an ordinary failed attempt.
    root.ClearRecords();
    backend.ClearCalls();
    backend.ScriptRead(Transfer{SystemError::MediaChanged, -1});
    backend.ScriptRead(Transfer{SystemError::MediaChanged, -1});
    ASSERT_TRUE(volume.Read(0, 512, buffer.data()));
    EXPECT_EQ(backend.CallCount("read"), 3);
    EXPECT_EQ(backend.CallCount("open"), 1);

    root.ClearRecords();
    backend.ClearCalls();
    for (int i = 0; i < 3; ++i)
        backend.ScriptRead(Transfer{SystemError::MediaChanged, -1});
    EXPECT_FALSE(volume.Read(0, 512, buffer.data()));
    EXPECT_EQ(backend.CallCount("read"), 3);
    ASSERT_EQ(root.platform.size(), 1);
    EXPECT_EQ(root.platform[0].error, SystemError::MediaChanged);
    EXPECT_TRUE(volume.Close());
}

TEST_F(PlatformFileTest, FailedPositioningIsRecordedWithPositionAndBlock)
{
    CPlatformFile disk(&root, "/dev/disk0", PlatformKind::Device);
    ASSERT_TRUE(disk.Reopen(true));
    backend.ScriptSeek(SystemError::InvalidParameter);
    QByteArray buffer(4096, '\0');
    EXPECT_FALSE(disk.Read(8192, 4096, buffer.data()));
    ASSERT_EQ(root.platform.size(), 1);
    EXPECT_EQ(root.platform[0].operation, uint32_t(PlatformOperation::SetFilePointerEx));
    EXPECT_EQ(root.platform[0].position, 8192u);
    EXPECT_EQ(root.platform[0].block, 4096u);
    EXPECT_EQ(backend.CallCount("read"), 0);
    EXPECT_TRUE(disk.Close());
}

TEST_F(PlatformFileTest, AllOnesPositionAppendsWritesAndReadsAtTheCurrentPosition)
{
    CPlatformFile file(&root, "/tmp/file", PlatformKind::File);
    const QByteArray tail = pattern(100, 42);
    ASSERT_TRUE(file.Write(CPlatformFile::CurrentPosition, 100, tail.constData()));
    EXPECT_EQ(backend.FileData("/tmp/file").size(), 4196);
    EXPECT_EQ(backend.FileData("/tmp/file").mid(4096), tail);

    QByteArray buffer(16, '\0');
    ASSERT_TRUE(file.Read(1000, 16, buffer.data()));
    ASSERT_TRUE(file.Read(CPlatformFile::CurrentPosition, 16, buffer.data()));
    EXPECT_EQ(buffer, backend.FileData("/tmp/file").mid(1016, 16));
    uint64_t position = 0;
    ASSERT_TRUE(file.GetPosition(position));
    EXPECT_EQ(position, 1032u);
    EXPECT_TRUE(file.Close());
}

TEST_F(PlatformFileTest, UnalignedBuffersGoThroughATemporaryBuffer)
{
    CPlatformFile disk(&root, "/dev/disk0", PlatformKind::Device);
    alignas(16) char storage[600] = {};
    ASSERT_TRUE(disk.Read(512, 512, storage + 1));
    EXPECT_EQ(QByteArray(storage + 1, 512), backend.FileData("/dev/disk0").mid(512, 512));
    EXPECT_EQ(storage[0], 0);
    EXPECT_EQ(storage[513], 0);

    const QByteArray data = pattern(512, 77);
    std::memcpy(storage + 3, data.constData(), 512);
    ASSERT_TRUE(disk.Write(0, 512, storage + 3));
    EXPECT_EQ(backend.FileData("/dev/disk0").left(512), data);
    EXPECT_TRUE(disk.Close());
}

TEST_F(PlatformFileTest, IsWritableAsksDevicesAndVolumes)
{
    CPlatformFile disk(&root, "/dev/disk0", PlatformKind::Device);
    backend.ScriptControl(DeviceControl::IOCTL_DISK_IS_WRITABLE, {SystemError::WriteProtect, {}, -1});
    EXPECT_FALSE(disk.IsWritable());
    backend.ScriptControl(DeviceControl::IOCTL_DISK_IS_WRITABLE, {SystemError::InvalidFunction, {}, -1});
    EXPECT_TRUE(disk.IsWritable());
    backend.ScriptControl(DeviceControl::IOCTL_DISK_IS_WRITABLE, {0, {}, -1});
    EXPECT_TRUE(disk.IsWritable());
    EXPECT_EQ(backend.CallCount("control 0x70024"), 3);
    EXPECT_TRUE(root.platform.isEmpty());
    EXPECT_TRUE(disk.Close());

    CPlatformFile volume(&root, "/dev/vol0", PlatformKind::Volume);
    backend.ScriptControl(DeviceControl::IOCTL_DISK_IS_WRITABLE, {SystemError::WriteProtect, {}, -1});
    EXPECT_FALSE(volume.IsWritable());
    EXPECT_TRUE(volume.Close());

    backend.ClearCalls();
    CPlatformFile file(&root, "/tmp/file", PlatformKind::File);
    EXPECT_TRUE(file.IsWritable());
    EXPECT_EQ(backend.CallCount("control"), 0);
    EXPECT_FALSE(file.SetWritable(false));
    EXPECT_FALSE(file.IsWritable());
}

TEST_F(PlatformFileTest, MisuseByKindAndStateNeverReachesTheSystem)
{
    CPlatformFile disk(&root, "/dev/disk0", PlatformKind::Device);
    CPlatformFile volume(&root, "/dev/vol0", PlatformKind::Volume);
    CPlatformFile file(&root, "/tmp/file", PlatformKind::File);
    uint64_t value = 1;
    QList<uint64_t> offsets{1};
    EXPECT_FALSE(disk.Create());
    EXPECT_FALSE(disk.GetSize(value));
    EXPECT_EQ(value, 0u);
    EXPECT_FALSE(volume.Resize(10));
    EXPECT_FALSE(disk.Lock());
    EXPECT_FALSE(file.Dismount(true));
    EXPECT_FALSE(disk.Unlock());
    EXPECT_FALSE(disk.GetFreeSpace(value));
    EXPECT_FALSE(volume.Update());
    EXPECT_FALSE(file.GetLayoutInfo(offsets));
    EXPECT_TRUE(offsets.isEmpty());
    EXPECT_FALSE(file.DIOC(DeviceControl::IOCTL_DISK_GET_DRIVE_GEOMETRY, nullptr, 0, nullptr, 0));
    EXPECT_FALSE(volume.Dismount(false));
    EXPECT_FALSE(volume.Unlock());
    EXPECT_EQ(root.InternalTexts(), (QStringList{
                                        "Attempt to create storage file /dev/disk0",
                                        "Attempt to get size of storage file /dev/disk0",
                                        "Attempt to resize storage file /dev/vol0",
                                        "Attempt to lock non volume handle /dev/disk0",
                                        "Attempt to dismount non volume handle /tmp/file",
                                        "Attempt to unlock non volume handle /dev/disk0",
                                        "Attempt to get free space from non volume handle /dev/disk0",
                                        "Attempt to updating non device handle /dev/vol0",
                                        "Attempt to get layout info from non device handle /tmp/file",
                                        "Attempt to DIOC for file /tmp/file",
                                        "Attempt to dismount non locked volume handle /dev/vol0",
                                        "Attempt to unlock non locked volume handle /dev/vol0",
                                    }));
    EXPECT_TRUE(backend.Calls().isEmpty());

    root.ClearRecords();
    ASSERT_TRUE(file.Reopen(true));
    EXPECT_FALSE(file.Rename("/tmp/other"));
    EXPECT_FALSE(file.Create());
    EXPECT_EQ(root.InternalTexts(), (QStringList{"Attempt to rename non closed file /tmp/file",
                                                 "Attempt to create non closed file /tmp/file"}));
    EXPECT_TRUE(file.Close());
    EXPECT_TRUE(file.Rename("/tmp/other"));
    EXPECT_EQ(file.GetName(), "/tmp/other");
    uint32_t flushError = 5;
    EXPECT_TRUE(disk.Flush(flushError));
    EXPECT_EQ(flushError, 0u);
}

TEST_F(PlatformFileTest, LockDismountUnlockFollowTheVolumeStates)
{
    AllowLocks();
    CPlatformFile volume(&root, "/dev/vol0", PlatformKind::Volume);
    ASSERT_TRUE(volume.Lock());
    EXPECT_TRUE(volume.IsLocked());
    EXPECT_FALSE(volume.Lock());
    EXPECT_FALSE(volume.Close());
    EXPECT_EQ(root.InternalTexts(), (QStringList{"Attempt to lock locked volume handle /dev/vol0",
                                                 "Attempt to close locked volume /dev/vol0"}));
    backend.ScriptControl(DeviceControl::FSCTL_DISMOUNT_VOLUME, {0, {}, -1});
    ASSERT_TRUE(volume.Dismount(false));
    EXPECT_TRUE(volume.IsOpened());
    EXPECT_TRUE(volume.IsLocked());
    ASSERT_TRUE(volume.Unlock());
    EXPECT_FALSE(volume.IsLocked());
    EXPECT_FALSE(volume.IsOpened());
    EXPECT_EQ(backend.OpenHandles(), 0);

    // A failed lock leaves the volume unlocked; a forced dismount opens and then closes.
    backend.ScriptControl(DeviceControl::FSCTL_LOCK_VOLUME, {SystemError::AccessDenied, {}, -1});
    EXPECT_FALSE(volume.Lock());
    EXPECT_EQ(volume.GetError(), SystemError::AccessDenied);
    EXPECT_FALSE(volume.IsLocked());
    EXPECT_TRUE(volume.Close());
    backend.ScriptControl(DeviceControl::FSCTL_DISMOUNT_VOLUME, {0, {}, -1});
    ASSERT_TRUE(volume.Dismount(true));
    EXPECT_FALSE(volume.IsOpened());
}

TEST_F(PlatformFileTest, DestroyingALockedVolumeUnlocksAndClosesIt)
{
    AllowLocks();
    {
        CPlatformFile volume(&root, "/dev/vol0", PlatformKind::Volume);
        ASSERT_TRUE(volume.Lock());
    }
    EXPECT_EQ(root.InternalTexts(), QStringList{"Not closed handle /dev/vol0"});
    EXPECT_EQ(backend.CallCount("control 0x9001c"), 1);
    EXPECT_EQ(backend.OpenHandles(), 0);
}

TEST_F(PlatformFileTest, UpdateClosesTheDeviceOnSuccess)
{
    CPlatformFile disk(&root, "/dev/disk0", PlatformKind::Device);
    backend.ScriptControl(DeviceControl::IOCTL_DISK_UPDATE_PROPERTIES, {0, {}, -1});
    ASSERT_TRUE(disk.Update());
    EXPECT_FALSE(disk.IsOpened());
    backend.ScriptControl(DeviceControl::IOCTL_DISK_UPDATE_PROPERTIES, {SystemError::AccessDenied, {}, -1});
    EXPECT_FALSE(disk.Update());
    EXPECT_TRUE(disk.IsOpened());
    EXPECT_TRUE(disk.Close());
}

TEST_F(PlatformFileTest, DiocReportsTheReturnedCountAlsoOnFailure)
{
    CPlatformFile disk(&root, "/dev/disk0", PlatformKind::Device);
    backend.ScriptControl(0x1234, {SystemError::MoreData, QByteArray(8, 'x'), 8});
    char out[8] = {};
    uint32_t returned = 99;
    EXPECT_FALSE(disk.DIOC(0x1234, nullptr, 0, out, sizeof out, &returned));
    EXPECT_EQ(returned, 8u);
    EXPECT_EQ(disk.GetError(), SystemError::MoreData);
    EXPECT_TRUE(root.platform.isEmpty());
    EXPECT_TRUE(disk.Close());
}

TEST_F(PlatformFileTest, FileCreateResizeSizeAndCloseWithDeletion)
{
    CPlatformFile file(&root, "/tmp/new", PlatformKind::File);
    ASSERT_TRUE(file.Create());
    EXPECT_EQ(root.debug.last().text, "Create: /tmp/new");
    ASSERT_TRUE(file.Resize(5000));
    uint64_t size = 0;
    ASSERT_TRUE(file.GetSize(size));
    EXPECT_EQ(size, 5000u);
    ASSERT_TRUE(file.Resize(10));
    ASSERT_TRUE(file.GetSize(size));
    EXPECT_EQ(size, 10u);
    ASSERT_TRUE(file.Close(true));
    EXPECT_FALSE(backend.HasFile("/tmp/new"));

    backend.ScriptOpen(SystemError::AccessDenied);
    EXPECT_FALSE(file.Create());
    ASSERT_EQ(root.platform.size(), 1);
    EXPECT_EQ(root.platform[0].operation, uint32_t(PlatformOperation::CreateFileCreate));

    root.ClearRecords();
    ASSERT_TRUE(file.Create());
    backend.SetDeleteError(SystemError::AccessDenied);
    EXPECT_FALSE(file.Close(true));
    EXPECT_FALSE(file.IsOpened());
    ASSERT_EQ(root.platform.size(), 1);
    EXPECT_EQ(root.platform[0].operation, uint32_t(PlatformOperation::DeleteFile));
}

TEST_F(PlatformFileTest, FailedCloseKeepsTheHandle)
{
    CPlatformFile file(&root, "/tmp/file", PlatformKind::File);
    ASSERT_TRUE(file.Reopen(true));
    backend.ScriptClose(SystemError::InvalidHandle);
    EXPECT_FALSE(file.Close());
    EXPECT_TRUE(file.IsOpened());
    ASSERT_EQ(root.platform.size(), 1);
    EXPECT_EQ(root.platform[0].operation, uint32_t(PlatformOperation::CloseHandle));
    EXPECT_TRUE(file.Close());
}

TEST_F(PlatformFileTest, FreeSpaceAsksForTheVolumePathWithASeparator)
{
    backend.SetFreeSpace("/dev/vol0/", 123456);
    CPlatformFile volume(&root, "/dev/vol0", PlatformKind::Volume);
    uint64_t freeBytes = 0;
    ASSERT_TRUE(volume.GetFreeSpace(freeBytes));
    EXPECT_EQ(freeBytes, 123456u);
    backend.SetFreeSpace("/dev/vol0/", 0, SystemError::NotReady);
    EXPECT_FALSE(volume.GetFreeSpace(freeBytes));
    ASSERT_EQ(root.platform.size(), 1);
    EXPECT_EQ(root.platform[0].operation, uint32_t(PlatformOperation::GetFileSizeEx));
    EXPECT_EQ(root.platform[0].error, SystemError::NotReady);
}

TEST_F(PlatformFileTest, ThreadsSharingAHandleGetTheirOwnSectors)
{
    // Positioning and transfer happen under the handle's lock: no thread reads another's position.
    CPlatformFile disk(&root, "/dev/disk0", PlatformKind::Device);
    const QByteArray data = backend.FileData("/dev/disk0");
    std::vector<std::thread> threads;
    std::vector<int> mismatches(4, 0);
    for (int t = 0; t < 4; ++t) {
        threads.emplace_back([&, t] {
            QByteArray buffer(512, '\0');
            for (int i = 0; i < 200; ++i) {
                const int sector = (t * 31 + i * 7) % 128;
                if (!disk.Read(uint64_t(sector) * 512, 512, buffer.data()) ||
                    buffer != data.mid(sector * 512, 512))
                    ++mismatches[t];
            }
        });
    }
    for (auto &thread : threads)
        thread.join();
    EXPECT_EQ(mismatches, std::vector<int>(4, 0));
    EXPECT_TRUE(disk.Close());
}

TEST(PlatformOperationTextTest, KnownAndUnknownCodes)
{
    EXPECT_EQ(PlatformOperationText(0), "GetVersionEx");
    EXPECT_EQ(PlatformOperationText(6), "DeviceIoControl(IOCTL_DISK_GET_DRIVE_LAYOUT_EX)");
    EXPECT_EQ(PlatformOperationText(17), "CreateFile");
    EXPECT_EQ(PlatformOperationText(18), "CreateFile");
    EXPECT_EQ(PlatformOperationText(21), "ReadFile");
    EXPECT_EQ(PlatformOperationText(29), "CreateDirectory");
    EXPECT_EQ(PlatformOperationText(30), "Unknown 0x0000001e");
    EXPECT_EQ(PlatformOperationText(0xDEADBEEF), "Unknown 0xdeadbeef");
}

} // namespace
