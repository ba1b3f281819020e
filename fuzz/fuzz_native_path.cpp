// NativePath on arbitrary text, in both path conventions.
#include "Kernel/Implementation/Platform/PlatformOps.h"

#include <QString>

#include <cstddef>
#include <cstdint>
#include <cstdlib>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size)
{
    const QString path = QString::fromUtf8(reinterpret_cast<const char *>(data), qsizetype(size));
    if (NativePath(path, PathStyle::Posix) != path)
        abort();
    const QString native = NativePath(path, PathStyle::Windows);
    if (native.contains(QLatin1Char('/')))
        abort();
    // The result is the path made native, possibly behind a long-path prefix.
    QString made = path;
    made.replace(QLatin1Char('/'), QLatin1Char('\\'));
    if (!native.endsWith(made.mid(1)) || native.size() > made.size() + 7)
        abort();
    return 0;
}
