// Paging through a sparse image file with the hex editor's storage the way the editor does it
// (64 KiB views, one-sector kernel requests through the bounded sector cache), against dd of the
// same range (bench/hexstorage_vs_dd.sh prints the ratio). The image is made here: a sparse file
// of BRINDLE_BENCH_BYTES (default 4 GiB). A second case opens a 2 TB sparse image and pages
// through its first and last 256 MiB. Both report the peak resident set size after paging.
#include <benchmark/benchmark.h>

#include <QFile>
#include <QTemporaryDir>

#include <sys/resource.h>

#include <cstdlib>

#include "Kernel/Implementation/Root/Root.h"
#include "hexeditor/StorageFactory.h"

namespace {

constexpr std::uint64_t Page = 64 * 1024;

double peakRssMiB()
{
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    return double(usage.ru_maxrss) / 1024.0; // kilobytes on Linux
}

QString sparseFile(QTemporaryDir &dir, std::uint64_t bytes)
{
    const QString path = dir.filePath(QStringLiteral("sparse.img"));
    QFile f(path);
    if (!f.open(QIODevice::WriteOnly) || !f.resize(qint64(bytes)))
        return QString();
    return path;
}

void page(HexEditor::Storage &s, std::uint64_t from, std::uint64_t to, std::uint64_t &bytes)
{
    for (std::uint64_t off = from; off < to; off += Page)
        bytes += std::uint64_t(s.read(HexEditor::DiskArea{off, Page}).size());
}

// Makes a sparse image of `size` bytes, then in every iteration opens it as a plain-file storage
// and hands it to `walk`, which pages through it and counts the bytes read; reports the cache's
// size after paging and the peak RSS.
template <typename Walk>
void pageImage(benchmark::State &state, std::uint64_t size, const char *makeError, Walk walk)
{
    QTemporaryDir dir;
    const QString path = sparseFile(dir, size);
    if (path.isEmpty()) {
        state.SkipWithError(makeError);
        return;
    }
    CRoot root;
    QString error;
    std::uint64_t bytes = 0;
    for (auto _ : state) {
        std::unique_ptr<HexEditor::Storage> s = HexEditor::createPlainFileStorage(path, &root, error);
        if (!s) {
            state.SkipWithError("cannot open the image");
            return;
        }
        walk(*s, bytes);
        state.counters["cache_MiB"] = double(s->cachedBytes()) / (1 << 20);
    }
    state.SetBytesProcessed(std::int64_t(bytes));
    state.counters["peak_rss_MiB"] = peakRssMiB();
}

void BM_StoragePaging(benchmark::State &state)
{
    const char *sizeText = std::getenv("BRINDLE_BENCH_BYTES");
    const std::uint64_t size = sizeText ? std::strtoull(sizeText, nullptr, 10) : (4ull << 30);
    pageImage(state, size, "cannot make the sparse image",
              [](HexEditor::Storage &s, std::uint64_t &bytes) { page(s, 0, s.size(), bytes); });
}
BENCHMARK(BM_StoragePaging)->Unit(benchmark::kMillisecond)->Iterations(1);

void BM_StorageHugeSparseImage(benchmark::State &state)
{
    const std::uint64_t size = 2000ull * 1000 * 1000 * 1000; // 2 TB
    pageImage(state, size, "cannot make the 2 TB sparse image (file system limit?)",
              [](HexEditor::Storage &s, std::uint64_t &bytes) {
                  page(s, 0, 256ull << 20, bytes);
                  page(s, s.size() - (256ull << 20), s.size(), bytes);
              });
}
BENCHMARK(BM_StorageHugeSparseImage)->Unit(benchmark::kMillisecond)->Iterations(1);

} // namespace

BENCHMARK_MAIN();
