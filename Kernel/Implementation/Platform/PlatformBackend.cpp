#include "Kernel/Implementation/Platform/PlatformBackend.h"

#include "Kernel/Implementation/Common/cRoot.h"
#include "Kernel/Implementation/Platform/Linux/LinuxBackend.h"

IPlatformBackend::~IPlatformBackend() = default;

IPlatformBackend::TransferResult IPlatformBackend::ReadAt(PlatformHandle handle, uint64_t position,
                                                          void *buffer, uint32_t size, uint32_t &done,
                                                          uint32_t &error)
{
    done = 0;
    uint64_t reached = 0;
    if (!SetPosition(handle, int64_t(position), SeekOrigin::Begin, reached, error))
        return TransferResult::PositionFailed;
    return Read(handle, buffer, size, done, error) ? TransferResult::Done : TransferResult::TransferFailed;
}

IPlatformBackend::TransferResult IPlatformBackend::WriteAt(PlatformHandle handle, uint64_t position,
                                                           const void *buffer, uint32_t size, uint32_t &done,
                                                           uint32_t &error)
{
    done = 0;
    uint64_t reached = 0;
    if (!SetPosition(handle, int64_t(position), SeekOrigin::Begin, reached, error))
        return TransferResult::PositionFailed;
    return Write(handle, buffer, size, done, error) ? TransferResult::Done : TransferResult::TransferFailed;
}

IPlatformBackend &DefaultPlatformBackend()
{
    static LinuxBackend backend;
    return backend;
}

// A root's handles use the platform's default back end unless the root gives its own. Defined with
// the default back end, so the root's interface needs nothing of the platform layer.
IPlatformBackend &cRoot::Backend()
{
    return DefaultPlatformBackend();
}
