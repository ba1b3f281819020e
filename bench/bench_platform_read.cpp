// One-sector reads through a platform file handle against the same reads made with bare pread calls
// on a sparse image file (default 256 MiB, BRINDLE_BENCH_BYTES overrides): the difference is what the
// handle's transfer path (lock, checks, retries, position bookkeeping) adds to each request.
#include <benchmark/benchmark.h>

#include <QFile>
#include <QTemporaryDir>

#include <fcntl.h>
#include <unistd.h>

#include <cstdlib>

#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Root/Root.h"

namespace {

constexpr std::uint32_t Sector = 512;

std::uint64_t imageBytes()
{
    const char *sizeText = std::getenv("BRINDLE_BENCH_BYTES");
    const std::uint64_t size = sizeText ? std::strtoull(sizeText, nullptr, 10) : (256ull << 20);
    return size / Sector * Sector;
}

QString sparseFile(QTemporaryDir &dir, std::uint64_t bytes)
{
    const QString path = dir.filePath(QStringLiteral("sparse.img"));
    QFile f(path);
    if (!f.open(QIODevice::WriteOnly) || !f.resize(qint64(bytes)))
        return QString();
    return path;
}

void BM_PlatformSectorReads(benchmark::State &state)
{
    QTemporaryDir dir;
    const std::uint64_t bytes = imageBytes();
    const QString path = sparseFile(dir, bytes);
    if (path.isEmpty() || bytes == 0) {
        state.SkipWithError("cannot make the sparse image");
        return;
    }
    CRoot root;
    CPlatformFile file(&root, path, PlatformKind::File);
    alignas(64) char buffer[Sector];
    for (auto _ : state) {
        for (std::uint64_t pos = 0; pos < bytes; pos += Sector) {
            if (!file.Read(pos, Sector, buffer)) {
                state.SkipWithError("a read failed");
                return;
            }
        }
        benchmark::ClobberMemory();
    }
    file.Close();
    state.SetBytesProcessed(std::int64_t(state.iterations() * bytes));
}
BENCHMARK(BM_PlatformSectorReads)->Unit(benchmark::kMillisecond)->Iterations(3);

// The floor: the same requests as bare system calls.
void BM_BarePreadSectorReads(benchmark::State &state)
{
    QTemporaryDir dir;
    const std::uint64_t bytes = imageBytes();
    const QString path = sparseFile(dir, bytes);
    const int fd = path.isEmpty() ? -1 : ::open(QFile::encodeName(path).constData(), O_RDONLY | O_CLOEXEC);
    if (fd < 0 || bytes == 0) {
        state.SkipWithError("cannot make the sparse image");
        return;
    }
    alignas(64) char buffer[Sector];
    for (auto _ : state) {
        for (std::uint64_t pos = 0; pos < bytes; pos += Sector) {
            if (::pread(fd, buffer, Sector, off_t(pos)) != ssize_t(Sector)) {
                state.SkipWithError("a read failed");
                ::close(fd);
                return;
            }
        }
        benchmark::ClobberMemory();
    }
    ::close(fd);
    state.SetBytesProcessed(std::int64_t(state.iterations() * bytes));
}
BENCHMARK(BM_BarePreadSectorReads)->Unit(benchmark::kMillisecond)->Iterations(3);

} // namespace

BENCHMARK_MAIN();
