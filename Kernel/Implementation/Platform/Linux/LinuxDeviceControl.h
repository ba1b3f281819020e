// Answers of the device controls (DeviceControl.h) on Linux, from ioctls, sysfs, udev and libblkid.
#pragma once

#include "Kernel/Implementation/Platform/PlatformBackend.h"

#include <cstdint>

class LinuxBackend;

class LinuxDeviceControl
{
public:
    LinuxDeviceControl(LinuxBackend &backend, int fd, PlatformHandle handle);

    bool Run(uint32_t code, const void *in, uint32_t inSize, void *out, uint32_t outSize, uint32_t &returned,
             uint32_t &error);

private:
    uint32_t Answer(uint32_t code, const void *in, uint32_t inSize, void *out, uint32_t outSize,
                    uint32_t &returned);
    uint32_t Lock();
    uint32_t Unlock();

    LinuxBackend &m_backend;
    int m_fd;
    PlatformHandle m_handle;
};
