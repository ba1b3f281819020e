// Sequential reads through CDevice::ReadSectors in 1 MiB requests from a block device (a loop
// device over a cached image file, set up by device_read_vs_dd.sh). The device path comes from
// BRINDLE_BENCH_DEVICE, its size in bytes from BRINDLE_BENCH_BYTES; at most 1 GiB is read.
#include <benchmark/benchmark.h>

#include <cstdlib>
#include <memory>
#include <vector>

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Root/Root.h"

namespace {

constexpr std::uint32_t Request = 1u << 20;
constexpr std::uint64_t Limit = 1ull << 30;

void BM_DeviceReadSectors(benchmark::State &state)
{
    const char *path = std::getenv("BRINDLE_BENCH_DEVICE");
    if (!path) {
        state.SkipWithError("BRINDLE_BENCH_DEVICE is not set (run bench/device_read_vs_dd.sh)");
        return;
    }
    const char *sizeText = std::getenv("BRINDLE_BENCH_BYTES");
    const std::uint64_t bytes =
        std::min<std::uint64_t>(sizeText ? std::strtoull(sizeText, nullptr, 10) : 0, Limit);
    if (bytes < Request) {
        state.SkipWithError("BRINDLE_BENCH_BYTES (the device size) is not set or below 1 MiB");
        return;
    }
    CRoot root;
    auto *handle = new CPlatformFile(&root, QString::fromLocal8Bit(path), PlatformKind::Device);
    DeviceInfo info;
    info.handle = handle;
    info.totalSectors = bytes / 512;
    info.sectorShift = 9;
    info.ready = 1;
    CDevice device(&root, info);
    std::vector<std::uint8_t> buffer(Request);
    const std::uint32_t count = Request / 512;
    for (auto _ : state) {
        for (std::uint64_t first = 0; first + count <= info.totalSectors; first += count) {
            std::uint32_t error = 0;
            if (!device.ReadSectors(first, count, buffer.data(), error)) {
                state.SkipWithError("read failed");
                return;
            }
        }
        benchmark::DoNotOptimize(buffer.data());
    }
    state.SetBytesProcessed(std::int64_t(state.iterations()) * std::int64_t(bytes / Request * Request));
}

BENCHMARK(BM_DeviceReadSectors)->Unit(benchmark::kMillisecond)->MinTime(3.0)->UseRealTime();

} // namespace

BENCHMARK_MAIN();
