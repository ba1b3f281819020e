#include "cli/TemplateSource.h"

namespace Cli {

QByteArray TemplateSource::read(std::uint64_t offset, std::uint32_t length)
{
    const std::uint64_t total = size();
    if (offset >= total)
        return {};
    const std::uint64_t n = std::min<std::uint64_t>(length, total - offset);
    QByteArray out(qsizetype(n), '\0');
    std::uint32_t error = 0;
    if (!m_storage.ReadBytes(offset, n, out.data(), error))
        return {};
    return out;
}

} // namespace Cli
