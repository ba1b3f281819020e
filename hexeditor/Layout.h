// Shapes and texts derived from the metrics: the stair-shaped outline of a byte range in a pane,
// the header row's texts, and the text of one line in each pane.
#pragma once

#include <QByteArray>
#include <QPainterPath>
#include <QPolygon>
#include <QString>

#include "hexeditor/DiskArea.h"
#include "hexeditor/Metrics.h"

namespace HexEditor::Layout {

// The closed outline of the bytes of `area` in `pane`, as far as it touches the visible lines
// (lines outside the view are cut one line beyond its edges). Empty when nothing is visible.
QPolygon rangeOutline(const Metrics &m, Metrics::Pane pane, const DiskArea &area);
QPainterPath rangePath(const Metrics &m, Metrics::Pane pane, const DiskArea &area);

// The header text above the hexadecimal column: every byte's index within the line as two digits
// (upper-case hexadecimal with hexOffset, decimal otherwise), spaced like the data cells.
QString hexHeader(const Metrics &m);

// The text of one line's bytes (`bytes` may be shorter than a line at the end of the data).
QString hexLine(const Metrics &m, const QByteArray &bytes);
QString asciiLine(const QByteArray &bytes);
// One character per two bytes, little-endian code units; units below 32 and lone surrogates as ".".
QString unicodeLine(const QByteArray &bytes);

// The display character of one byte in the ASCII column.
QChar asciiChar(uint8_t byte);
QChar unicodeChar(uint16_t unit);

} // namespace HexEditor::Layout
