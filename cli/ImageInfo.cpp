// brindle-cli image info: what an image file holds, identified from its content.
#include "cli/Image.h"

#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>

#include "Kernel/Implementation/Images/ImageHandleTarvo.h"
#include "Kernel/Implementation/Root/ImageOpen.h"

namespace Cli {

int runImageInfo(const QStringList &args, Io &io)
{
    QString file;
    bool json = false;
    for (const QString &a : args) {
        if (a == QLatin1String("--json")) {
            json = true;
        } else if (a.startsWith(QLatin1String("--")) || !file.isEmpty()) {
            io.err << "brindle-cli image info: unexpected argument '" << a << "'\n"
                   << "usage: brindle-cli image info FILE [--json]\n";
            return Usage;
        } else {
            file = a;
        }
    }
    if (file.isEmpty()) {
        io.err << "usage: brindle-cli image info FILE [--json]\n";
        return Usage;
    }
    QString problem;
    std::unique_ptr<CImageHandle> handle = ImageOpen::CreateHandle(nullptr, file, problem);
    if (!handle) {
        io.err << "brindle-cli image info: " << problem << "\n";
        return Failed;
    }
    const auto *own = dynamic_cast<const CImageHandle_Tarvo *>(handle.get());
    const QString format = ImageKindName(handle->GetKind());
    const std::uint64_t size = handle->GetTotalSectors() << handle->GetSectorShift();
    if (json) {
        QJsonObject o;
        o["format"] = format;
        o["kind"] = int(handle->GetKind());
        o["sectorSize"] = qint64(handle->GetBytesPerSector());
        o["totalSectors"] = qint64(handle->GetTotalSectors());
        o["size"] = qint64(size);
        o["writable"] = handle->IsWritable();
        o["files"] = QJsonArray::fromStringList(handle->GetFileNames());
        if (own) {
            o["description"] = own->GetString(0);
            o["sourceModel"] = own->GetString(1);
            o["sourceIdentity"] = own->GetString(2);
            o["sourceSerial"] = own->GetString(3);
            o["sectorsPerBlock"] = qint64(own->GetHeader().sectorsPerBlock);
            o["firstSector"] = qint64(own->GetHeader().firstSector);
            o["created"] = qint64(own->GetHeader().created);
        }
        io.out << QJsonDocument(o).toJson(QJsonDocument::Indented);
        return Ok;
    }
    io.out << "Format: " << format << "\n"
           << "Sector size: " << handle->GetBytesPerSector() << "\n"
           << "Total sectors: " << handle->GetTotalSectors() << "\n"
           << "Size: " << size << " bytes\n"
           << "Writable: " << (handle->IsWritable() ? "yes" : "no") << "\n";
    const QStringList files = handle->GetFileNames();
    for (int i = 0; i < files.size(); ++i)
        io.out << (i == 0 ? "Files: " : "       ") << files[i] << "\n";
    if (own) {
        io.out << "Description: " << own->GetString(0) << "\n"
               << "Source model: " << own->GetString(1) << "\n"
               << "Source serial: " << own->GetString(3) << "\n"
               << "Sectors per block: " << own->GetHeader().sectorsPerBlock << "\n";
    }
    return Ok;
}

} // namespace Cli
