// Disk images through the kernel: reading a whole dynamic VHD through CImageHandle_VirtualPC in
// 1 MiB requests (BRINDLE_BENCH_VHD), and writing an own-format image of a raw file at zlib
// level 1 (BRINDLE_BENCH_RAW, into BRINDLE_BENCH_OUT). bench/image_vs_tools.sh prepares the
// files and compares with qemu-img convert and gzip -1.
#include <benchmark/benchmark.h>

#include <cstdlib>
#include <cstring>
#include <vector>

#include "Kernel/Implementation/Images/ImageHandleRaw.h"
#include "Kernel/Implementation/Images/ImageHandleVirtualPC.h"
#include "Kernel/Implementation/Images/TarvoWriter.h"

namespace {

constexpr std::uint32_t RequestSectors = 2048; // 1 MiB

void BM_VhdDynamicRead(benchmark::State &state)
{
    const char *path = std::getenv("BRINDLE_BENCH_VHD");
    if (!path) {
        state.SkipWithError("BRINDLE_BENCH_VHD is not set (run bench/image_vs_tools.sh)");
        return;
    }
    CImageHandle_VirtualPC handle(nullptr, {QString::fromLocal8Bit(path)});
    if (!handle.IsValid()) {
        state.SkipWithError("the VHD does not open");
        return;
    }
    std::vector<std::uint8_t> buffer(std::size_t(RequestSectors) * 512);
    const std::uint64_t total = handle.GetTotalSectors();
    for (auto _ : state) {
        for (std::uint64_t first = 0; first < total; first += RequestSectors) {
            const auto n = std::uint32_t(std::min<std::uint64_t>(RequestSectors, total - first));
            std::uint32_t error = 0;
            if (!handle.ReadWrite(true, first, n, buffer.data(), error)) {
                state.SkipWithError("read failed");
                return;
            }
        }
        benchmark::DoNotOptimize(buffer.data());
    }
    state.SetBytesProcessed(std::int64_t(state.iterations()) * std::int64_t(total * 512));
}

void BM_TarvoCreateLevel1(benchmark::State &state)
{
    const char *raw = std::getenv("BRINDLE_BENCH_RAW");
    const char *out = std::getenv("BRINDLE_BENCH_OUT");
    if (!raw || !out) {
        state.SkipWithError(
            "BRINDLE_BENCH_RAW and BRINDLE_BENCH_OUT are not set (run bench/image_vs_tools.sh)");
        return;
    }
    CImageHandle_Raw source(nullptr, {QString::fromLocal8Bit(raw)});
    if (!source.IsValid()) {
        state.SkipWithError("the raw file does not open");
        return;
    }
    TarvoWriteOptions options;
    options.level = 1;
    options.sectorsPerBlock = 128;
    CTarvoWriter writer(nullptr, options);
    auto read = [&source](std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error) {
        return source.ReadWrite(true, first, count, buffer, error);
    };
    for (auto _ : state) {
        if (!writer.Write(QString::fromLocal8Bit(out), 9, source.GetTotalSectors(), read)) {
            state.SkipWithError("writing failed");
            return;
        }
    }
    state.SetBytesProcessed(std::int64_t(state.iterations()) * std::int64_t(source.GetTotalSectors() * 512));
}

BENCHMARK(BM_VhdDynamicRead)->Unit(benchmark::kMillisecond)->MinTime(2.0)->UseRealTime();
BENCHMARK(BM_TarvoCreateLevel1)->Unit(benchmark::kMillisecond)->Iterations(1)->UseRealTime();

} // namespace

BENCHMARK_MAIN();
