// Paints the hex editor control: background, separators, header, lines of bytes in every shown
// pane, and the layers over them (unreadable sectors with their watermark, ghosted context bytes,
// bookmarks, search hits, template colouring and the selected field's outline, modified bytes, the
// selection and the caret).
#pragma once

#include <QFont>
#include <QHash>
#include <QList>
#include <QPainterPath>

#include <functional>

#include "hexeditor/DiskArea.h"
#include "hexeditor/EditorCtrl.h"
#include "hexeditor/Metrics.h"
#include "hexeditor/PaintPalette.h"

class QPainter;

namespace HexEditor {

class Storage;

struct PaintInput
{
    const Metrics *metrics = nullptr;
    Storage *storage = nullptr;
    PaintPalette palette;
    Metrics::Caret caret;
    bool showCaret = true;
    DiskArea selection;
    QList<EditorCtrl::BookmarkMark> bookmarks;
    QList<DiskArea> searchHits;
    QList<EditorCtrl::TemplateArea> coloring;
    bool coloringOn = false;
    DiskArea outline;
    // For a file shown in its disk or partition: whether a sector holds bytes of the file.
    std::function<bool(uint64_t sector)> isFileSector;
    int width = 0;
    int height = 0;
};

class Painter
{
public:
    static constexpr const char *WatermarkText = "READ ERROR";
    // Arial, 10 points, black weight.
    static QFont watermarkFont();

    // Paints the whole viewport (x already shifted by the horizontal scroll).
    void paint(QPainter &p, const PaintInput &in);

    // Drops the cached outline paths (after a scroll or re-layout).
    void invalidate() { m_paths.clear(); }

private:
    QPainterPath outline(const Metrics &m, Metrics::Pane pane, const DiskArea &area);

    struct Key
    {
        int pane;
        uint64_t offset;
        uint64_t length;
        uint64_t top;
        bool operator==(const Key &) const = default;
    };
    friend size_t qHash(const Key &k, size_t seed) noexcept
    {
        return qHashMulti(seed, k.pane, k.offset, k.length, k.top);
    }
    QHash<Key, QPainterPath> m_paths;
    QFont m_watermark = watermarkFont();
};

} // namespace HexEditor
