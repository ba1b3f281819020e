// The drive layout answer of a device, as GetLayoutInfo reads it: arbitrary answer bytes, counts and
// buffer-size refusals.
#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Common/cRoot.h"
#include "Kernel/Implementation/Platform/DeviceControl.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Platform/ScriptedBackend.h"

#include <QByteArray>
#include <QList>

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>

namespace {

class FuzzRoot : public cRoot
{
public:
    explicit FuzzRoot(IPlatformBackend &backend) : m_backend(backend) {}
    uint8_t RetryCount(uint8_t) override { return 2; }
    IPlatformBackend &Backend() override { return m_backend; }

private:
    IPlatformBackend &m_backend;
};

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size)
{
    if (size < 2)
        return 0;
    // First byte: how many calls refuse with "buffer too small" before the answer; second: how the
    // reported count is formed.
    const uint32_t refusals = data[0];
    const uint8_t mode = data[1];
    const QByteArray answer(reinterpret_cast<const char *>(data + 2), qsizetype(size - 2));

    ScriptedBackend backend;
    backend.AddFile("/dev/fuzz", QByteArray(512, '\0'));
    uint32_t calls = 0;
    backend.SetControlHandler(DeviceControl::IOCTL_DISK_GET_DRIVE_LAYOUT_EX,
                              [&](const QByteArray &, QByteArray &out, uint32_t &returned) -> uint32_t {
                                  if (calls++ < refusals)
                                      return SystemError::InsufficientBuffer;
                                  const qsizetype n = std::min(out.size(), answer.size());
                                  std::memcpy(out.data(), answer.constData(), size_t(n));
                                  returned = (mode & 1) ? uint32_t(out.size()) : uint32_t(n);
                                  if (mode & 2)
                                      returned += mode >> 2;
                                  return 0;
                              });
    FuzzRoot root(backend);
    CPlatformFile disk(&root, "/dev/fuzz", PlatformKind::Device);
    QList<uint64_t> offsets;
    const bool ok = disk.GetLayoutInfo(offsets);
    if (!ok && !offsets.isEmpty())
        abort();
    if (offsets.size() > 128 || calls > 128)
        abort();
    disk.Close();
    return 0;
}
