// Every template kind built over arbitrary records: no read outside the record, no allocation,
// loop or recursion sized by an unchecked field; every value is formatted, offered for editing and
// parsed back, and the tree is rendered as text and JSON.
#include <cstddef>
#include <cstdint>
#include <cstring>

#include <QByteArray>
#include <QJsonDocument>

#include "hexeditor/templates/core/Catalog.h"
#include "hexeditor/templates/core/Record.h"
#include "hexeditor/templates/core/Source.h"
#include "hexeditor/templates/core/TreeText.h"

namespace {

namespace T = HexEditor::Templates;

// The fuzz bytes from offset 0, zeros after them up to the claimed size.
class MemorySource : public T::Source
{
public:
    MemorySource(QByteArray bytes, std::uint64_t size, std::uint32_t sectorSize)
        : m_bytes(std::move(bytes)), m_size(size), m_sectorSize(sectorSize)
    {
    }
    std::uint64_t size() const override { return m_size; }
    std::uint32_t sectorSize() const override { return m_sectorSize; }
    QByteArray read(std::uint64_t offset, std::uint32_t length) override
    {
        if (offset >= m_size)
            return {};
        const std::uint64_t n = std::min<std::uint64_t>(length, m_size - offset);
        QByteArray out(qsizetype(n), '\0');
        if (offset < std::uint64_t(m_bytes.size())) {
            const std::uint64_t have = std::min<std::uint64_t>(n, std::uint64_t(m_bytes.size()) - offset);
            std::memcpy(out.data(), m_bytes.constData() + offset, have);
        }
        return out;
    }

private:
    QByteArray m_bytes;
    std::uint64_t m_size;
    std::uint32_t m_sectorSize;
};

void visit(T::Record &record, const T::Node &node, int depth)
{
    if (depth > 8)
        __builtin_trap(); // the trees are at most three levels deep
    for (bool copy : {false, true}) {
        if (copy && !record.hasCopyColumn())
            continue;
        const QString shown = record.displayValue(node, copy);
        const QVariant edit = record.editValue(node, copy);
        record.offsetText(node, true);
        record.fieldBytes(node, copy);
        const auto parsed = record.parseEdit(node, edit.isNull() ? shown : edit.toString(), copy);
        if (parsed && node.format != T::Bit && parsed->size() != qsizetype(node.size))
            __builtin_trap(); // a parsed value always has the field's size
    }
    for (const auto &c : node.children)
        visit(record, *c, depth + 1);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size)
{
    if (size < 4)
        return 0;
    // Byte 0: sector size (bits 0-2), kind (bits 3-6) and whether the tree is rendered as text and
    // JSON (bit 7); byte 1: the claimed source size in 4 KiB units above the data; bytes 2-3: the
    // record offset. The rest is the source's first bytes.
    static const std::uint32_t sectorSizes[] = {512, 1024, 2048, 4096, 8192, 65536, 520, 0};
    // The same for every input: made once.
    static const QList<T::Type> types = T::availableTypes();
    static const QLocale locale = QLocale::c();
    const std::uint32_t bps = sectorSizes[data[0] & 7];
    const QByteArray bytes(reinterpret_cast<const char *>(data + 4), qsizetype(size - 4));
    const std::uint64_t claimed = std::uint64_t(bytes.size()) + std::uint64_t(data[1]) * 4096;
    const std::uint64_t offset = std::uint64_t(data[2]) << 8 | data[3];
    MemorySource source(bytes, claimed, bps);
    const T::Type type = types[((data[0] >> 3) & 15) % types.size()];
    T::Record record(&source, T::createBuilder(type), locale);
    record.setOffset(offset / 2, false);
    record.setOffset(offset, true);
    if (!record.root())
        return 0;
    visit(record, *record.root(), 0);
    record.overlaps(offset, 1);
    // Rendering a tree of a thousand fields costs more than building it: half of the inputs.
    if (data[0] & 0x80) {
        T::treeText(record, nullptr, QStringLiteral("root"), false);
        QJsonDocument(T::listingJson(record)).toJson();
        T::listingText(record);
    }
    return 0;
}
