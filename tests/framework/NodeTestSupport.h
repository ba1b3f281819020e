// Disk images and small kernel objects for the node tree tests: MBR and GPT images made with
// sfdisk/sgdisk with FAT and ext2 file systems copied into their partitions, opened as image
// devices of a kernel root; a volume in memory with a folder tree of entries.
#pragma once

#include "tests/common/TestUtil.h"

#include "ClientFramework/Commands/Commander.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/FS/Entry.h"
#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/Images/ImageMemorySource.h"
#include "Kernel/Implementation/Root/ImageOpen.h"
#include "Kernel/Implementation/Root/Root.h"

#include <QAction>
#include <QByteArray>
#include <QDir>
#include <QFile>
#include <QStringList>
#include <QTemporaryDir>

#include <cstring>
#include <memory>

namespace NodeTest {

// Writes `fs` into `disk` at byte offset `at`.
inline bool copyInto(const QString &disk, const QString &fs, qint64 at)
{
    QFile in(fs);
    QFile out(disk);
    if (!in.open(QIODevice::ReadOnly) || !out.open(QIODevice::ReadWrite))
        return false;
    const QByteArray bytes = in.readAll();
    return out.seek(at) && out.write(bytes) == bytes.size();
}

inline bool makeSparse(const QString &path, qint64 size)
{
    QFile f(path);
    return f.open(QIODevice::WriteOnly | QIODevice::Truncate) && f.resize(size);
}

inline bool haveImageTools()
{
    return TestUtil::haveTool("sfdisk") && TestUtil::haveTool("sgdisk") && TestUtil::haveTool("mkfs.vfat") &&
           TestUtil::haveTool("mke2fs");
}

// A FAT file system of `kib` KiB with the label.
inline QString makeFat(const QDir &dir, const QString &name, int kib, const QString &label)
{
    const QString path = dir.filePath(name);
    QFile::remove(path);
    if (TestUtil::run("mkfs.vfat", {"-C", "-n", label, "-i", "1234ABCD", path, QString::number(kib)})
            .exitCode != 0)
        return QString();
    return path;
}

inline QString makeExt2(const QDir &dir, const QString &name, int kib, const QString &label)
{
    const QString path = dir.filePath(name);
    if (!makeSparse(path, qint64(kib) * 1024))
        return QString();
    if (TestUtil::run("mke2fs", {"-q", "-F", "-t", "ext2", "-L", label, path}).exitCode != 0)
        return QString();
    return path;
}

// 64 MiB, MBR: FAT16 primary at 2048 (16384 sectors), an extended partition at 20480 (40960
// sectors) holding one ext2 logical partition at 22528 (16384 sectors), the rest unallocated.
inline QString makeMbrImage(const QDir &dir, const QString &name = "mbr.img")
{
    const QString path = dir.filePath(name);
    if (!makeSparse(path, 64ll << 20))
        return QString();
    QFile script(dir.filePath(name + ".sfdisk"));
    script.open(QIODevice::WriteOnly | QIODevice::Truncate);
    script.write("label: dos\nstart=2048, size=16384, type=6, bootable\nstart=20480, size=40960, type=5\n"
                 "start=22528, size=16384, type=83\n");
    script.close();
    TestUtil::ToolResult r =
        TestUtil::run("sh", {"-c", QString("sfdisk -q '%1' < '%2'").arg(path, script.fileName())});
    if (r.exitCode != 0)
        return QString();
    const QString fat = makeFat(dir, name + ".fat", 8192, "NODEFAT");
    const QString ext = makeExt2(dir, name + ".ext", 8192, "nodeext");
    if (fat.isEmpty() || ext.isEmpty() || !copyInto(path, fat, 2048ll * 512) ||
        !copyInto(path, ext, 22528ll * 512))
        return QString();
    return path;
}

// 32 MiB, GPT: one named FAT16 partition at 2048 (16384 sectors).
inline QString makeGptImage(const QDir &dir, const QString &name = "gpt.img")
{
    const QString path = dir.filePath(name);
    if (!makeSparse(path, 32ll << 20))
        return QString();
    if (TestUtil::run("sgdisk", {"-n", "1:2048:+8M", "-t", "1:0700", "-c", "1:NodeData", path}).exitCode != 0)
        return QString();
    const QString fat = makeFat(dir, name + ".fat", 8192, "GPTFAT");
    if (fat.isEmpty() || !copyInto(path, fat, 2048ll * 512))
        return QString();
    return path;
}

// A whole-device FAT16 file system without a table.
inline QString makeBareFat(const QDir &dir, const QString &name = "bare.img")
{
    return makeFat(dir, name, 8192, "BAREFAT");
}

inline CDevice *open(CRoot &root, const QString &path)
{
    QString problem;
    return ImageOpen::OpenImage(&root, path, problem);
}

// A registry with the framework's commands and the node commands used by the menus.
inline void registerNodeCommands(Core::Commander &commander, const QStringList &ids)
{
    for (const QString &id : ids) {
        Core::CommandRecord r;
        r.id = id;
        r.text = id;
        commander.registerCommand(r);
    }
    // Commands without a handler start disabled in the registry; the menus follow the registry.
    for (const QString &id :
         ids + QStringList{"cmdHddInfo", "cmdLogSave", "cmdRefresh", "cmdProperties", "cmdNode_Browse",
                           "cmdDI_Verify", "cmdDI_Create", "cmdRemove", "cmdSmartInfo", "cmdOpenInOSBrowser",
                           "cmdPreview", "cmdNode_Stop", "cmdNode_StopAll"})
        if (QAction *a = commander.action(id))
            a->setEnabled(true);
}

// Zeroed bytes in memory as a read-only partition.
class MemoryStorage : public CImageMemorySource
{
public:
    explicit MemoryStorage(std::uint64_t sectors)
        : CImageMemorySource(QByteArray(qsizetype(sectors * 512), '\0'))
    {
    }
    StorageKind GetStorageKind() const override { return StorageKind::Partition; }
};

// A ready volume in memory whose root holds `folders` folders of `filesEach` files (the first
// file of every folder is empty, the others 1000 bytes), optionally with file-table copies.
class TreeVolume : public CVolume
{
public:
    TreeVolume(cStorage *medium, int folders, int filesEach, std::uint8_t copies = 0)
        : CVolume(medium, description(medium), nullptr), m_copies(copies)
    {
        m_kind = static_cast<std::uint32_t>(FileSystemKind::Fat);
        m_label = QStringLiteral("TREE");
        auto root = std::make_unique<CEntry>(this, nullptr, QString(), 0, CEntry::AttrFolder, 0);
        std::uint64_t index = 1;
        for (int f = 0; f < folders; ++f) {
            auto folder = std::make_unique<CEntry>(this, root.get(), QStringLiteral("dir%1").arg(f),
                                                   index * 32, CEntry::AttrFolder, index);
            ++index;
            for (int i = 0; i < filesEach; ++i) {
                auto file = std::make_unique<CEntry>(this, folder.get(), QStringLiteral("file%1.bin").arg(i),
                                                     index * 32, 0x20, index);
                file->SetSize(i == 0 ? 0 : 1000);
                ++index;
                folder->AddChild(std::move(file));
            }
            root->AddChild(std::move(folder));
        }
        auto top =
            std::make_unique<CEntry>(this, root.get(), QStringLiteral("empty.txt"), index * 32, 0x20, index);
        top->SetSize(0);
        root->AddChild(std::move(top));
        SetRootEntry(std::move(root));
    }

    bool SelectFileTableCopy(std::uint8_t index, std::uint8_t &count, std::uint8_t &current) override
    {
        count = m_copies;
        current = m_current;
        if (index < m_copies)
            m_current = index;
        return m_copies > 0;
    }

private:
    static VolumeDescription description(cStorage *medium)
    {
        VolumeDescription d;
        d.size = medium->GetSize();
        d.ready = 1;
        d.name = QStringLiteral("memvol");
        return d;
    }
    std::uint8_t m_copies = 0;
    std::uint8_t m_current = 1;
};

} // namespace NodeTest
