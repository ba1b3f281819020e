#include "hexeditor/Clipboard.h"

#include <QCoreApplication>
#include <QDataStream>
#include <QHash>
#include <QIODevice>
#include <QMimeData>
#include <QMutex>
#include <QMutexLocker>
#include <QSet>

#include "hexeditor/Layout.h"

namespace HexEditor::Clipboard {

namespace {

struct Registry
{
    QMutex lock;
    QHash<const Storage *, quint64> live; // storage -> its registration serial
    quint64 serial = 0;
};

Registry &registry()
{
    static Registry r;
    return r;
}

} // namespace

QString copyText(const QByteArray &bytes, Metrics::Pane pane, uint64_t firstOffset)
{
    switch (pane) {
    case Metrics::PaneAscii:
        return Layout::asciiLine(bytes);
    case Metrics::PaneUnicode: {
        QString s;
        int i = (firstOffset & 1) ? 1 : 0;
        for (; i + 1 < bytes.size(); i += 2) {
            const uint16_t unit = uint16_t(uint8_t(bytes[i]) | (uint8_t(bytes[i + 1]) << 8));
            s += unit < 32 ? QChar(QLatin1Char('.')) : QChar(unit);
        }
        return s;
    }
    default:
        return QString::fromLatin1(bytes.toHex().toUpper());
    }
}

QString formattedText(const QByteArray &bytes, uint64_t firstOffset, uint32_t bytesPerLine, bool hexOffset,
                      int offsetDigits)
{
    if (bytesPerLine == 0)
        bytesPerLine = 16;
    auto offsetText = [&](uint64_t o) {
        return hexOffset ? QStringLiteral("%1").arg(o, offsetDigits, 16, QLatin1Char('0')).toUpper()
                         : QStringLiteral("%1").arg(o, offsetDigits, 10, QLatin1Char('0'));
    };
    const int lineWidth = offsetDigits + 2 + int(bytesPerLine) * 3 + 1 + int(bytesPerLine);
    QString out = QString(lineWidth, QLatin1Char('-')) + QLatin1Char('\n');
    const uint64_t size = uint64_t(bytes.size());
    // Lines are aligned as the editor shows them: the first may start inside a line.
    uint64_t pos = 0;
    uint64_t lineStart = firstOffset - firstOffset % bytesPerLine;
    while (pos < size) {
        const uint64_t lead = (firstOffset + pos) - lineStart;
        QString hex, text;
        for (uint64_t k = 0; k < bytesPerLine; ++k) {
            if (k < lead || pos >= size) {
                hex += QStringLiteral("   ");
                text += QLatin1Char(' ');
                continue;
            }
            const uint8_t b = uint8_t(bytes[qsizetype(pos)]);
            hex += QStringLiteral("%1 ").arg(b, 2, 16, QLatin1Char('0')).toUpper();
            text += b < 32 ? QChar(QLatin1Char('.')) : QChar(char16_t(b));
            ++pos;
        }
        out +=
            offsetText(lineStart) + QStringLiteral("  ") + hex + QLatin1Char(' ') + text + QLatin1Char('\n');
        lineStart += bytesPerLine;
    }
    const uint64_t last = size ? firstOffset + size - 1 : firstOffset;
    out += QStringLiteral("Copied ") + QString::number(size) + QStringLiteral(" bytes from ") +
           offsetText(firstOffset) + QStringLiteral(" to ") + offsetText(last) + QLatin1Char('\n');
    return out;
}

QMimeData *copyData(const QByteArray &bytes, const QString &text)
{
    auto *data = new QMimeData;
    data->setData(QString::fromLatin1(BinaryFormat), bytes);
    data->setText(text);
    return data;
}

QByteArray pasteBytes(const QMimeData *data)
{
    if (!data)
        return {};
    if (data->hasFormat(QString::fromLatin1(BinaryFormat)))
        return data->data(QString::fromLatin1(BinaryFormat));
    if (data->hasText())
        return data->text().toUtf8();
    return {};
}

QMimeData *bulkData(Storage *storage, const DiskArea &area)
{
    quint64 serial = 0;
    {
        Registry &r = registry();
        QMutexLocker locker(&r.lock);
        serial = r.live.value(storage, 0);
    }
    QByteArray payload;
    QDataStream out(&payload, QIODevice::WriteOnly);
    out << quint64(QCoreApplication::applicationPid()) << quint64(reinterpret_cast<quintptr>(storage))
        << serial << quint64(area.offset) << quint64(area.length);
    auto *data = new QMimeData;
    data->setData(QString::fromLatin1(BulkFormat), payload);
    return data;
}

bool bulkReference(const QMimeData *data, BulkReference &out)
{
    if (!data || !data->hasFormat(QString::fromLatin1(BulkFormat)))
        return false;
    QByteArray payload = data->data(QString::fromLatin1(BulkFormat));
    QDataStream in(&payload, QIODevice::ReadOnly);
    quint64 pid = 0, pointer = 0, serial = 0, offset = 0, length = 0;
    in >> pid >> pointer >> serial >> offset >> length;
    if (in.status() != QDataStream::Ok || pid != quint64(QCoreApplication::applicationPid()))
        return false;
    // The pointer is trusted only while the same registration of that storage is alive.
    Registry &r = registry();
    QMutexLocker locker(&r.lock);
    for (auto it = r.live.cbegin(); it != r.live.cend(); ++it) {
        if (quint64(reinterpret_cast<quintptr>(it.key())) == pointer && it.value() == serial && serial != 0) {
            out.storage = const_cast<Storage *>(it.key());
            out.area = {offset, length};
            return true;
        }
    }
    return false;
}

void registerStorage(Storage *storage)
{
    if (!storage)
        return;
    Registry &r = registry();
    QMutexLocker locker(&r.lock);
    if (!r.live.contains(storage))
        r.live.insert(storage, ++r.serial);
}

void unregisterStorage(Storage *storage)
{
    Registry &r = registry();
    QMutexLocker locker(&r.lock);
    r.live.remove(storage);
}

bool isRegistered(const Storage *storage)
{
    Registry &r = registry();
    QMutexLocker locker(&r.lock);
    return r.live.contains(storage);
}

} // namespace HexEditor::Clipboard
