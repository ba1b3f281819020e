#include "PlatformBackend.h"

#include "Linux/LinuxBackend.h"

IPlatformBackend::~IPlatformBackend() = default;

IPlatformBackend &DefaultPlatformBackend()
{
    static LinuxBackend backend;
    return backend;
}
