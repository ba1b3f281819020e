// Paint time of the hex editor control: a full 1080-pixel-high view of a device, painted into an
// image as the window system would ask for it. "Still" repaints the same lines (sectors cached);
// "Scrolling" moves one page per frame through the device, so every frame reads new sectors.
#include <QApplication>
#include <QImage>
#include <QPainter>
#include <benchmark/benchmark.h>

#include <cstring>
#include <memory>

#include "Kernel/Implementation/Common/cStorage.h"
#include "hexeditor/EditorCtrl.h"
#include "hexeditor/Storage.h"

namespace {

// A device of any size whose bytes are a function of their offset.
class PatternDevice : public cStorage
{
public:
    explicit PatternDevice(std::uint64_t size) : m_size(size) {}
    StorageKind GetStorageKind() const override { return StorageKind::Device; }
    QString GetDisplayName() const override { return QStringLiteral("Pattern Device"); }
    std::uint64_t GetSize() const override { return m_size; }
    std::uint32_t GetBytesPerSector() const override { return 512; }
    std::uint64_t GetTotalSectors() const override { return m_size / 512; }
    bool ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error) override
    {
        auto *out = static_cast<unsigned char *>(buffer);
        for (std::uint64_t i = 0; i < std::uint64_t(count) * 512; ++i)
            out[i] = static_cast<unsigned char>((first * 512 + i) * 2654435761u >> 13);
        error = 0;
        return true;
    }
    bool WriteSectors(std::uint64_t, std::uint32_t, const void *, std::uint32_t &error) override
    {
        error = 5;
        return false;
    }
    bool ReadBytes(std::uint64_t, std::uint64_t, void *, std::uint32_t &error) override
    {
        error = 5;
        return false;
    }
    bool WriteBytes(std::uint64_t, std::uint64_t, const void *, std::uint32_t &error) override
    {
        error = 5;
        return false;
    }

private:
    std::uint64_t m_size;
};

struct View
{
    PatternDevice device{1ull << 40};
    HexEditor::Storage storage{&device};
    HexEditor::EditorCtrl ctrl{&storage, false};
    QImage image;

    explicit View(uint32_t columns)
    {
        ctrl.setColumns(columns);
        ctrl.resize(1920, 1080);
        ctrl.show();
        QApplication::processEvents();
        image = QImage(ctrl.viewport()->size(), QImage::Format_ARGB32_Premultiplied);
        ctrl.setSelection({100, 3000});
        ctrl.applyEdit(64, QByteArray(40, 'x'));
    }
    void paint()
    {
        QPainter p(&image);
        ctrl.viewport()->render(&p);
    }
};

void BM_PaintStill(benchmark::State &state)
{
    View view(uint32_t(state.range(0)));
    view.paint();
    for (auto _ : state)
        view.paint();
    state.counters["lines"] = view.ctrl.visibleLines();
}

void BM_PaintScrolling(benchmark::State &state)
{
    View view(uint32_t(state.range(0)));
    uint64_t offset = 0;
    for (auto _ : state) {
        offset += uint64_t(view.ctrl.fullyVisibleLines()) * 16;
        view.ctrl.setCaretOffset(offset);
        view.paint();
    }
    state.counters["lines"] = view.ctrl.visibleLines();
}

// Offset, hexadecimal and ASCII columns (the default), and all four columns.
BENCHMARK(BM_PaintStill)->Arg(11)->Arg(15)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_PaintScrolling)->Arg(11)->Arg(15)->Unit(benchmark::kMillisecond);

} // namespace

int main(int argc, char **argv)
{
    qputenv("QT_QPA_PLATFORM", "offscreen");
    QApplication app(argc, argv);
    benchmark::Initialize(&argc, argv);
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return 0;
}
