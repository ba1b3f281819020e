#include "Kernel/Implementation/Report/HardwareInfo.h"

#include "Kernel/Implementation/Common/DeviceInfo.h"
#include "Kernel/Implementation/Common/KernelVersion.h"
#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Partitions/Partition.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Report/HexDump.h"
#include "Kernel/Implementation/Root/Root.h"

#include <QBuffer>
#include <QLocale>
#include <QSysInfo>
#include <QXmlStreamWriter>

#include <algorithm>

namespace HardwareInfo {

namespace {

const QString LineEnd = QStringLiteral("\r\n");

// Characters XML 1.0 cannot carry (controls other than tab, line feed and carriage return,
// non-characters and unpaired surrogates) become the replacement character.
QString XmlSafe(const QString &text)
{
    QString out;
    out.reserve(text.size());
    for (qsizetype i = 0; i < text.size(); ++i) {
        const QChar c = text[i];
        const char16_t u = c.unicode();
        if (c.isHighSurrogate() && i + 1 < text.size() && text[i + 1].isLowSurrogate()) {
            out += c;
            out += text[++i];
            continue;
        }
        const bool control = u < 0x20 && u != 0x09 && u != 0x0A && u != 0x0D;
        if (control || c.isSurrogate() || u == 0xFFFE || u == 0xFFFF)
            out += QChar(QChar::ReplacementCharacter);
        else
            out += c;
    }
    return out;
}

// A value inside the pseudo-attribute of a processing instruction.
QString PseudoAttribute(const QString &text)
{
    QString out = XmlSafe(text);
    out.replace(QLatin1Char('&'), QLatin1String("&amp;"));
    out.replace(QLatin1Char('<'), QLatin1String("&lt;"));
    out.replace(QLatin1Char('>'), QLatin1String("&gt;"));
    out.replace(QLatin1Char('"'), QLatin1String("&quot;"));
    return out;
}

bool IsOptical(std::uint32_t kind)
{
    return kind == static_cast<std::uint32_t>(FileSystemKind::Udf) ||
           kind == static_cast<std::uint32_t>(FileSystemKind::Cdfs);
}

class ReportWriter
{
public:
    explicit ReportWriter(QIODevice *device) : m_xml(device) {}

    void Start(const Header &header)
    {
        m_xml.writeStartDocument(QStringLiteral("1.0"));
        NewLine();
        if (!header.stylesheet.isEmpty()) {
            m_xml.writeProcessingInstruction(
                QStringLiteral("xml-stylesheet"),
                QStringLiteral("type=\"text/xsl\" href=\"%1\"").arg(PseudoAttribute(header.stylesheet)));
            NewLine();
        }
        Open("hardware_info");
        Open("main");
        Element("application", header.application);
        Element("kernel", Kernel::version());
        Element("created", QLocale::system().toString(header.created, QLocale::ShortFormat));
        Element("platform", header.platform);
        Close();
        Open("devices");
    }

    void Finish(const QStringList &logLines)
    {
        Close(); // devices
        Open("log_info");
        if (logLines.isEmpty()) {
            Text(QStringLiteral("No log info") + LineEnd);
        } else {
            for (const QString &line : logLines)
                Text(QStringLiteral(">>") + line + LineEnd);
        }
        Close();
        Close(); // hardware_info
        m_xml.writeEndDocument();
    }

    void Device(CDevice &device)
    {
        Open("device");
        Element("display_name", device.GetDisplayName());
        Element("platform_name", PlatformName(device));
        Element("bios_name", BiosName(device));
        Element("bios_version", device.GetFirmware());
        Element("bios_serial_DIOC", device.GetSerial(1));
        Element("bios_serial_SMART", device.GetSerial(2));
        Element("bios_serial_WMI", device.GetSerial(3));
        Element("media_type", MediaTypeName(device.GetMediaType()));
        const bool ready = device.IsReady();
        Bool("is_ready", ready);
        if (ready) {
            const std::uint32_t attributes = device.GetAttributes();
            const PartStyle style = device.GetPartStyle();
            Element("part_style", PartStyleName(style));
            Bool("has_ldm", attributes & DeviceAttribute::Ldm);
            Bool("has_lvm", style == PartStyle::Lvm);
            Bool("has_wss", attributes & DeviceAttribute::Wss);
            Bool("is_initialized", style != PartStyle::Raw);

            Open("geometry");
            Number("tracks_per_cylinder", device.GetTracksPerCylinder());
            Number("sectors_per_track", device.GetSectorsPerTrack());
            Number("total_sectors", device.GetTotalSectors());
            Number("bytes_per_sector", device.GetBytesPerSector());
            Element("total_size", SizeText(device.GetSize()));
            Close();

            std::uint64_t accessible = 0, hpa = 0, dco = 0;
            device.GetNativeSizes(accessible, hpa, dco);
            Open("ata");
            NativeCount("accessible_sectors", accessible);
            NativeCount("native_sectors_hpa", hpa);
            NativeCount("native_sectors_dco", dco);
            Close();

            DumpSector(device, 0, 0);
            DumpSector(device, 63, 63);
        }
        Open("partitions");
        for (std::uint32_t i = 0; i < device.GetPartitionCount(); ++i)
            if (cPartition *p = device.GetPartition(i))
                Partition(device, *p);
        Close();
        Close(); // device
    }

    bool Failed() const { return m_xml.hasError(); }

private:
    void Partition(CDevice &device, cPartition &partition)
    {
        const std::uint32_t kind = partition.GetKind();
        Open("partition");
        Element("display_name", partition.GetDisplayName());
        Bool("is_primary", partition.GetParent() == nullptr);
        Bool("is_active", partition.GetActive() != 0);
        Number("segment", partition.GetTableSector());
        Number("offset", partition.GetStart() * device.GetBytesPerSector());
        Element("file_system", FileSystemKindName(kind));
        Number("first_sector", partition.GetStart());
        Number("total_sectors", partition.GetLength());
        Element("total_size", SizeText(partition.GetLength() * device.GetBytesPerSector()));
        if (const VolumeInfo *volume = partition.GetVolumeInfo())
            Drive(*volume);

        // Its own sectors of interest: the first sector of anything allocated, and on an optical
        // file system the volume descriptors (sectors 16 to 21) that are not all zeros.
        if (IsOptical(kind)) {
            for (std::uint64_t s = 16; s <= 21; ++s)
                DumpSector(partition, s, partition.GetStart() + s, true);
        } else if (kind != static_cast<std::uint32_t>(FileSystemKind::Unallocated)) {
            DumpSector(partition, 0, partition.GetStart());
        }

        if (partition.GetChildCount()) {
            Open("partitions");
            for (std::uint32_t i = 0; i < partition.GetChildCount(); ++i)
                if (cPartition *child = partition.GetChild(i))
                    Partition(device, *child);
            Close();
        }
        Close();
    }

    void Drive(const VolumeInfo &volume)
    {
        Open("drive");
        QString systemName = volume.mountPoint;
        if (systemName.isEmpty() && volume.letter >= 0 && volume.letter < 26)
            systemName = QStringLiteral("%1:").arg(QChar('A' + volume.letter));
        if (systemName.isEmpty())
            systemName = volume.path;
        Element("system_name", systemName);
        Element("guid_name", volume.path);
        Element("file_system", volume.fileSystemName.isEmpty() ? FileSystemKindName(volume.fileSystem)
                                                               : volume.fileSystemName);
        Element("volume_label", volume.label);
        Element("serial_number", volume.serial);
        const std::uint64_t free = std::min(volume.freeSize, volume.totalSize);
        Element("total_size", SizeText(volume.totalSize));
        Element("used_space", SizeText(volume.totalSize - free));
        Element("free_space", SizeText(free));
        Number("total_sectors", volume.sectorSize ? volume.totalSize / volume.sectorSize : 0);
        Number("sectors_per_cluster", volume.sectorSize ? volume.clusterSize / volume.sectorSize : 0);
        Close();
    }

    // A sector that cannot be read is left out; so is an all-zero one when asked.
    void DumpSector(cStorage &storage, std::uint64_t sector, std::uint64_t shownNumber,
                    bool skipZeros = false)
    {
        const std::uint32_t size = storage.GetBytesPerSector();
        if (size == 0 || size > 65536 || sector >= storage.GetTotalSectors())
            return;
        QByteArray data(static_cast<qsizetype>(size), '\0');
        std::uint32_t error = 0;
        if (!storage.ReadSectors(sector, 1, data.data(), error))
            return;
        if (skipZeros && data.count('\0') == data.size())
            return;
        m_xml.writeStartElement(QStringLiteral("sector"));
        m_xml.writeAttribute(QStringLiteral("number"), QString::number(shownNumber));
        m_xml.writeAttribute(QStringLiteral("size"), QString::number(size));
        // Dump characters are printable ASCII; the writer splits any "]]>" among them.
        m_xml.writeCDATA(LineEnd + HexDump::Lines(data, 0, LineEnd));
        m_xml.writeEndElement();
        NewLine();
    }

    static QString PlatformName(CDevice &device)
    {
        if (CPlatformFile *handle = device.GetHandle())
            return handle->GetName();
        std::uint8_t source = 0;
        std::uint16_t number = 0;
        QStringList files;
        if (device.GetImageIdentity(source, number, files) && !files.isEmpty())
            return files.first();
        return device.GetDescriptor().kernelName;
    }

    // "80h" and up for a physical disk that is not an image; empty otherwise.
    static QString BiosName(CDevice &device)
    {
        const DeviceInfo &info = device.GetDescriptor();
        if (info.source != EnumSource::PhysicalDrive || info.sub != 0 || device.GetRaidIdentity())
            return QString();
        const unsigned bios = 0x80u + info.number;
        if (bios > 0xFF)
            return QString();
        return QStringLiteral("%1h").arg(bios, 2, 16, QLatin1Char('0'));
    }

    void NewLine() { m_xml.writeCharacters(LineEnd); }
    void Open(const char *name)
    {
        m_xml.writeStartElement(QLatin1String(name));
        NewLine();
    }
    void Close()
    {
        m_xml.writeEndElement();
        NewLine();
    }
    void Text(const QString &text) { m_xml.writeCharacters(XmlSafe(text)); }
    void Element(const char *name, const QString &value)
    {
        m_xml.writeTextElement(QLatin1String(name), XmlSafe(value));
        NewLine();
    }
    void Number(const char *name, std::uint64_t value) { Element(name, QString::number(value)); }
    void Bool(const char *name, bool value)
    {
        Element(name, value ? QStringLiteral("1") : QStringLiteral("0"));
    }
    void NativeCount(const char *name, std::uint64_t value)
    {
        Element(name, value ? QString::number(value) : QStringLiteral("Not supported"));
    }

    QXmlStreamWriter m_xml;
};

} // namespace

QString SizeText(std::uint64_t bytes)
{
    static const char *const Units[] = {"KB", "MB", "GB", "TB", "PB", "EB"};
    if (bytes < 1024)
        return QStringLiteral("%1 B").arg(bytes);
    double value = static_cast<double>(bytes);
    int unit = -1;
    while (value >= 1024.0 && unit < 5) {
        value /= 1024.0;
        ++unit;
    }
    return QStringLiteral("%1 %2").arg(QLocale::c().toString(value, 'f', 2), QLatin1String(Units[unit]));
}

QByteArray Build(const QList<CDevice *> &devices, const Header &header)
{
    QByteArray document;
    QBuffer buffer(&document);
    buffer.open(QIODevice::WriteOnly);
    ReportWriter writer(&buffer);
    writer.Start(header);
    for (CDevice *device : devices)
        if (device)
            writer.Device(*device);
    writer.Finish(header.logLines);
    buffer.close();
    if (writer.Failed())
        return QByteArray();
    // The writer ends the document with a bare line feed of its own after the last CR LF.
    if (document.endsWith("\r\n\n"))
        document.chop(1);
    return document;
}

bool WriteDocument(cRoot *owner, const QString &target, const QByteArray &document, std::uint32_t &error)
{
    error = SystemError::Success;
    if (document.isEmpty()) {
        error = SystemError::InvalidParameter;
        return false;
    }
    CPlatformFile file(owner, target, PlatformKind::File);
    if (!file.Create()) {
        error = file.GetError() ? file.GetError() : SystemError::GenFailure;
        return false;
    }
    constexpr std::uint64_t Chunk = 1u << 20;
    const std::uint64_t total = static_cast<std::uint64_t>(document.size());
    bool ok = true;
    for (std::uint64_t pos = 0; ok && pos < total; pos += Chunk) {
        const auto n = static_cast<std::uint32_t>(std::min(Chunk, total - pos));
        ok = file.Write(pos, n, document.constData() + pos);
    }
    if (ok)
        ok = file.Resize(total);
    std::uint32_t flushError = 0;
    if (ok)
        ok = file.Flush(flushError);
    if (ok) {
        ok = file.Close(false);
        if (!ok)
            error = file.GetError() ? file.GetError() : SystemError::WriteFault;
        return ok;
    }
    // No partial report stays behind.
    error = file.GetError() ? file.GetError() : SystemError::WriteFault;
    file.Close(true);
    return false;
}

bool Write(CRoot &root, const QString &target, const QString &stylesheet, const QString &application,
           const QStringList &logLines, std::uint32_t &error)
{
    Header header;
    header.application = application;
    header.platform = root.PlatformText();
    if (header.platform.isEmpty())
        header.platform = QSysInfo::prettyProductName();
    header.stylesheet = stylesheet;
    header.created = QDateTime::currentDateTime();
    header.logLines = logLines;
    return WriteDocument(&root, target, Build(root.Devices(), header), error);
}

} // namespace HardwareInfo
