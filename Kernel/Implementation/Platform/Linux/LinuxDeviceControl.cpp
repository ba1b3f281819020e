#include "LinuxDeviceControl.h"

#include "LinuxBackend.h"

#include "../../SystemError.h"

LinuxDeviceControl::LinuxDeviceControl(LinuxBackend &backend, int fd, PlatformHandle handle)
    : m_backend(backend), m_fd(fd), m_handle(handle)
{
}

bool LinuxDeviceControl::Run(uint32_t, const void *, uint32_t, void *, uint32_t, uint32_t &returned,
                             uint32_t &error)
{
    returned = 0;
    error = SystemError::InvalidFunction;
    return false;
}
