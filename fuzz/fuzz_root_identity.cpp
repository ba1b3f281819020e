// Storage descriptors, identify blocks, serial texts and mount tables from arbitrary bytes: no read
// outside the answer whatever offsets it claims.
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <vector>

#include <QByteArray>
#include <QString>

#include "Kernel/Implementation/Platform/Linux/SysfsEnumerate.h"
#include "Kernel/Implementation/Root/RootIdentity.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size)
{
    // The answer is exactly as long as the data, so an offset past it would be caught.
    std::vector<uint8_t> answer(data, data + size);
    (void)RootIdentity::ParseDeviceDescriptor(answer.data(), uint32_t(answer.size()));

    std::vector<uint8_t> block(512, 0);
    std::memcpy(block.data(), data, size < block.size() ? size : block.size());
    (void)RootIdentity::ParseIdentify(block.data());

    const QString text =
        QString::fromLatin1(reinterpret_cast<const char *>(data), qsizetype(size < 256 ? size : 256));
    (void)RootIdentity::CleanSerial(text);
    (void)RootIdentity::ManagementSerial(text);
    (void)RootIdentity::ModelInReadingOrder(text);
    (void)Sysfs::ParseMountInfo(QByteArray(reinterpret_cast<const char *>(data), qsizetype(size)));
    return 0;
}
