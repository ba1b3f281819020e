// Free operations of the platform layer and the system error codes.
#include "Kernel/Implementation/Platform/PlatformOps.h"
#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Platform/ScriptedBackend.h"
#include "tests/common/TestRoot.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <cstring>

namespace {

TEST(NativePathTest, WindowsConventions)
{
    const auto w = [](const QString &p) { return NativePath(p, PathStyle::Windows); };
    // Drive-letter paths get the long-path prefix, forward slashes turned native.
    EXPECT_EQ(w("C:\\Data\\x.img"), "\\\\?\\C:\\Data\\x.img");
    EXPECT_EQ(w("c:/data/x.img"), "\\\\?\\c:\\data\\x.img");
    EXPECT_EQ(w("z:"), "\\\\?\\z:");
    EXPECT_EQ(w("C:relative"), "\\\\?\\C:relative");
    // Server-and-share paths become UNC long paths, less their first separator.
    EXPECT_EQ(w("\\\\server\\share\\f.bin"), "\\\\?\\UNC\\server\\share\\f.bin");
    EXPECT_EQ(w("//server/share"), "\\\\?\\UNC\\server\\share");
    EXPECT_EQ(w("\\/srv\\s"), "\\\\?\\UNC\\srv\\s");
    // Device and already-long paths are returned unchanged.
    EXPECT_EQ(w("\\\\.\\PhysicalDrive0"), "\\\\.\\PhysicalDrive0");
    EXPECT_EQ(w("\\\\?\\Volume{1234}\\"), "\\\\?\\Volume{1234}\\");
    EXPECT_EQ(w("\\\\?\\C:\\x"), "\\\\?\\C:\\x");
    // A server without a share, or too short a path, is only made native.
    EXPECT_EQ(w("\\\\server"), "\\\\server");
    EXPECT_EQ(w("\\\\a\\"), "\\\\a\\");
    EXPECT_EQ(w("//ab/"), "\\\\?\\UNC\\ab\\");
    // Relative and rooted paths without a drive.
    EXPECT_EQ(w("dir/file"), "dir\\file");
    EXPECT_EQ(w("\\dir\\file"), "\\dir\\file");
    EXPECT_EQ(w(""), "");
    EXPECT_EQ(w("1:\\x"), "1:\\x");
    EXPECT_EQ(w("\xC3\x84:\\x"), "\xC3\x84:\\x");
}

TEST(NativePathTest, PosixPathsAreUnchanged)
{
    for (const char *p : {"/dev/sda", "C:/x", "//server/share", "a\\b", "", "/tmp/x y"})
        EXPECT_EQ(NativePath(p, PathStyle::Posix), QString::fromUtf8(p));
    EXPECT_EQ(NativePath("/dev/loop0"), "/dev/loop0");
}

TEST(PlatformOpsTest, DeleteFileClearsAttributesThenDeletes)
{
    ScriptedBackend backend;
    TestRoot root(&backend);
    backend.AddFile("/tmp/a");
    ASSERT_TRUE(PlatformDeleteFile(&root, "/tmp/a"));
    EXPECT_EQ(backend.Calls(), (QStringList{"attributes /tmp/a", "delete /tmp/a"}));
    EXPECT_FALSE(PlatformDeleteFile(&root, "/tmp/a"));
    ASSERT_EQ(root.platform.size(), 1);
    EXPECT_EQ(root.platform[0].operation, uint32_t(PlatformOperation::DeleteFile));
    EXPECT_EQ(root.platform[0].error, SystemError::FileNotFound);
    EXPECT_EQ(root.platform[0].name, "/tmp/a");
}

TEST(PlatformOpsTest, DriveLetters)
{
    ScriptedBackend backend;
    TestRoot root(&backend);
    ASSERT_TRUE(AssignDriveLetter(&root, "/vol/x", 2));
    ASSERT_TRUE(RemoveDriveLetter(&root, 25));
    EXPECT_FALSE(AssignDriveLetter(&root, "/vol/x", 26));
    EXPECT_FALSE(RemoveDriveLetter(&root, 26));
    EXPECT_EQ(backend.Calls(), (QStringList{"mount C:\\ /vol/x/", "unmount Z:\\"}));

    // The system itself has no drive letters: a clear "not supported".
    TestRoot real;
    EXPECT_FALSE(AssignDriveLetter(&real, "/dev/null", 3));
    EXPECT_FALSE(RemoveDriveLetter(&real, 3));
    ASSERT_EQ(real.platform.size(), 2);
    EXPECT_EQ(real.platform[0].operation, uint32_t(PlatformOperation::SetVolumeMountPoint));
    EXPECT_EQ(real.platform[0].error, SystemError::NotSupported);
    EXPECT_EQ(real.platform[1].operation, uint32_t(PlatformOperation::DeleteVolumeMountPoint));
    EXPECT_EQ(real.platform[1].error, SystemError::NotSupported);
}

TEST(PlatformOpsTest, TextFilesRoundTripWithCrLf)
{
    ScriptedBackend backend;
    TestRoot root(&backend);
    ASSERT_TRUE(WriteTextFile(&root, "/tmp/t.txt", {"first", "second"}));
    EXPECT_EQ(backend.FileData("/tmp/t.txt"), QByteArray("first\r\nsecond\r\n"));
    EXPECT_EQ(ReadTextFile(&root, "/tmp/t.txt"), "first\r\nsecond\r\n");
    EXPECT_EQ(backend.OpenHandles(), 0);

    backend.AddFile("/tmp/empty");
    EXPECT_TRUE(ReadTextFile(&root, "/tmp/empty").isNull());
    backend.AddFile("/tmp/big", QByteArray(65536, 'a'));
    EXPECT_TRUE(ReadTextFile(&root, "/tmp/big").isNull());
    backend.AddFile("/tmp/max", QByteArray(65535, 'a'));
    EXPECT_EQ(ReadTextFile(&root, "/tmp/max").size(), 65535);
    EXPECT_TRUE(ReadTextFile(&root, "/tmp/none").isNull());
    EXPECT_EQ(backend.OpenHandles(), 0);

    // A failed write removes the half-written file.
    backend.ScriptWrite({SystemError::DiskFull, -1});
    EXPECT_FALSE(WriteTextFile(&root, "/tmp/u.txt", {"x"}));
    EXPECT_FALSE(backend.HasFile("/tmp/u.txt"));
    // A failed close deletes the file through the delete operation.
    backend.ScriptClose(SystemError::WriteFault);
    EXPECT_FALSE(WriteTextFile(&root, "/tmp/v.txt", {"x"}));
    EXPECT_FALSE(backend.HasFile("/tmp/v.txt"));
    EXPECT_EQ(backend.OpenHandles(), 0);
}

TEST(PlatformOpsTest, SystemVersionAndErrorTexts)
{
    ScriptedBackend backend;
    TestRoot root(&backend);
    backend.SetProduct("Scripted OS 12", "12");
    EXPECT_EQ(SystemVersionText(&root), "Scripted OS 12");
    EXPECT_TRUE(root.internal.isEmpty());
    backend.SetProduct("Scripted OS", "unknown");
    EXPECT_EQ(SystemVersionText(&root), "Unknown Windows version");
    EXPECT_EQ(root.InternalTexts(), QStringList{"Unknown Windows version"});

    EXPECT_FALSE(SystemVersionText(nullptr).isEmpty());
    EXPECT_EQ(SystemErrorText(nullptr, SystemError::WriteProtect), QString::fromLocal8Bit(strerror(EROFS)));
}

TEST(SystemErrorTest, ErrnoMapsOntoTheKernelMeanings)
{
    EXPECT_EQ(errnoToSystemError(0), 0u);
    EXPECT_EQ(errnoToSystemError(ENOENT), SystemError::FileNotFound);
    EXPECT_EQ(errnoToSystemError(ENXIO), SystemError::FileNotFound);
    EXPECT_EQ(errnoToSystemError(EROFS), SystemError::WriteProtect);
    EXPECT_EQ(errnoToSystemError(EACCES), SystemError::AccessDenied);
    EXPECT_EQ(errnoToSystemError(EPERM), SystemError::AccessDenied);
    EXPECT_EQ(errnoToSystemError(EINVAL), SystemError::InvalidParameter);
    EXPECT_EQ(errnoToSystemError(EIO), SystemError::Crc);
    EXPECT_EQ(errnoToSystemError(ENOSPC), SystemError::DiskFull);
    EXPECT_EQ(errnoToSystemError(ENOTTY), SystemError::InvalidFunction);
    EXPECT_EQ(errnoToSystemError(ENODEV), SystemError::DevNotExist);
    EXPECT_EQ(errnoToSystemError(EBUSY), SystemError::SharingViolation);
    EXPECT_EQ(errnoToTransferError(ENXIO), SystemError::DevNotExist);
    EXPECT_EQ(errnoToTransferError(ENODEV), SystemError::DevNotExist);
    EXPECT_EQ(errnoToTransferError(ENOMEDIUM), SystemError::MediaChanged);
    EXPECT_EQ(errnoToTransferError(EIO), SystemError::Crc);

    // Texts are the system's own; errors without a meaning keep their errno and its text.
    EXPECT_EQ(systemErrorText(SystemError::FileNotFound), QString::fromLocal8Bit(strerror(ENOENT)));
    EXPECT_EQ(systemErrorText(SystemError::AccessDenied), QString::fromLocal8Bit(strerror(EACCES)));
    const uint32_t loop = errnoToSystemError(ELOOP);
    EXPECT_TRUE(loop & SystemError::PlatformErrnoFlag);
    EXPECT_EQ(systemErrorText(loop), QString::fromLocal8Bit(strerror(ELOOP)));
    EXPECT_EQ(systemErrorText(SystemError::HandleEof), "Reached the end of the file");
    EXPECT_EQ(systemErrorText(SystemError::MediaChanged), "The media in the drive may have changed");
    EXPECT_EQ(systemErrorText(SystemError::InsufficientBuffer),
              "The data area passed to a system call is too small");
    EXPECT_EQ(systemErrorText(4242), "Unknown error 4242");
}

} // namespace
